// The NMEA output: every navigation solution of an epoch stream and every ray of a fan
// becomes one $GPGGA sentence; the first sentence of a file is preceded by one $GPZDA
// sentence with the date and the local time zone.
//
// The caller owns the file and its sentence counter (an epoch stream or a ray stream),
// opens the file and closes it. Writing a fix is safe from any thread as long as one output
// is written by one thread at a time; the leap-second table takes its own lock.
#pragma once

#include <cstdint>
#include <string>

#include "base/buf_file.h"
#include "base/time_ms.h"
#include "platform/platform.h"

namespace vox {

// Mode the NMEA outputs are opened with (write; bit 0x80 is carried without effect).
constexpr uint32_t kNmeaOpenMode = 130;

// A position field of a GGA sentence: degrees × 100 + whole minutes, the minutes' fraction
// in units of 1e-7 minutes, and the hemisphere letter.
struct NmeaAngle {
  uint32_t degrees_minutes = 0;
  uint32_t fraction = 0;
  char hemisphere = 'N';
};
// Latitude in radians (-π/2 to π/2) and longitude in radians ([0, 2π), also negative).
NmeaAngle NmeaLatitude(double latitude);
NmeaAngle NmeaLongitude(double longitude);

// Puts the checksum into a formatted sentence that ends in "*00\r\n": the XOR of the bytes
// between "$" and "*", as two upper-case hexadecimal digits.
void PutNmeaChecksum(std::string& sentence);

// UTC minus local time in seconds (positive west of Greenwich) from the runtime's time-zone
// value; the value 28800 is not trusted and the offset is taken from the two clock readings.
long NmeaZoneSeconds(long time_zone_value, const platform::LocalDateTime& local,
                     const platform::UtcDateTime& utc);
// The same with the platform's time-zone value and clocks.
long NmeaZoneSeconds();

// The UTC calendar time of the sentence for a GPS time, whole seconds.
struct NmeaUtc {
  uint32_t hhmmss = 0;
  int32_t day = 1, month = 1, year = 1980;  // month 1 to 12, full year
};
NmeaUtc NmeaUtcTime(const TimeMs& gps_time, uint32_t leap_seconds);
// The leap seconds the sentence of t is corrected by (see the .cpp for uncovered times).
uint32_t NmeaLeapSeconds(const TimeMs& t);

struct NmeaFix {
  TimeMs time{0, 0};  // GPS time
  double x = 0, y = 0, z = 0;
  float hdop = 0;
  uint32_t satellites = 0;
  uint32_t quality = 0;
};

// The sentences of one fix: a ZDA sentence first when `first` is set, then the GGA sentence.
// Empty when the position is not a finite number.
std::string FormatNmeaFix(const NmeaFix& fix, bool first, long zone_seconds, uint32_t leap_seconds);

// Writes one fix to an output whose status is good: the ZDA sentence when the counter is 0,
// then the GGA sentence; raises the counter. False (nothing written) when the output's
// status is not good or the position cannot be written.
bool WriteNmeaFix(TBufFile& output, uint32_t& sentence_counter, const NmeaFix& fix);

// True when the output is open with a good status.
inline bool NmeaOutputGood(const TBufFile& output) {
  return output.is_open() && output.status() == 0;
}

}  // namespace vox
