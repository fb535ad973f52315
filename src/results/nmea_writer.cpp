#include "results/nmea_writer.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>

#include "base/ellipsoid.h"
#include "base/gps_time.h"
#include "job/leap_seconds.h"

namespace vox {
namespace {

constexpr double kDegreesPerRadian = 57.29577951308232;
constexpr double kFractionScale = 1e7;

// Degrees (not negative) as degrees-and-minutes with the minutes' fraction; a fraction that
// rounds up to a whole minute carries into the minutes.
NmeaAngle DegreesToField(double degrees, char hemisphere) {
  const double minutes = degrees * 60.0;
  auto whole = static_cast<uint32_t>(std::floor(minutes));
  auto fraction =
      static_cast<uint32_t>(std::nearbyint((minutes - std::floor(minutes)) * kFractionScale));
  if (fraction >= 10000000) {
    fraction -= 10000000;
    whole += 1;
  }
  return NmeaAngle{whole + (whole / 60) * 40, fraction, hemisphere};
}

// Days since 1970-01-01 of a civil date (proleptic Gregorian).
long DaysFromCivil(long y, unsigned m, unsigned d) {
  y -= m <= 2;
  const long era = (y >= 0 ? y : y - 399) / 400;
  const auto yoe = static_cast<unsigned>(y - era * 400);
  const unsigned doy = (153 * (m > 2 ? m - 3 : m + 9) + 2) / 5 + d - 1;
  const unsigned doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + static_cast<long>(doe) - 719468;
}

char HexDigit(unsigned v) {
  return static_cast<char>(v < 10 ? '0' + v : 'A' + (v - 10));
}

template <typename... Args>
std::string Format(const char* format, Args... args) {
  char small[256];
  const int n = std::snprintf(small, sizeof small, format, args...);
  if (n < 0) return {};
  if (static_cast<size_t>(n) < sizeof small) return std::string(small, static_cast<size_t>(n));
  // A sentence never needs more than the fixed buffer unless a field is absurd (a height of
  // 1e300); it is then written whole rather than cut mid-field without its checksum.
  std::string big(static_cast<size_t>(n) + 1, '\0');
  std::snprintf(big.data(), big.size(), format, args...);
  big.resize(static_cast<size_t>(n));
  return big;
}

}  // namespace

NmeaAngle NmeaLatitude(double latitude) {
  double d = latitude * kDegreesPerRadian;
  char hemisphere = 'N';
  if (d < 0) {
    hemisphere = 'S';
    d = std::fabs(d);
  }
  return DegreesToField(d, hemisphere);
}

NmeaAngle NmeaLongitude(double longitude) {
  double d = longitude * kDegreesPerRadian;
  char hemisphere = 'E';
  if (d < 0) {
    d = std::fabs(d);
    hemisphere = 'W';
  }
  if (d > 180) {
    d = 360 - d;
    hemisphere = 'W';
  }
  return DegreesToField(d, hemisphere);
}

void PutNmeaChecksum(std::string& sentence) {
  const size_t n = sentence.size();
  if (n < 6 || sentence[0] != '$') return;
  unsigned sum = 0;
  for (size_t i = 1; i < n - 5; ++i)
    sum ^= static_cast<uint8_t>(sentence[i]);
  sentence[n - 4] = HexDigit((sum >> 4) & 0xF);
  sentence[n - 3] = HexDigit(sum & 0xF);
}

long NmeaZoneSeconds(long time_zone_value, const platform::LocalDateTime& local,
                     const platform::UtcDateTime& utc) {
  if (time_zone_value != 28800) return time_zone_value;
  long z = (utc.hour * 3600L + utc.minute * 60L + utc.second) -
           (local.hour * 3600L + local.minute * 60L + local.second);
  const long day_difference =
      DaysFromCivil(local.year, static_cast<unsigned>(local.month),
                    static_cast<unsigned>(local.day)) -
      DaysFromCivil(utc.year, static_cast<unsigned>(utc.month), static_cast<unsigned>(utc.day));
  if (day_difference == 1) z -= 86400;
  if (day_difference == -1) z += 86400;
  return z;
}

long NmeaZoneSeconds() {
  const long value = platform::TimeZoneSeconds();
  if (value != 28800) return value;
  return NmeaZoneSeconds(value, platform::LocalClock(), platform::UtcClock());
}

uint32_t NmeaLeapSeconds(const TimeMs& t) {
  const uint32_t leap = GetLeapSeconds(t);
  if (leap != kLeapUnknown) return leap;
  // A time past the table's last span (the built-in table stops in 2017) would otherwise be
  // shifted by 0xFFFFFFFF seconds, i.e. one second forward. The count of the latest span
  // that began before the time is the best knowledge there is, as leap seconds only grow.
  uint32_t best = 0;
  uint32_t best_begin = 0;
  for (const LeapRow& row : LeapTableRows()) {
    if (row.begin <= t.seconds && row.begin >= best_begin) {
      best = row.leap_seconds;
      best_begin = row.begin;
    }
  }
  return best;
}

NmeaUtc NmeaUtcTime(const TimeMs& gps_time, uint32_t leap_seconds) {
  const uint32_t s = gps_time.seconds - leap_seconds;
  const GpsWeekTime week{s / kSecondsPerWeek, (s % kSecondsPerWeek) * 1000};
  const CalendarTime c = WeekToCalendar(week);
  NmeaUtc out;
  out.hhmmss = static_cast<uint32_t>((c.hour * 100 + c.min) * 100 + c.sec);
  out.day = c.mday;
  out.month = c.month + 1;
  out.year = c.year + 1900;
  return out;
}

std::string FormatNmeaFix(const NmeaFix& fix, bool first, long zone_seconds,
                          uint32_t leap_seconds) {
  const Geodetic g = CartesianToGeodetic(GpsEllipsoid(), Cartesian{fix.x, fix.y, fix.z});
  const double latitude = g.latitude, longitude = g.longitude, height = g.height;
  if (!std::isfinite(latitude) || !std::isfinite(longitude) || !std::isfinite(height)) return {};
  const NmeaUtc utc = NmeaUtcTime(fix.time, leap_seconds);
  const NmeaAngle lat = NmeaLatitude(latitude);
  const NmeaAngle lon = NmeaLongitude(longitude);
  std::string out;
  if (first) {
    const long z = std::labs(zone_seconds);
    const long hours = zone_seconds < 0 ? -(z / 3600) : z / 3600;
    const auto minutes = static_cast<unsigned>(z / 60 - (z / 3600) * 60);
    std::string zda = Format("$GPZDA,%06u.%02u,%02u,%02u,%04u,%d,%02u*00\r\n", utc.hhmmss,
                             static_cast<unsigned>(fix.time.ms / 10), utc.day, utc.month, utc.year,
                             static_cast<int>(hours), minutes);
    PutNmeaChecksum(zda);
    out += zda;
  }
  std::string gga =
      Format("$GPGGA,%06u.%03u,%04u.%07u,%c,%05u.%07u,%c,%u,%02u,%.1f,%.4f,M,0.0,M,,0000*00\r\n",
             utc.hhmmss, static_cast<unsigned>(fix.time.ms), lat.degrees_minutes, lat.fraction,
             lat.hemisphere, lon.degrees_minutes, lon.fraction, lon.hemisphere, fix.quality,
             fix.satellites, static_cast<double>(fix.hdop), height);
  PutNmeaChecksum(gga);
  out += gga;
  return out;
}

bool WriteNmeaFix(TBufFile& output, uint32_t& sentence_counter, const NmeaFix& fix) {
  if (!NmeaOutputGood(output)) return false;
  const bool first = sentence_counter == 0;
  const std::string text =
      FormatNmeaFix(fix, first, first ? NmeaZoneSeconds() : 0, NmeaLeapSeconds(fix.time));
  if (text.empty()) return false;
  ++sentence_counter;
  output.Write(text.data(), static_cast<uint32_t>(text.size()));
  return true;
}

}  // namespace vox
