// The records of a raw observation file, decoded into plain values (host byte order).
//
// A raw file is a header followed by tagged, length-framed records. The decoders in
// raw_decoder.h fill these structures from the record bodies; what the scan, the stores and
// the epoch stream make of them lives with those. Field names that carry a letter and a
// number (G1..G25, E1..E25, C1..C25, R1..R4, S1..S13) are values the engine interprets: we
// only move them.
#pragma once

#include <cstdint>

#include "base/time_ms.h"
#include "vox/vox_sdk_core.h"

namespace vox {

// Record tags.
enum RawTag : uint8_t {
  kTagEnd = 0,
  kTagHeader = 1,
  kTagReceiver = 2,
  kTagTimeRef = 3,
  kTagEpoch8 = 8,
  kTagGpsEphemeris = 13,
  kTagGlonassEphemeris = 14,
  kTagMeteoSensor = 15,
  kTagMeteoPosition = 16,
  kTagMeteoSample = 17,
  kTagSbasEphemeris = 21,
  kTagSatPosition23 = 23,
  kTagGpsHighEphemeris = 45,  // GPS layout, satellites 1-5 stored as GPS 33-37
  kTagGalileoEphemeris = 47,
  kTagBdsEphemeris = 49,
  kTagEpoch51 = 51,
  kTagSatPosition56 = 56,
};

// Framing: tag (1) + length (2) in front, check field (2) behind the body.
constexpr uint32_t kRecordFrame = 5;
constexpr uint32_t kRecordBufferSize = 16384;
constexpr uint32_t kHeaderReadSize = 13;

// The signature's little-endian bytes spell "$YRB".
constexpr uint32_t kRawSignature = 0x42525924u;

enum class ByteOrder : uint8_t { kLittle, kBig };

// Signal slots, named after the GPS signals.
enum SignalSlot : uint8_t { kL1C = 0, kL1P = 1, kL2C = 2, kL2P = 3, kL5X = 4, kNoSlot = 0xFF };
constexpr int kSlotCount = 5;

// SignalMask bits: code of slot s is bit s, phase of slot s is bit 5 + s.
constexpr uint32_t CodeBit(int slot) {
  return 1u << slot;
}
constexpr uint32_t PhaseBit(int slot) {
  return 1u << (5 + slot);
}
// "CodeL1C" ... "PhaseL5X" for bits 0 to 9.
const char* SignalMaskBitName(int bit);

// Signal block flag bits shared by both epoch kinds.
constexpr uint16_t kSigMore = 1u << 7;
constexpr uint16_t kSigCode = 1u << 8;
constexpr uint16_t kSigPhase = 1u << 9;
constexpr uint16_t kSigF32A = 1u << 10;
constexpr uint16_t kSigCorrection = 1u << 11;
constexpr uint16_t kSigPhaseBad = 1u << 12;
constexpr uint16_t kSigCodeBad = 1u << 13;
// Tag 8 only.
constexpr uint16_t kSig8PhaseBad = 1u << 1;
constexpr uint16_t kSig8ByteA = 1u << 5;
constexpr uint16_t kSig8ByteB = 1u << 6;
// Tag 51 only.
constexpr uint16_t kSig51I16 = 1u << 15;
constexpr uint16_t kSig51U16 = 1u << 14;

struct HeaderRecord {
  uint8_t signature[4] = {};  // as stored: "$YRB" little-endian, "BRY$" big-endian
  char type = 0;              // 'N' or 'O'
  uint8_t byte5 = 0;
  uint16_t word6 = 0;
  uint16_t version = 0;
};

// Capacities of the receiver identification strings (characters kept + 1).
struct ReceiverRecord {
  char s1[21] = {};
  char s2[41] = {};
  char s3[21] = {};
  char s4[21] = {};
  char s5[21] = {};
};

struct TimeRefRecord {
  uint32_t system_word = 0;
  RawTime time;
  bool has_field_a = false;
  uint32_t field_a = 0;
  bool has_leap = false;
  uint32_t leap_seconds = 0;

