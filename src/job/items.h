// The items of a job: raw files, points, antennas, receivers, occupations, vectors and fans.
// The task owns one list of each; items refer to each other by plain pointers that they do
// not own, and carry the identifiers that engines see.
//
// Items are built by the parser on the job thread, and their scan fields are filled by data
// preparation, before any engine runs. While engines run, only the navigation coordinates,
// navigation means and solved positions change, under the task's solution lock; everything
// else is read-only then.
#pragma once

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>

#include "base/list.h"
#include "base/time_ms.h"

namespace vox {

// Type tags of item identifiers.
constexpr uint32_t kPointTag = 0x01000000;
constexpr uint32_t kOccupTag = 0x02000000;
constexpr uint32_t kFileTag = 0x04000000;
constexpr uint32_t kVectorTag = 0x08000000;
constexpr uint32_t kFanTag = 0x10000000;
constexpr uint32_t kAntennaTag = 0x80000000;  // antennas and receivers alike
constexpr uint32_t kReceiverTag = 0x80000000;

// An engine's parameter block: a byte block whose first u16 is its meaningful size and whose
// second u16 is its allocated size (both counting the 4-byte header); the rest belongs to the
// engine. The block is handed to the engine by address, so it never moves.
class ParamBlock {
 public:
  // A zero-filled block of `size` bytes with its header set to (0, size).
  static std::unique_ptr<ParamBlock> Create(uint16_t size);
  // A copy of as many bytes as the source's allocated size says.
  std::unique_ptr<ParamBlock> Copy() const;

  uint8_t* data() { return bytes_.get(); }
  const uint8_t* data() const { return bytes_.get(); }
  uint16_t allocated() const;

 private:
  explicit ParamBlock(size_t size) : bytes_(new uint8_t[size < 4 ? 4 : size]()), size_(size) {}
  std::unique_ptr<uint8_t[]> bytes_;
  size_t size_;
};

struct TOccupItem;

// A reference to an occupation, not owned.
struct TROccupItem : Link<TROccupItem> {
  explicit TROccupItem(TOccupItem* o) : occupation(o) {}
  TOccupItem* occupation;
};

struct TStrItem : Link<TStrItem> {
  explicit TStrItem(std::string s) : text(std::move(s)) {}
  std::string text;
};

// One raw observation file (or precise orbit file) of the job.
struct TChainItem : Link<TChainItem> {
  TChainItem(uint32_t number, std::string path, bool temporary, bool smooth);

  uint32_t id;             // kFileTag + section number
  std::string file_name;   // the path's part after its last '\' or '/'
  std::string receiver_text;
  std::string path;
  uint32_t epoch_interval_ms = 0;
  uint32_t max_satellites = 0;
  uint32_t epoch_count = 0;
  TimeMs first_epoch{0, 0};
  TimeMs last_epoch{0, 0};
  uint32_t signal_masks[5] = {};     // per system: GPS, GLONASS, BDS, GALILEO, SBAS
  uint8_t force_copy[6][5] = {};     // six rule groups, one byte per system
  ItemList<TROccupItem> occupations;  // occupations recorded in this file, in section order
  uint32_t c2_usable_mask = 0;
  uint32_t c2_agreeing_mask = 0;
  double c2_l2_offset = 0.0;
  bool temporary;
  bool smooth;
};

// Weighted navigation mean or stored navigation coordinates: position, standard deviations
// and correlations XY, XZ, YZ.
struct NavCoord {
  double x = 0, y = 0, z = 0;
  float sx = 0, sy = 0, sz = 0;
  float rxy = 0, rxz = 0, ryz = 0;
};

// One surveyed point (site).
struct TPointItem : Link<TPointItem> {
  explicit TPointItem(uint32_t number);
  // The re-occupation copy of `other` under a new point number.
  TPointItem(uint32_t number, const TPointItem& other);

  uint32_t id;       // kPointTag + point number
  uint32_t base_id;  // identifier used to match occupations to vector and fan end points
  std::string name;
  double x = 0, y = 0, z = 0;
  float rms = 0;
  int32_t type = -1;  // -1: no known coordinates
  ItemList<TROccupItem> occupations;
  NavCoord nav_mean;
  double solved_x = 0, solved_y = 0, solved_z = 0;
  float solved_rms = 0;
  bool nav_mean_set = false;
  bool solved_set = false;
};

constexpr int kPatternSlots = 16;
constexpr int kPatternValues = 19;

struct TAntennItem : Link<TAntennItem> {
  explicit TAntennItem(uint32_t number) : id(kAntennaTag + number) {}
  uint32_t id;
  uint32_t type_word = 0;
  uint32_t pattern_mask = 0;  // bit k: slot k holds an accepted pattern
  std::string name;
  double l2_east = 0, l2_north = 0, l2_up = 0;
  float patterns[kPatternSlots][kPatternValues] = {};
};

struct TReceiverItem : Link<TReceiverItem> {
  explicit TReceiverItem(uint32_t number) : id(kReceiverTag + number) {}
  uint32_t id;
  std::string name, serial, vendor;
};

// One occupation: a receiver with an antenna on a point over a time span, in one raw file.
struct TOccupItem : Link<TOccupItem> {
  explicit TOccupItem(uint32_t number) : id(kOccupTag + number) {}

  // Reference setters: refuse a null target and a reference that is already set. Setting
  // the file or point also lists the occupation with it.
  bool SetAntenna(TAntennItem* a);
  bool SetReceiver(TReceiverItem* r);
  bool SetFile(TChainItem* f);
  bool SetPoint(TPointItem* p);

  uint32_t id;
  std::string name;
  uint32_t epoch_count = 0;
  uint32_t epoch_gap = 0;
  TimeMs begin{0, 0};
  TimeMs end = kOpenEnd;
  TimeMs first_epoch{0, 0};
  TimeMs last_epoch{0, 0};
  double l1_east = 0, l1_north = 0, l1_up = 0;
  float meteo_height = 0, temperature = 0, humidity = -1, pressure = 0;
  TChainItem* file = nullptr;
  TPointItem* point = nullptr;
  TAntennItem* antenna = nullptr;
  TReceiverItem* receiver = nullptr;
  uint32_t first_epoch_position = 0;   // file position of the first epoch record in the span
  uint32_t time_ref_position = 0;      // and of the time reference that governs it
  std::string nmea_path;
  NavCoord nav;
  bool nav_set = false;
};

// The span that an engine stores on a vector or fan (data kinds 6 and 7).
struct Span {
  TimeMs start{0, 0};
  TimeMs end{0, 0};
  uint32_t value1 = 0, value2 = 0;
  float value = -1.0f;  // below 0: not set
  std::string name;
};

struct TVectorItem : Link<TVectorItem> {
  TVectorItem(uint32_t number, TPointItem* first, TPointItem* second)
      : id(kVectorTag + number), first_point(first), second_point(second) {}
  uint32_t id;
  TPointItem* first_point;
  TPointItem* second_point;
  ItemList<TROccupItem> occupations;
  std::unique_ptr<ParamBlock> property;  // absent in a raw-filter-only job
  Span span;
};

struct TFanItem : Link<TFanItem> {
  TFanItem(uint32_t number, TPointItem* base, TChainItem* rover)
      : id(kFanTag + number), base_point(base), rover_file(rover) {}
  uint32_t id;
  TPointItem* base_point;
  TChainItem* rover_file;
  ItemList<TROccupItem> occupations;
  std::unique_ptr<ParamBlock> property;
  double position[3] = {0, 0, 0};  // set by the fan result
  Span span;
  std::string nmea_path;
};

}  // namespace vox
