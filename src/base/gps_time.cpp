#include "base/gps_time.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>

namespace vox {

namespace {

// MJD of 1901-01-01 minus one: the day numbers count four-year cycles from 1901.
constexpr int64_t kMjd1901 = 15385;
constexpr int32_t kDaysPerCycle = 1461;

// Three letters per month; July is written "Jly" in our date texts.
constexpr char kMonthNames[] = "JanFebMarAprMayJunJlyAugSepOctNovDec";

// Two decimal digits of value mod 100, also for negative values.
int TwoDigits(int32_t value) {
  return ((value % 100) + 100) % 100;
}

}  // namespace

DayTime WeekToDay(const GpsWeekTime& t) {
  DayTime d;
  d.mjd = t.week * 7 + kGpsOriginMjd + t.ms_of_week / kMsPerDay;
  d.fraction = static_cast<float>(t.ms_of_week % kMsPerDay) / static_cast<float>(kMsPerDay);
  return d;
}

GpsWeekTime DayToWeek(const DayTime& t) {
  const int64_t n = static_cast<int64_t>(t.mjd) - kGpsOriginMjd;
  const int64_t week = n / 7;  // truncates toward zero
  const double ms_of_day = static_cast<double>(t.fraction) * 86400000.0 + 0.5;
  GpsWeekTime w;
  w.week = static_cast<uint32_t>(week);
  w.ms_of_week =
      static_cast<uint32_t>((n - week * 7) * kMsPerDay + static_cast<int64_t>(ms_of_day));
  return w;
}

CalendarTime DayToCalendar(const DayTime& t) {
  int64_t s = static_cast<int64_t>(static_cast<double>(t.fraction) * 86400.0 + 0.5);
  int64_t day = t.mjd;
  // A single-precision fraction can round up to a whole day; that second belongs to the
  // next day, not to an hour 24 of this one.
  if (s >= kSecondsPerDay) {
    s -= kSecondsPerDay;
    ++day;
  }
  const int64_t d = day - kMjd1901;
  const int64_t c = d / kDaysPerCycle;
  const int64_t r = d % kDaysPerCycle;
  const int64_t last = r == kDaysPerCycle - 1 ? 1 : 0;
  const int64_t y = r / 365;
  const int32_t year = static_cast<int32_t>(1901 + 4 * c + y - last);
  const int32_t yday = static_cast<int32_t>(r + 1 + (last - y) * 365);
  return MakeCalendarFromDayOfYear(static_cast<int32_t>(s % 60),
                                   static_cast<int32_t>(s % 3600 / 60),
                                   static_cast<int32_t>(s / 3600), yday, year);
}

DayTime CalendarToDay(const CalendarTime& c) {
  const int64_t y1 = static_cast<int64_t>(c.year) - 1;
  DayTime d;
  d.mjd = static_cast<uint32_t>(y1 * 365 + 15384 + c.yday + y1 / 4);
  const float seconds = static_cast<float>((c.hour * 60 + c.min) * 60 + c.sec);
  d.fraction = seconds / 86400.0f;
  return d;
}

CalendarTime WeekToCalendar(const GpsWeekTime& t) {
  return DayToCalendar(WeekToDay(t));
}

GpsWeekTime CalendarToWeek(const CalendarTime& c) {
  return DayToWeek(CalendarToDay(c));
}

int32_t DayOfYear(int32_t month, int32_t mday, int32_t year_since_1900) {
  // Months counted from March put the leap day at the end of the counted year.
  int32_t k = month - 2;
  if (k < 0) k += 12;
  const int32_t v = k * 157 / 5 - k * 4 / 5 + mday - 306;
  if (v > 0) return v;
  const bool leap = year_since_1900 % 4 == 0 && year_since_1900 % 400 != 0;
  return v + 365 + (leap ? 1 : 0);
}

int32_t DayOfWeek(int32_t yday, int32_t year_since_1900) {
  const int64_t y1 = static_cast<int64_t>(year_since_1900) - 1;
  const int64_t w = y1 * 365 - 28860 + yday + y1 / 4;
  return static_cast<int32_t>(std::llabs(w) % 7);
}

CalendarTime MakeCalendarFromDate(int32_t sec, int32_t min, int32_t hour, int32_t mday,
                                  int32_t month_1_12, int32_t year) {
  CalendarTime c;
  c.sec = sec;
  c.min = min;
  c.hour = hour;
  c.mday = mday;
  c.month = month_1_12 - 1;
  c.year = year - 1900;
  c.yday = DayOfYear(c.month, mday, c.year);
  c.wday = DayOfWeek(c.yday, c.year);
  c.isdst = 0;
  return c;
}

CalendarTime MakeCalendarFromDayOfYear(int32_t sec, int32_t min, int32_t hour, int32_t yday,
                                       int32_t year) {
  CalendarTime c;
  c.sec = sec;
  c.min = min;
  c.hour = hour;
  c.year = year - 1900;
  c.yday = yday;
  int32_t month = yday / 30;
  if (month > 11) month = 11;
  if (month > 0 && yday < DayOfYear(month, 1, c.year)) --month;
  c.month = month;
  c.mday = yday - DayOfYear(month, 1, c.year) + 1;
  c.wday = DayOfWeek(yday, c.year);
  c.isdst = 0;
  return c;
}

GpsWeekTime AddSeconds(const GpsWeekTime& t, double seconds) {
  double ms = std::round(seconds * 1000.0);
  int64_t week = t.week;
  if (std::fabs(ms) > 604799999.5) {
    const double k = std::round(ms / kMsPerWeek);
    week += static_cast<int64_t>(k);
    ms -= k * kMsPerWeek;
  }
  int64_t ms_of_week = static_cast<int64_t>(t.ms_of_week) + static_cast<int64_t>(ms);
  // One step suffices for a normalised input; the loops also tidy an unnormalised one.
  while (ms_of_week < 0) {
    --week;
    ms_of_week += kMsPerWeek;
  }
  while (ms_of_week >= kMsPerWeek) {
    ++week;
    ms_of_week -= kMsPerWeek;
  }
  return GpsWeekTime{static_cast<uint32_t>(week), static_cast<uint32_t>(ms_of_week)};
}

GpsWeekTime FromTimeMs(const TimeMs& t) {
  return GpsWeekTime{t.seconds / kSecondsPerWeek, (t.seconds % kSecondsPerWeek) * 1000 + t.ms};
}

TimeMs ToTimeMs(const GpsWeekTime& t) {
  return TimeMs{t.week * kSecondsPerWeek + t.ms_of_week / 1000,
                static_cast<uint16_t>(t.ms_of_week % 1000)};
}

TimeMs TimeMsFromDate(int32_t year, int32_t month_1_12, int32_t mday, int32_t hour, int32_t min,
                      int32_t sec) {
  // The date goes through the day number at midnight (exact); the time of day is added in
  // whole seconds, so that no single-precision fraction shifts it by a millisecond.
  const TimeMs midnight =
      ToTimeMs(CalendarToWeek(MakeCalendarFromDate(0, 0, 0, mday, month_1_12, year)));
  return TimeMs{midnight.seconds + static_cast<uint32_t>((hour * 60 + min) * 60 + sec), 0};
}

std::string DateText(const CalendarTime& c, unsigned flags) {
  const bool time_only = (flags & 3) == kDateTextTimeOnly;
  const bool date_only = (flags & 3) == kDateTextDateOnly;
  // A month outside 0 to 11 cannot index the name table; show it as "???".
  const bool month_ok = c.month >= 0 && c.month < 12;
  const char* month = month_ok ? kMonthNames + c.month * 3 : "???";
  char date[32];
  char time[32];
  std::snprintf(date, sizeof date, "%02d %.3s %02d%02d", TwoDigits(c.mday), month,
                TwoDigits(c.year / 100 + 19), TwoDigits(c.year));
  std::snprintf(time, sizeof time, "%02d:%02d:%02d", TwoDigits(c.hour), TwoDigits(c.min),
                TwoDigits(c.sec));
  if (time_only) return time;
  if (date_only) return date;
  return std::string(date) + " " + time;
}

std::string DateText(const GpsWeekTime& t, unsigned flags) {
  return DateText(WeekToCalendar(t), flags);
}

std::string CalendarText(const TimeMs& t) {
  return DateText(FromTimeMs(t), kDateTextBoth);
}

}  // namespace vox
