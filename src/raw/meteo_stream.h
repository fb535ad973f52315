// The query side of the meteorological tracks: a cursor over one raw file's samples that
// answers "what were pressure, temperature, humidity and sensor height at time t" by linear
// interpolation between the samples around t.
//
// The cursor remembers where the last answer was found, so rising query times walk the
// sample list once; a time earlier than the cursor's place starts over from the first
// sample.
//
// Threads: a cursor belongs to one engine thread between open and close; the tracks are
// complete before engines run and are only read here, so nothing locks.
#pragma once

#include <cstdint>
#include <memory>

#include "base/time_ms.h"
#include "raw/meteo_track.h"
#include "vox/vox_sdk_meteo.h"

namespace vox {

struct MeteoCursor {
  const TMeteoTrack* track = nullptr;
  const MeteoSampleNode* previous = nullptr;
  const MeteoSampleNode* current = nullptr;
  uint32_t file_id = 0;
};

// A cursor at the first sample of the track of file_id; null when no such track exists.
// Never creates a track.
std::unique_ptr<MeteoCursor> OpenMeteoCursor(const MeteoTrackList& tracks, uint32_t file_id);

// The values at t. False, with only out's time set, when the track has no samples. Before
// the first and after the last sample the nearest sample is copied whole, its own time
// included.
bool QueryMeteo(MeteoCursor& cursor, const TimeMs& t, vox_MeteoData& out);

// The sample between a and b at t (a's time <= t <= b's time), in the precision engines
// have always received: differences in 32-bit floats, the weighted sum in 64-bit.
void InterpolateMeteo(const vox_MeteoData& a, const vox_MeteoData& b, const TimeMs& t,
                      vox_MeteoData& out);

}  // namespace vox
