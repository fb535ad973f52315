// TimeMs (the system's in-memory time) and RawTime (the raw files' and result files' time
// stamp), with their comparisons and conversions.
#pragma once

#include <cmath>
#include <cstdint>

#include "vox/vox_sdk_core.h"

namespace vox {

constexpr uint32_t kSecondsPerDay = 86400;
constexpr uint32_t kSecondsPerWeek = 604800;
constexpr uint32_t kMsPerDay = 86400000;

// The open end of a time window: 4294967295 s and 999 ms.
constexpr TimeMs kOpenEnd{0xFFFFFFFFu, 999};

// Compared by whole seconds, then milliseconds.
constexpr int Compare(const TimeMs& a, const TimeMs& b) {
  if (a.seconds != b.seconds) return a.seconds < b.seconds ? -1 : 1;
  if (a.ms != b.ms) return a.ms < b.ms ? -1 : 1;
  return 0;
}
constexpr bool operator==(const TimeMs& a, const TimeMs& b) { return Compare(a, b) == 0; }
constexpr bool operator<(const TimeMs& a, const TimeMs& b) { return Compare(a, b) < 0; }
constexpr bool operator<=(const TimeMs& a, const TimeMs& b) { return Compare(a, b) <= 0; }
constexpr bool operator>(const TimeMs& a, const TimeMs& b) { return Compare(a, b) > 0; }
constexpr bool operator>=(const TimeMs& a, const TimeMs& b) { return Compare(a, b) >= 0; }

// Milliseconds of day and day number since the GPS time origin (day 0 = 1980-01-06).
struct RawTime {
  uint32_t ms_of_day = 0;
  uint32_t day = 0;
};

constexpr TimeMs ToTimeMs(const RawTime& raw) {
  return TimeMs{raw.day * kSecondsPerDay + raw.ms_of_day / 1000,
                static_cast<uint16_t>(raw.ms_of_day % 1000)};
}

constexpr RawTime ToRawTime(const TimeMs& t) {
  return RawTime{(t.seconds % kSecondsPerDay) * 1000 + t.ms, t.seconds / kSecondsPerDay};
}

// Seconds as a 64-bit float, rounded to whole milliseconds.
inline RawTime RawTimeFromSeconds(double seconds) {
  const double m = std::nearbyint(seconds * 1000.0);
  const double day = std::floor(m / 86400000.0);
  return RawTime{static_cast<uint32_t>(m - day * 86400000.0), static_cast<uint32_t>(day)};
}

constexpr double ToSeconds(const TimeMs& t) { return t.seconds + t.ms / 1000.0; }

}  // namespace vox
