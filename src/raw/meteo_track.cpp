#include "raw/meteo_track.h"

#include <cstring>
#include <new>

#include "base/ellipsoid.h"

namespace vox {

static_assert(sizeof(MeteoSampleNode) == 32);

void TMeteoTrack::SetSensor(const MeteoSensorRecord& r) {
  MeteoSensorDescription d;
  d.selector = r.selector;
  d.value = r.value;
  std::memcpy(d.name1, r.name1, sizeof d.name1);
  std::memcpy(d.name2, r.name2, sizeof d.name2);
  for (int i = 0; i < 3; ++i)
    if (r.selector & (1u << i)) sensors[i] = d;
}

void TMeteoTrack::SetPosition(const MeteoPositionRecord& r) {
  MeteoSensorPosition p{r.flags, r.x, r.y, r.z, r.height};
  if ((p.flags & MeteoPositionRecord::kXyzBit) && !(p.flags & MeteoPositionRecord::kHeightBit)) {
    p.height = CartesianToGeodetic(GpsEllipsoid(), Cartesian{p.x, p.y, p.z}).height;
    p.flags |= MeteoPositionRecord::kHeightBit;
  }
  for (int i = 0; i < 3; ++i)
    if (p.flags & (1u << i)) positions[i] = p;
}

bool TMeteoTrack::Append(const MeteoSampleRecord& r) {
  void* memory = pool.Allocate(sizeof(MeteoSampleNode));
  if (memory == nullptr) return false;
  auto* node = new (memory) MeteoSampleNode{};
  const TimeMs t = ToTimeMs(r.time);
  const MeteoSensorPosition& pressure = positions[kPressureSensor];
  node->data.seconds = t.seconds;
  node->data.ms = t.ms;
  node->data.pressure = r.pressure;
  node->data.temperature = r.temperature;
  node->data.humidity = r.humidity;
  node->data.height = (pressure.flags & MeteoPositionRecord::kHeightBit)
                          ? static_cast<float>(pressure.height)
                          : 0.0f;
  if (last == nullptr)
    first = node;
  else
    last->next = node;
  last = node;
  ++sample_count;
  return true;
}

TMeteoTrack* TrackForFile(MeteoTrackList& tracks, uint32_t file_id) {
  for (TMeteoTrack& t : tracks)
    if (t.file_id == file_id) return &t;
  return tracks.Append(new (std::nothrow) TMeteoTrack(file_id));
}

}  // namespace vox
