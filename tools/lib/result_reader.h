// Reads result files (and the temporary files of engine threads) record by record and decodes
// every record kind into a plain struct. A file that is cut short or corrupt is read up to the
// fault; the fault says where it is and what was expected there.
//
// Independent of the library: it reads the file format only, so that tests and tools can
// check what the library wrote against the format rather than against its own code.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <variant>
#include <vector>

namespace vox::tools {

// A time as records store it.
struct RecTime {
  uint32_t ms_of_day = 0;
  uint32_t day = 0;  // days since 1980-01-06
  double gps_seconds() const { return day * 86400.0 + ms_of_day / 1000.0; }
};
// "YYYY-MM-DD hh:mm:ss.mmm" (GPS time scale).
std::string CalendarText(const RecTime& t);

struct EndRec {};
struct HeaderRec {
  std::string magic;  // "$YRB"
  uint32_t format = 0;
  uint16_t reserved = 0;
};
struct MessageRec {
  uint32_t type = 0;
  uint32_t depth = 0;
  std::string text;
};
struct SolutionStartRec {
  uint32_t type = 0;
  uint32_t flags = 0;
};
struct SpanFields {
  RecTime start, end;
  uint32_t value1 = 0, value2 = 0;
  float value = 0;
  std::string name;
};
struct VectorRec {  // kinds 33 and 40
  uint32_t number = 0;
  uint32_t flags = 0;
  double base[3] = {};
  uint32_t values_32[4] = {};
  float value_48 = 0, value_52 = 0;
  double baseline[3] = {};
  uint32_t values_80[4] = {};
  float value_96 = 0, value_100 = 0;
  bool has_span = false;
  uint32_t from_point = 0, to_point = 0;
  SpanFields span;
  bool has_extra = false;
  uint32_t extra_marker = 0;
  float extra = 0;
};
struct OccupationRec {  // kind 34
  uint32_t occupation = 0, point = 0, antenna = 0;
  RecTime first, last;
  uint32_t epochs = 0;
  float l1_offsets[3] = {};
  float l2_offsets[3] = {};
  double nav[3] = {};
  float nav_sigma[6] = {};
  std::string point_name, receiver, antenna_name;
};
struct FanRec {  // kinds 35 and 41
  uint32_t number = 0;
  uint32_t flags = 0;
  double position[3] = {};
  bool has_span = false;
  uint32_t fan_id = 0;
  SpanFields span;
};
struct RayRec {  // kind 36
  uint32_t fan = 0;
  uint32_t flags = 0;
  RecTime time;
  double offset[3] = {};
  uint32_t values[3] = {};
  float hdop = 0;
  uint32_t satellites = 0;
};
struct PlotLineRec {  // kinds 4 (v100) and 53 (v101)
  bool v101 = false;
  uint16_t stream_id = 0;  // v101 only
  uint16_t flags = 0;      // v101 only
  uint16_t sat_a = 0, sat_b = 0;
  uint16_t index = 0;
  uint8_t value = 0;  // v100 only (3)
  std::string name;
};
struct PlotValue {
  uint16_t index = 0;            // v101: the line index
  uint16_t flags = 0;            // v100: the line's flags
  uint8_t sat_a = 0, sat_b = 0;  // v100
  float value = 0;
};
struct PlotEpochRec {  // kinds 37 (v100) and 54 (v101)
  bool v101 = false;
  RecTime time;
  uint16_t stream_id = 0;
  std::vector<PlotValue> values;
};
struct SatelliteRec {  // kinds 38, 39, 52, 55
  uint16_t flags = 0;
  uint16_t plot_counter = 0;
  uint16_t code_a = 0, code_b = 0;
  bool timed = false;  // kinds 39 and 52
  RecTime time1, time2;
  uint32_t value = 0;
  float value_f = 0;
  uint32_t values[4] = {};  // kinds 38 and 55 use the first three
};
struct UnknownRec {
  std::vector<uint8_t> payload;
};

using RecordBody =
    std::variant<EndRec, HeaderRec, MessageRec, SolutionStartRec, VectorRec, OccupationRec, FanRec,
                 RayRec, PlotLineRec, PlotEpochRec, SatelliteRec, UnknownRec>;

struct Record {
  uint64_t offset = 0;  // of the kind byte
  uint8_t kind = 0;
  uint16_t length = 0;  // the whole record
  RecordBody body;
};

struct ReadFault {
  uint64_t offset = 0;  // where the bad data begins
  std::string what;     // what was expected there, and what was found
};

struct ReadResult {
  std::vector<Record> records;  // everything before the fault
  std::optional<ReadFault> fault;
};

// The short name of a record kind ("vector", "plot-epoch", ...); "kind-N" when unknown.
std::string KindName(uint8_t kind);

// Decodes a whole file's bytes.
ReadResult ReadResultBytes(std::span<const uint8_t> bytes);
// Reads and decodes a file; a file that cannot be read is a fault at offset 0.
ReadResult ReadResultFile(const std::string& path);

}  // namespace vox::tools
