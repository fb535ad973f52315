#include "base/gps_time.h"

#include <gtest/gtest.h>

namespace vox {
namespace {

TEST(GpsTime, OriginIsSundaySixthOfJanuary1980) {
  const DayTime day = WeekToDay(GpsWeekTime{0, 0});
  EXPECT_EQ(day.mjd, 44244u);
  EXPECT_EQ(day.fraction, 0.0f);
  const CalendarTime c = WeekToCalendar(GpsWeekTime{0, 0});
  EXPECT_EQ(c, MakeCalendarFromDate(0, 0, 0, 6, 1, 1980));
  EXPECT_EQ(c.year, 80);
  EXPECT_EQ(c.month, 0);
  EXPECT_EQ(c.mday, 6);
  EXPECT_EQ(c.wday, 0);
  EXPECT_EQ(c.yday, 6);
  EXPECT_EQ(c.isdst, 0);
  EXPECT_EQ(CalendarToWeek(c), (GpsWeekTime{0, 0}));
}

TEST(GpsTime, LastSecondOf2016KeepsItsSinglePrecisionFraction) {
  const CalendarTime c = MakeCalendarFromDate(59, 59, 23, 31, 12, 2016);
  EXPECT_EQ(c.yday, 366);
  const DayTime day = CalendarToDay(c);
  EXPECT_EQ(day.mjd, 57753u);
  EXPECT_EQ(day.fraction, 86399.0f / 86400.0f);
  EXPECT_EQ(DayToCalendar(day), c);
  // Through the week: 2016-12-31 is the Saturday of week 1929. The single-precision
  // fraction lands one millisecond late, and stored times depend on exactly that.
  const GpsWeekTime w = CalendarToWeek(c);
  EXPECT_EQ(w.week, 1929u);
  EXPECT_EQ(w.ms_of_week, 604799001u);
  EXPECT_EQ(WeekToCalendar(w), c);
  EXPECT_EQ(c.wday, 6);
}

TEST(GpsTime, DayOfYearAroundLeapDay) {
  CalendarTime c = MakeCalendarFromDayOfYear(0, 0, 0, 366, 2016);
  EXPECT_EQ(c.month, 11);
  EXPECT_EQ(c.mday, 31);
  c = MakeCalendarFromDayOfYear(0, 0, 0, 365, 2017);
  EXPECT_EQ(c.month, 11);
  EXPECT_EQ(c.mday, 31);
  c = MakeCalendarFromDayOfYear(0, 0, 0, 60, 2016);
  EXPECT_EQ(c.month, 1);
  EXPECT_EQ(c.mday, 29);
  c = MakeCalendarFromDayOfYear(0, 0, 0, 60, 2017);
  EXPECT_EQ(c.month, 2);
  EXPECT_EQ(c.mday, 1);
  // 2000 is a leap year, 1900 is not.
  EXPECT_EQ(DayOfYear(11, 31, 100), 366);
  EXPECT_EQ(DayOfYear(11, 31, 0), 365);
}

TEST(GpsTime, EveryDayOfSeveralYearsRoundTrips) {
  // Walk day by day across two leap years and a century leap year, checking the calendar
  // against a plain proleptic count.
  static const int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  uint32_t mjd = 51544;  // 2000-01-01, a Saturday
  int wday = 6;
  for (int year = 2000; year <= 2004; ++year) {
    int yday = 0;
    for (int month = 0; month < 12; ++month) {
      const bool leap = year % 4 == 0;
      const int days = kDays[month] + (month == 1 && leap ? 1 : 0);
      for (int mday = 1; mday <= days; ++mday, ++mjd, wday = (wday + 1) % 7) {
        ++yday;
        const CalendarTime c = DayToCalendar(DayTime{mjd, 0.5f});
        ASSERT_EQ(c.year, year - 1900) << mjd;
        ASSERT_EQ(c.month, month) << mjd;
        ASSERT_EQ(c.mday, mday) << mjd;
        ASSERT_EQ(c.yday, yday) << mjd;
        ASSERT_EQ(c.wday, wday) << mjd;
        ASSERT_EQ(c.hour, 12);
        ASSERT_EQ(CalendarToDay(c).mjd, mjd);
      }
    }
  }
}

TEST(GpsTime, WeekAndDayRounding) {
  // Millisecond of week beyond a day moves into the day number.
  const DayTime d = WeekToDay(GpsWeekTime{1000, 2 * kMsPerDay + 43200000});
  EXPECT_EQ(d.mjd, 1000u * 7 + 44244 + 2);
  EXPECT_EQ(d.fraction, 0.5f);
  EXPECT_EQ(DayToWeek(d), (GpsWeekTime{1000, 2 * kMsPerDay + 43200000}));
  // Single precision loses milliseconds late in the day; the way back rounds to the nearest.
  const GpsWeekTime late{2000, 86399999};
  const GpsWeekTime back = DayToWeek(WeekToDay(late));
  EXPECT_EQ(back.week, 2000u);
  EXPECT_EQ(back.ms_of_week, 86400000u);
}

TEST(GpsTime, FractionRoundingToFullDayRollsIntoNextDay) {
  // 23:59:59.9 rounds to the next midnight, never to 24:00:00.
  const CalendarTime c = WeekToCalendar(GpsWeekTime{1929, 6 * kMsPerDay + 86399900});
  EXPECT_EQ(c.hour, 0);
  EXPECT_EQ(c.min, 0);
  EXPECT_EQ(c.sec, 0);
  EXPECT_EQ(c.year, 117);
  EXPECT_EQ(c.yday, 1);
  EXPECT_EQ(c.wday, 0);
}

TEST(GpsTime, AddSecondsAcrossWeekBoundaries) {
  EXPECT_EQ(AddSeconds(GpsWeekTime{1000, 0}, -1.0), (GpsWeekTime{999, 604799000}));
  EXPECT_EQ(AddSeconds(GpsWeekTime{1000, 0}, 1814401.0), (GpsWeekTime{1003, 1000}));
  EXPECT_EQ(AddSeconds(GpsWeekTime{1000, 604799000}, 1.0), (GpsWeekTime{1001, 0}));
  EXPECT_EQ(AddSeconds(GpsWeekTime{1003, 1000}, -1814401.0), (GpsWeekTime{1000, 0}));
  // Whole weeks and a rounding to the millisecond.
  EXPECT_EQ(AddSeconds(GpsWeekTime{1000, 5}, -3.5 * 604800), (GpsWeekTime{996, 302400005}));
  EXPECT_EQ(AddSeconds(GpsWeekTime{1000, 0}, 0.0004), (GpsWeekTime{1000, 0}));
  EXPECT_EQ(AddSeconds(GpsWeekTime{1000, 0}, 0.0006), (GpsWeekTime{1000, 1}));
}

TEST(GpsTime, DateTextWritesJulyAsJly) {
  const CalendarTime c = MakeCalendarFromDate(9, 5, 12, 1, 7, 2018);
  EXPECT_EQ(DateText(c, 0), "01 Jly 2018 12:05:09");
  EXPECT_EQ(DateText(c, 2), "12:05:09");
  EXPECT_EQ(DateText(c, 1), "01 Jly 2018");
  EXPECT_EQ(DateText(c, 3), "01 Jly 2018 12:05:09");
  EXPECT_EQ(DateText(MakeCalendarFromDate(0, 0, 0, 31, 12, 1999), 1), "31 Dec 1999");
  const CalendarTime bad{0, 0, 0, 1, 12, 100, 0, 1, 0};
  EXPECT_EQ(DateText(bad, 1), "01 ??? 2000");
}

TEST(GpsTime, TimeMsBridges) {
  // The time of day is added exactly, without the single-precision detour.
  const TimeMs t = TimeMsFromDate(2016, 12, 31, 23, 59, 59);
  EXPECT_EQ(t.seconds, 1929u * 604800 + 604799);
  EXPECT_EQ(t.ms, 0);
  EXPECT_EQ(CalendarText(TimeMsFromDate(2018, 7, 1, 12, 5, 9)), "01 Jly 2018 12:05:09");
  const GpsWeekTime w = FromTimeMs(TimeMs{1000 * 604800 + 61, 250});
  EXPECT_EQ(w, (GpsWeekTime{1000, 61250}));
  EXPECT_TRUE(ToTimeMs(w) == (TimeMs{1000 * 604800 + 61, 250}));
  EXPECT_EQ(CalendarText(TimeMs{0, 0}), "06 Jan 1980 00:00:00");
}

}  // namespace
}  // namespace vox
