// A writer of raw observation files for tests, tools and benchmarks: builds every record kind
// from plain values in either byte order, and can build deliberately damaged records (wrong
// lengths, cut files, over-long records) to exercise readers.
//
// Records are assembled in memory; Save() writes the bytes to a file. Not thread-safe: one
// writer per thread.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace voxtools {

enum class RawOrder { kLittle, kBig };

struct RawStamp {
  uint32_t ms_of_day = 0;
  uint32_t day = 0;
};

// One signal block of an epoch record. The "more blocks follow" bit (7) is set by the writer;
// the presence bits in flags decide which values are written.
struct RawSignal {
  uint16_t flags = 0;
  uint8_t byte_a = 0, byte_b = 0;  // tag 8: flag bits 5, 6
  int16_t i16 = 0;                 // tag 51: flag bit 15
  uint16_t u16 = 0;                // tag 51: flag bit 14
  double code = 0, phase = 0;      // flag bits 8, 9
  float f32a = 0, correction = 0;  // flag bits 10, 11

  // Tag 51: signal code s with a code and/or a phase value.
  static RawSignal Tag51(uint8_t signal_code, std::optional<double> code,
                         std::optional<double> phase);
  // Tag 8: signal kind k (0-3) with a code and/or a phase value.
  static RawSignal Tag8(unsigned kind, std::optional<double> code, std::optional<double> phase);
};

struct RawSatellite {
  uint16_t code = 0;  // one-byte (tag 8) or two-byte (tag 51) satellite code
  uint8_t b2 = 0, b3 = 0;
  std::vector<RawSignal> signals;
};

// Satellite codes from system letter and number ('G', 'R', 'S', 'E', 'C'); GPS 33-37 go to
// group 3.
uint16_t SatCode51(char system, unsigned number);
uint8_t SatCode8(char system, unsigned number);

struct RawGpsEphemeris {  // tags 13 and 45; tag 49 with c-fields mapped the same way
  uint8_t number = 1;
  RawStamp time;
  uint32_t g1 = 0, g2 = 0;
  float g3_g7[5] = {};
  double g8 = 0, g9 = 0, g10 = 0;
  float g11_g16[6] = {};
  double g17 = 0, g18 = 0;
  float g19 = 0;
  double g20 = 0;
  float g21 = 0;
  uint8_t g22 = 0;
  uint8_t g23 = 0;
  uint16_t g24 = 0;
  uint8_t g25 = 0;
};

struct RawBdsEphemeris {
  uint8_t number = 1;
  RawStamp time;
  uint32_t c1 = 0, c2 = 0;
  float c3_c7[5] = {};
  double c8 = 0, c9 = 0, c10 = 0;
  float c11_c16[6] = {};
  double c17 = 0, c18 = 0;
  float c19 = 0;
  double c20 = 0;
  float c21 = 0;
  uint8_t c22 = 0, c23 = 0, c24 = 0, c25 = 0;
};

struct RawGlonassEphemeris {
  uint8_t slot = 1;
  RawStamp time;
  float r1 = 0, r2 = 0;
  double position[3] = {};  // km
  float velocity[3] = {};
  float acceleration[3] = {};
  uint8_t r3 = 0, r4 = 0;
};

struct RawSbasEphemeris {
  uint8_t number = 20;
  RawStamp time;
  uint8_t s1 = 0, s2 = 0;
  uint32_t reference_seconds = 0;
  double s3_s5[3] = {};
  float s6_s13[8] = {};
};

struct RawGalileoEphemeris {
  uint8_t number = 1;
  RawStamp time;
  uint32_t e1 = 0, e2 = 0;
  float e3_e6[4] = {};
  double e7_e10[4] = {};
  float e11_e17[7] = {};
  double e18 = 0, e19 = 0;
  float e20 = 0;
  double e21 = 0;
  float e22 = 0;
  uint16_t e23 = 0;
  uint8_t e24 = 0, e25 = 0;
};

struct RawSatPosition {
  uint16_t code = 0;  // one-byte code for tag 23, two-byte for tag 56
  RawStamp time;
  double position[3] = {};  // km
  double clock_us = 0;
};

struct RawMeteoSample {
  RawStamp time;
  std::optional<float> pressure, temperature, humidity, unused;
};

class RawWriter {
 public:
  explicit RawWriter(RawOrder order = RawOrder::kLittle) : order_(order) {}

  // ---- generic building: Begin a record, add fields, End it (the length is filled in).
  RawWriter& Begin(uint8_t tag);
  RawWriter& U8(uint8_t v);
  RawWriter& U16(uint16_t v);
  RawWriter& I16(int16_t v);
  RawWriter& U32(uint32_t v);
  RawWriter& F32(float v);
  RawWriter& F64(double v);
  RawWriter& Stamp(RawStamp t);
  RawWriter& Str(const std::string& s);  // length byte + characters (at most 255)
  RawWriter& Zeros(size_t n);
  // Ends the record with its true length, or with a forced length value.
  RawWriter& End(std::optional<uint16_t> forced_length = std::nullopt, uint16_t check = 0);
  // Appends raw bytes as they are (for damaged files).
  RawWriter& Bytes(const std::vector<uint8_t>& bytes);

  // ---- records
  RawWriter& Header(char type = 'O', uint16_t version = 0, bool bad_signature = false);
  RawWriter& Receiver(const std::string& s1, const std::string& s2, const std::string& s3,
                      const std::string& s4, const std::string& s5);
  RawWriter& TimeRef(const char* system, RawStamp time, std::optional<uint32_t> field_a = {},
                     std::optional<uint32_t> leap_seconds = {});
  // Tag 8 or 51; extra is the optional 8-byte value after the header.
  RawWriter& Epoch(uint8_t tag, uint32_t ms_of_day, const std::vector<RawSatellite>& sats,
                   std::optional<double> extra = {}, std::optional<uint8_t> sat_count = {});
  RawWriter& GpsEphemeris(const RawGpsEphemeris& e, uint8_t tag = 13);
  RawWriter& BdsEphemeris(const RawBdsEphemeris& e);
  RawWriter& GlonassEphemeris(const RawGlonassEphemeris& e);
  RawWriter& SbasEphemeris(const RawSbasEphemeris& e);
  RawWriter& GalileoEphemeris(const RawGalileoEphemeris& e);
  RawWriter& SatPosition(const RawSatPosition& p, uint8_t tag = 56);
  RawWriter& MeteoSensor(uint16_t selector, float value, const std::string& name1,
                         const std::string& name2);
  RawWriter& MeteoPosition(uint16_t selector, std::optional<std::vector<double>> xyz,
                           std::optional<double> height);
  RawWriter& MeteoSample(const RawMeteoSample& s);
  // Tag 0 and its two length bytes; without them when cut is true.
  RawWriter& EndOfData(bool cut = false);

  const std::vector<uint8_t>& bytes() const { return bytes_; }
  size_t size() const { return bytes_.size(); }
  // Offset at which the next record will start.
  size_t offset() const { return bytes_.size(); }
  bool Save(const std::string& path) const;

 private:
  template <typename T>
  void Put(T v);
  void Put16At(size_t at, uint16_t v);

  RawOrder order_;
  std::vector<uint8_t> bytes_;
  size_t record_start_ = 0;
};

}  // namespace voxtools
