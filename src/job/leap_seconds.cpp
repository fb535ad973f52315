#include "job/leap_seconds.h"

#include <algorithm>
#include <cmath>
#include <string>

#include "base/engine_log.h"
#include "base/gps_time.h"
#include "base/tlock.h"

namespace vox {

const char kBuiltInLeapText[] =
    "[LEAP_SEC]\n; LS=begin[,end] (YYYY.Y)\n0=1980.0\n1=1981.5\n2=1982.5\n3=1983.5\n4=1985.5\n"
    "5=1988.0\n6=1990.0\n7=1991.0\n8=1992.5\n9=1993.5\n10=1994.5\n11=1996.0\n12=1997.5\n"
    "13=1999.0\n14=2006.0\n15=2009.0\n16=2012.5\n17=2015.5\n18=2017.0,2017.5\nNum=19\n";

namespace {

struct LeapTable {
  std::vector<LeapRow> rows;
};

// Created on first use, which is before any thread can race for it: the library's load
// and its first job both run on one thread before engines start.
TLock& TableLock() {
  static TLock lock("leap_seconds");
  return lock;
}

LeapTable& Table() {
  static LeapTable table;
  return table;
}

const LeapRow* RowHolding(const LeapTable& table, uint32_t seconds) {
  for (auto row = table.rows.rbegin(); row != table.rows.rend(); ++row)
    if (row->begin <= seconds && seconds < row->end) return &*row;
  return nullptr;
}

void LoadBuiltInIfEmpty() {
  if (!Table().rows.empty()) return;
  JobSection reader(kBuiltInLeapText);
  ReadLeapSection(reader);
}

struct LeapEntry {
  uint32_t leap_seconds;
  double begin_year;
  double end_year;
};

// The end year of "begin[,end]": after the begin year, blanks, then an optional comma.
double EndYear(std::string_view value, size_t begin_length) {
  size_t pos = begin_length;
  while (pos < value.size() && (value[pos] == ' ' || value[pos] == '\t'))
    ++pos;
  if (pos >= value.size() || value[pos] != ',') return 0.0;
  return ParseDouble(value.substr(pos + 1));
}

}  // namespace

uint32_t DecimalYearToGps(double year) {
  if (!(year >= 1980.0)) return 0;  // also not a number
  if (year >= 2100.0) return 0xFFFFFFFF;
  const double whole = std::floor(year);
  const int32_t y = static_cast<int32_t>(whole);
  const int32_t month = year == whole ? 1 : 7;
  if (y == 1980 && month == 1) return 0;  // 1980-01-01 lies before the origin
  const GpsWeekTime t = CalendarToWeek(MakeCalendarFromDate(0, 0, 0, 1, month, y));
  return t.week * kSecondsPerWeek + t.ms_of_week / 1000;
}

bool ReadLeapSection(JobSection& reader) {
  TLockGuard guard(TableLock());
  if (!reader.FindSection("LEAP_SEC")) return false;
  int32_t count = reader.GetInt("Num", 0);
  if (count == 0) return false;
  // An entry takes at least two bytes of the section ("0="), so no key past the section's
  // length can exist: a huge Num would otherwise keep the job thread looking up and tracing
  // billions of missing entries.
  const int32_t end = reader.end() >= 0 ? reader.end() : static_cast<int32_t>(reader.text().size());
  if (reader.start() >= 0 && end >= reader.start()) count = std::min(count, end - reader.start());

  std::vector<LeapEntry> entries;
  int32_t ignored = 0;
  for (int32_t i = 0; i < count; ++i) {
    const std::string value = reader.GetString(std::to_string(i));
    if (value.empty()) {
      Trace("LEAP_SEC: %d - no date\n", i);
      continue;
    }
    size_t length = 0;
    const double begin = ParseDouble(value, &length);
    if (begin < 1980.0 || begin > 2099.0) {
      Trace("LEAP_SEC: %d=%g - invalid date\n", i, begin);
      continue;
    }
    if (entries.size() == kMaxLeapRows) {
      ++ignored;
      continue;
    }
    entries.push_back(LeapEntry{static_cast<uint32_t>(i), begin, EndYear(value, length)});
  }
  if (ignored > 0)
    Trace("LEAP_SEC: %d valid entries after the first %d ignored\n", ignored,
          static_cast<int>(kMaxLeapRows));
  if (entries.empty()) {
    Trace("LEAP_SEC: no valid leap_seconds\n");
    return false;
  }
  if (entries.back().end_year == 0.0) entries.back().end_year = entries.back().begin_year + 0.5;

  // Every span but the last ends where the next one begins; only the last keeps its own end.
  std::vector<LeapRow> rows;
  rows.reserve(entries.size());
  for (size_t k = 0; k < entries.size(); ++k) {
    const bool last = k + 1 == entries.size();
    const double end_year = last ? entries[k].end_year : entries[k + 1].begin_year;
    rows.push_back(LeapRow{entries[k].leap_seconds, DecimalYearToGps(entries[k].begin_year),
                           DecimalYearToGps(end_year)});
  }
  Table().rows = std::move(rows);
  return true;
}

uint32_t GetLeapSeconds(const TimeMs& t) {
  TLockGuard guard(TableLock());
  LoadBuiltInIfEmpty();
  const LeapRow* row = RowHolding(Table(), t.seconds);
  return row == nullptr ? kLeapUnknown : row->leap_seconds;
}

uint32_t GetLeapChanges(const TimeMs& first, const TimeMs& second) {
  TLockGuard guard(TableLock());
  LoadBuiltInIfEmpty();
  if (Table().rows.empty()) return 0;
  const LeapRow* a = RowHolding(Table(), first.seconds);
  const LeapRow* b = RowHolding(Table(), second.seconds);
  return (b == nullptr ? 0u : b->leap_seconds) - (a == nullptr ? 0u : a->leap_seconds);
}

uint32_t SetLeapSeconds(const TimeMs& t, uint32_t leap_seconds) {
  TLockGuard guard(TableLock());
  LeapTable& table = Table();
  if (const LeapRow* row = RowHolding(table, t.seconds)) return row->leap_seconds;
  if (table.rows.size() >= kMaxLeapRows) return kLeapUnknown;

  const GpsWeekTime week{t.seconds / kSecondsPerWeek, t.ms + (t.seconds % kSecondsPerWeek) * 1000u};
  const CalendarTime date = WeekToCalendar(week);
  const double year = 1900.0 + date.year + (date.month >= 6 ? 0.5 : 0.0);
  table.rows.push_back(LeapRow{leap_seconds, DecimalYearToGps(year), DecimalYearToGps(year + 0.5)});
  return leap_seconds;
}

std::vector<LeapRow> LeapTableRows() {
  TLockGuard guard(TableLock());
  return Table().rows;
}

void ResetLeapTableForTesting() {
  TLockGuard guard(TableLock());
  Table().rows.clear();
}

}  // namespace vox
