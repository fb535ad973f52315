// Meteorological tracks: what a raw file says about its meteorological sensors and their
// samples, one track per raw file. This is the filling side, called by the scan; the engine
// reads the tracks through the meteo stream.
//
// Threads: tracks are filled on the job thread before any engine runs and are read-only
// afterwards; nothing here locks.
#pragma once

#include <cstdint>

#include "base/list.h"
#include "base/node_pool.h"
#include "raw/raw_records.h"
#include "vox/vox_sdk_meteo.h"

namespace vox {

struct MeteoSensorDescription {
  uint16_t selector = 0;
  float value = 0;
  char name1[21] = {};
  char name2[21] = {};
};

struct MeteoSensorPosition {
  uint16_t flags = 0;  // bits 0-2 select sensors; bit 6 X, Y, Z set; bit 7 height set
  double x = 0, y = 0, z = 0;
  double height = 0;
};

// One sample node: the next link and the sample (32 bytes with padding).
struct MeteoSampleNode {
  MeteoSampleNode* next;
  vox_MeteoData data;
};

enum MeteoSensor { kPressureSensor = 0, kTemperatureSensor = 1, kHumiditySensor = 2 };

struct TMeteoTrack : Link<TMeteoTrack> {
  explicit TMeteoTrack(uint32_t file) : file_id(file) {}

  // Tag 15: the description goes to every sensor the selector names.
  void SetSensor(const MeteoSensorRecord& r);
  // Tag 16: a position without a height gets the ellipsoidal height of X, Y, Z; the position
  // goes to every sensor the flags name.
  void SetPosition(const MeteoPositionRecord& r);
  // Tag 17: appended in file order with the pressure sensor's height (0 when it has none).
  // Returns false when no memory was left (the sample is dropped).
  bool Append(const MeteoSampleRecord& r);

  uint32_t file_id;
  MeteoSensorDescription sensors[3];
  MeteoSensorPosition positions[3];
  MeteoSampleNode* first = nullptr;
  MeteoSampleNode* last = nullptr;
  NodePool pool;
  uint32_t sample_count = 0;
};

using MeteoTrackList = ItemList<TMeteoTrack>;

// The track of a file, created and appended on first use; null when it cannot be allocated.
TMeteoTrack* TrackForFile(MeteoTrackList& tracks, uint32_t file_id);

}  // namespace vox