  static constexpr uint32_t kFieldABit = 1u << 26;
  static constexpr uint32_t kLeapBit = 1u << 27;
  bool IsGps() const { return (system_word & 0xFFFFFFu) == ('G' | ('P' << 8) | ('S' << 16)); }
};

struct EpochHeader {
  uint32_t ms_of_day = 0;
  uint16_t word4 = 0;
  uint8_t flags = 0;  // bit 7: an 8-byte value follows
  uint8_t sat_count = 0;
  double extra = 0.0;
};

// One satellite block of an epoch record.
struct SatBlock {
  uint16_t code = 0;  // the satellite code as stored (one or two bytes)
  SatId sat = 0;      // decoded identifier
  bool valid = false;
  uint8_t group = 0;  // the code's group (for the signal tables)
  uint8_t b2 = 0, b3 = 0;
};

// One signal block. Presence bits of values that failed their check are cleared in flags.
struct SignalBlock {
  uint16_t flags = 0;
  uint8_t byte_a = 0, byte_b = 0;  // tag 8, flag bits 5 and 6
  int16_t i16 = 0;                 // tag 51, flag bit 15
  uint16_t u16 = 0;                // tag 51, flag bit 14
  double code = 0.0;               // metres
  double phase = 0.0;
  float f32a = 0.0f;
  float correction = 0.0f;
};

// Tags 13 and 45 (GPS layout) and, with the same shape up to byte 117, tag 49 (BDS).
struct GpsEphemerisRecord {
  uint8_t number = 0;
  RawTime time;
  uint32_t g1 = 0, g2 = 0;
  float g3_g7[5] = {};
  double g8 = 0, g9 = 0, g10 = 0;
  float g11_g16[6] = {};
  double g17 = 0, g18 = 0;
  float g19 = 0;
  double g20 = 0;
  float g21 = 0;
  uint8_t g22 = 0;
  uint16_t unused118 = 0;
  uint8_t g23 = 0;
  uint16_t g24 = 0;
  uint8_t g25 = 0;
};

struct BdsEphemerisRecord {
  uint8_t number = 0;
  RawTime time;
  uint32_t c1 = 0, c2 = 0;
  float c3_c7[5] = {};
  double c8 = 0, c9 = 0, c10 = 0;
  float c11_c16[6] = {};
  double c17 = 0, c18 = 0;
  float c19 = 0;
  double c20 = 0;
  float c21 = 0;
  uint8_t c22 = 0;
  uint8_t unused118 = 0;
  uint8_t c23 = 0, c24 = 0, c25 = 0;
};

struct GlonassEphemerisRecord {
  uint8_t slot = 0;
  RawTime time;
  float r1 = 0, r2 = 0;
  double position[3] = {};     // km
  float velocity[3] = {};      // km/s
  float acceleration[3] = {};  // km/s^2
  double unused65 = 0;
  uint8_t r3 = 0, r4 = 0;
};

struct SbasEphemerisRecord {
  uint8_t number = 0;
  RawTime time;  // reception
  uint8_t unused9 = 0;
  uint8_t s1 = 0, s2 = 0;
  uint32_t reference_seconds = 0;  // time of day
  double s3_s5[3] = {};
  float s6_s13[8] = {};
};

struct GalileoEphemerisRecord {
  uint8_t number = 0;
  RawTime time;
  uint32_t e1 = 0, e2 = 0;
  float e3_e6[4] = {};
  double e7_e10[4] = {};
  float e11_e17[7] = {};
  double e18 = 0, e19 = 0;
  float e20 = 0;
  double e21 = 0;
  float e22 = 0;
  uint16_t e23 = 0;
  uint16_t unused127 = 0;
  uint8_t e24 = 0, e25 = 0;
};

// Tags 23 and 56.
struct SatPositionRecord {
  uint16_t code = 0;
  SatId sat = 0;
  bool valid = false;
  RawTime time;
  double position[3] = {};  // km
  double clock_us = 0;      // microseconds
};

struct MeteoSensorRecord {
  uint16_t selector = 0;  // bits 0-2: pressure, temperature, humidity sensor
  float value = 0;
  char name1[21] = {};
  char name2[21] = {};
};

struct MeteoPositionRecord {
  uint16_t flags = 0;  // bits 0-2 select sensors; bit 6 X,Y,Z present; bit 7 height present
  double x = 0, y = 0, z = 0;
  double height = 0;
  static constexpr uint16_t kXyzBit = 1u << 6;
  static constexpr uint16_t kHeightBit = 1u << 7;
};

// Missing values already carry their defaults.
struct MeteoSampleRecord {
  RawTime time;
  uint16_t flags = 0;
  float pressure = 0, temperature = 0, humidity = 0, unused = 0;
};

// Defaults of a meteorological sample's missing values; the pressure is the float with bits
// 0x447D4FBE (1013.246 hPa).
float DefaultPressure();
constexpr float kDefaultTemperature = 20.0f;
constexpr float kDefaultHumidity = 50.0f;

}  // namespace vox
