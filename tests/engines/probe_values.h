// The records the probe engine stores in its results mode. The whole-job test includes this
// header too, so that it knows what went in; what must come out of the result file it works
// out on its own.
#pragma once

#include <cstring>

#include "vox/vox_engine.h"

namespace probe_values {

// A day in March 2016 and a time of it, in whole seconds since the GPS time origin.
constexpr uint32_t kDay = 13204;
constexpr uint32_t kTen = kDay * 86400 + 36000;  // 10:00:00

// The fan's first and second solved positions (the second one is the rays' origin).
constexpr double kFan1[3] = {4000100.0, 300100.0, 4950100.0};
constexpr double kFan2[3] = {4000000.0, 300000.0, 4950000.0};

// Vector 1 solved, before any span is stored (flags: 0x200 of bits 8-9, 2, 8, 0x30, 0x400).
inline vox_VectorResult VectorFirst() {
  vox_VectorResult v;
  std::memset(&v, 0, sizeof v);
  v.solved = 1;
  v.base[0] = 4000000.5, v.base[1] = 300000.25, v.base[2] = 4950000.125;
  v.base_rms = 0.01f;
  v.baseline[0] = 100.5, v.baseline[1] = -200.25, v.baseline[2] = 50.125;
  v.baseline_rms = 0.02f;
  v.solution_flags = 0x200 | 0x2 | 0x8 | 0x30 | 0x400;
  for (uint32_t i = 0; i < 4; ++i) {
    v.stored_a[i] = 1 + i;
    v.stored_d[i] = 5 + i;
  }
  v.stored_b = 1.5f, v.stored_c = 2.5f, v.stored_e = 3.5f, v.stored_f = 4.5f;
  v.reserved = 0xDEADBEEF;
  v.extra = 9.5f;  // not stored: the flags lack 0x1000
  return v;
}

// Vector 1 again, unsolved and reversed, after its span is stored, with the extra value.
inline vox_VectorResult VectorSecond() {
  vox_VectorResult v = VectorFirst();
  v.solved = 0;
  v.reversed = 1;
  v.solution_flags = 0x20000000 | 0x10000000 | 0x08000000 | 0x04000000 | 0x02000000 | 0x20000 |
                     0x40000 | 0x300 | 0x1 | 0x1000 | 0x70;
  v.extra = 9.75f;
  return v;
}

// Vector 1 solved once more, its end point 10 m away from the stored one: a conflict.
inline vox_VectorResult VectorConflict() {
  vox_VectorResult v = VectorFirst();
  v.baseline[0] += 10.0;
  v.baseline_rms = 5.0f;  // above 1 m + 10 ppm
  v.solution_flags = 0x100 | 0x3;
  return v;
}

inline vox_FanResult Fan(const double (&position)[3]) {
  vox_FanResult f;
  f.has_position = 1;
  std::memcpy(f.position, position, sizeof f.position);
  return f;
}

// Rays k = 0, 1, 2 a second apart, k metres along each axis from the fan's second position.
constexpr uint32_t kRayFlags[3] = {0x3 | 0x10, 0x8 | 0x2 | 0x400 | 0x80000000u,
                                   0x2000 | 0x40000 | 0x1};
inline vox_RayData Ray(uint32_t k) {
  vox_RayData r;
  std::memset(&r, 0, sizeof r);
  r.time.seconds = kTen + k;
  r.time.ms = 250;
  for (int i = 0; i < 3; ++i)
    r.position[i] = kFan2[i] + (k + 1.0) * (i + 1);
  r.values[0] = 100 + k, r.values[1] = 200 + k, r.values[2] = 300 + k;
  r.flags = kRayFlags[k % 3];  // the extra ray of results mode 2 is Ray(3)
  r.hdop = 0.5f + k;
  r.satellites = 7 + k;
  return r;
}

inline vox_CopyDataRec Solution(uint32_t type, uint32_t flags) {
  vox_CopyDataRec c;
  std::memset(&c, 0, sizeof c);
  c.solution.type = type;
  c.solution.flags = flags;
  return c;
}

// Kinds 5 and 10.
inline vox_CopyDataRec Satellite(uint16_t obs_flags, uint8_t a, uint8_t b, uint32_t seed) {
  vox_CopyDataRec c;
  std::memset(&c, 0xEE, sizeof c);  // bytes that are not read
  c.satellite.obs_flags = obs_flags;
  c.satellite.sat_a = a;
  c.satellite.sat_b = b;
  c.satellite.time1 = TimeMs{kTen + seed, 125};
  c.satellite.time2 = TimeMs{kTen + seed + 60, 875};
  c.satellite.value = seed * 3;
  c.satellite.value_f = seed + 0.25f;
  for (uint32_t i = 0; i < 4; ++i)
    c.satellite.values[i] = seed * 10 + i;
  return c;
}

// Kinds 8 and 11.
inline vox_CopyDataRec SatelliteShort(uint16_t obs_flags, uint8_t a, uint8_t b, uint32_t seed) {
  vox_CopyDataRec c;
  std::memset(&c, 0xEE, sizeof c);
  c.satellite_short.obs_flags = obs_flags;
  c.satellite_short.sat_a = a;
  c.satellite_short.sat_b = b;
  for (uint32_t i = 0; i < 3; ++i)
    c.satellite_short.values[i] = seed * 10 + i;
  return c;
}

// The satellite records: kind, observation flags, satellite indices A and B.
struct CopyCase {
  uint32_t kind;
  uint16_t obs_flags;
  uint8_t a, b;
};
constexpr CopyCase kCopyCases[4] = {
    {5, 0xC103, 43, 35},    // R7 and G36
    {8, 0x4214, 4, 0},      // G5 alone
    {10, 0x8028, 99, 130},  // E2 and S22
    {11, 0x4040, 69, 40},   // C9 and R4
};
// The same kinds again from the probe's own thread.
constexpr CopyCase kThreadCases[2] = {
    {11, 0x0300, 97, 148},  // C37 and S40
    {5, 0x0001, 128, 0},    // S20
};

inline vox_CopyDataRec VectorSpan() {
  vox_CopyDataRec c;
  std::memset(&c, 0, sizeof c);
  c.vector_span.vector_id = 1;
  c.vector_span.start = TimeMs{kTen - 3600, 500};
  c.vector_span.end = TimeMs{kTen + 3600, 0};
  c.vector_span.value1 = 11;
  c.vector_span.value2 = 22;
  c.vector_span.value = 0.75f;
  std::strcpy(c.vector_span.name, "Span-V");
  return c;
}

inline vox_CopyDataRec FanSpan() {
  vox_CopyDataRec c;
  std::memset(&c, 0, sizeof c);
  c.fan_span.fan_id = 0x10000001;
  c.fan_span.start = TimeMs{kTen - 60, 0};
  c.fan_span.end = TimeMs{kTen + 60, 999};
  c.fan_span.value1 = 33;
  c.fan_span.value2 = 44;
  c.fan_span.value = 0.0f;  // zero already counts as set
  // 16 characters and the terminator, past the 76 bytes of the record: 15 are kept.
  std::memcpy(c.bytes + 60, "Span-F-123456789", 17);
  return c;
}

// Plot lines of the main stream: index, mode, name, options.
struct PlotLine {
  int32_t index;
  uint32_t mode;
  const char* name;
  const char* options;
};
constexpr PlotLine kMainLines[4] = {
    {0, 0, "G05-G12 L1", "m"},
    {2, 0, "R07 L2C", "c"},
    {3, 0, "E11 IonoFree", nullptr},
    {7, 2, "raw seven", nullptr},
};
constexpr PlotLine kThreadLine = {5, 0, "C03-C04 B1I", nullptr};
constexpr uint32_t kFanSpanSize = 77;
// Epoch times sent on line 1 (seconds since the GPS time origin).
constexpr double kPlotTime = kTen + 0.5;

}  // namespace probe_values
