// GPS week time, Modified Julian Day time and calendar time, and the conversions between
// them. These conversions feed files (leap-second rows, precise orbit epochs, NMEA
// sentences, the engine-log listing), so their rounding is part of the contract: the
// 32-bit float day fraction and the "+ 0.5" roundings below are deliberate.
//
// The day-number rules hold for the years 1901 to 2099, the range the library works in.
// Everything here is a pure function of its arguments (LocalCalendar reads the clock) and
// may be called from any thread.
#pragma once

#include <cstdint>
#include <string>

#include "base/time_ms.h"

namespace vox {

constexpr uint32_t kMsPerWeek = 604800000;
// Modified Julian Day of the GPS time origin, 1980-01-06.
constexpr uint32_t kGpsOriginMjd = 44244;

// GpsWeekTime: a GPS week and the millisecond within it (0 to 604799999).
struct GpsWeekTime {
  uint32_t week = 0;
  uint32_t ms_of_week = 0;
};
constexpr bool operator==(const GpsWeekTime& a, const GpsWeekTime& b) {
  return a.week == b.week && a.ms_of_week == b.ms_of_week;
}

// DayTime: a Modified Julian Day number and the fraction of that day. The fraction is held
// in single precision on purpose (stored results depend on it) and widened where used.
struct DayTime {
  uint32_t mjd = 0;
  float fraction = 0.0f;
};

// CalendarTime: the broken-down time in the field order of the C library's struct tm.
// month is 0 to 11, year counts from 1900, wday is 0 (Sunday) to 6, yday is 1 to 366 (not
// 0-based as in struct tm), and isdst is always 0.
struct CalendarTime {
  int32_t sec = 0;
  int32_t min = 0;
  int32_t hour = 0;
  int32_t mday = 1;
  int32_t month = 0;
  int32_t year = 0;
  int32_t wday = 0;
  int32_t yday = 1;
  int32_t isdst = 0;
};
constexpr bool operator==(const CalendarTime& a, const CalendarTime& b) {
  return a.sec == b.sec && a.min == b.min && a.hour == b.hour && a.mday == b.mday &&
         a.month == b.month && a.year == b.year && a.wday == b.wday && a.yday == b.yday &&
         a.isdst == b.isdst;
}

// ---- week and day

DayTime WeekToDay(const GpsWeekTime& t);
GpsWeekTime DayToWeek(const DayTime& t);

// ---- day and calendar

// Rounds the day fraction to whole seconds. A fraction that rounds up to the full day
// (23:59:59.5 and later) rolls over to 00:00:00 of the next day rather than reading 24:00:00.
CalendarTime DayToCalendar(const DayTime& t);
DayTime CalendarToDay(const CalendarTime& c);

// ---- week and calendar (through the day time)

CalendarTime WeekToCalendar(const GpsWeekTime& t);
GpsWeekTime CalendarToWeek(const CalendarTime& c);

// ---- building calendar records

// Day of the year (1 to 366) of a date; month is 0 to 11, year_since_1900 as in CalendarTime.
int32_t DayOfYear(int32_t month, int32_t mday, int32_t year_since_1900);
// Day of the week (0 = Sunday) of a day of the year.
int32_t DayOfWeek(int32_t yday, int32_t year_since_1900);

// From a date with month 1 to 12 and the full year (e.g. 2016); fills yday and wday.
CalendarTime MakeCalendarFromDate(int32_t sec, int32_t min, int32_t hour, int32_t mday,
                                  int32_t month_1_12, int32_t year);
// From a day of the year (1 to 366) and the full year; fills month, mday and wday.
CalendarTime MakeCalendarFromDayOfYear(int32_t sec, int32_t min, int32_t hour, int32_t yday,
                                       int32_t year);

// ---- local clock

// The system's local date and time, whole seconds.
CalendarTime LocalCalendar();
// The same as a GPS week time (the job start and end times).
GpsWeekTime LocalGpsWeekTime();

// ---- arithmetic

// Adds seconds (rounded to whole milliseconds) and normalises the millisecond of week.
GpsWeekTime AddSeconds(const GpsWeekTime& t, double seconds);

// ---- TimeMs bridges

// Week = seconds / 604800, ms of week = (seconds mod 604800) * 1000 + ms.
GpsWeekTime FromTimeMs(const TimeMs& t);
TimeMs ToTimeMs(const GpsWeekTime& t);
// The TimeMs of a calendar date and time of day (month 1 to 12, full year): the date at
// midnight through CalendarToWeek, plus the time of day in whole seconds. Unlike
// CalendarToWeek of the full time, this is exact to the second.
TimeMs TimeMsFromDate(int32_t year, int32_t month_1_12, int32_t mday, int32_t hour = 0,
                      int32_t min = 0, int32_t sec = 0);

// ---- date text

// Format flags of DateText: bit 0 asks for the date, bit 1 for the time; 0 and 3 give both.
constexpr unsigned kDateTextBoth = 0;
constexpr unsigned kDateTextDateOnly = 1;
constexpr unsigned kDateTextTimeOnly = 2;

// "DD Mon YYYY HH:MM:SS" (months "Jan" ... "Jly" ... "Dec"), or one of its two halves.
std::string DateText(const CalendarTime& c, unsigned flags);
std::string DateText(const GpsWeekTime& t, unsigned flags);
// The listing text of a TimeMs: DateText(FromTimeMs(t), 0).
std::string CalendarText(const TimeMs& t);

}  // namespace vox
