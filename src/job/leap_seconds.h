// The process-wide leap-second table: GPS minus UTC in whole seconds by spans of GPS time.
//
// The table outlives a run: it is filled from the built-in text on the first query, replaced
// by a job's valid [LEAP_SEC] section and extended when the raw data report a count for a
// time it does not cover. Every operation holds the recursive "leap_seconds" lock from start
// to end, so engine threads, the job thread and the NMEA writer may call them at any time.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "base/time_ms.h"
#include "job/job_section.h"

namespace vox {

constexpr uint32_t kLeapUnknown = 0xFFFFFFFF;
constexpr size_t kMaxLeapRows = 32;

// One span: leap seconds valid for GPS seconds begin <= t < end.
struct LeapRow {
  uint32_t leap_seconds = 0;
  uint32_t begin = 0;
  uint32_t end = 0;
};

// The table used when nothing else has been loaded, in the job file's section syntax.
extern const char kBuiltInLeapText[];

// GPS seconds of 1 January (a year without fraction) or 1 July (any other value) of the
// year. Dates before the GPS time origin, and values that are not numbers, give 0; years
// from 2100 on, which the calendar rules do not cover, give 0xFFFFFFFF (no end).
uint32_t DecimalYearToGps(double year);

// Replaces the table from the [LEAP_SEC] section of the text the reader looks at (the reader
// is repositioned). False, with the table unchanged, when the section is absent, has no
// entries or no valid entry. Of more than 32 valid entries the first 32 are kept.
bool ReadLeapSection(JobSection& reader);

// Leap seconds at t, or kLeapUnknown when no row holds t. Loads the built-in table when the
// table is empty.
uint32_t GetLeapSeconds(const TimeMs& t);
// Leap seconds at second minus those at first (a time no row holds counts 0), as a 32-bit
// value; 0 when no table can be had.
uint32_t GetLeapChanges(const TimeMs& first, const TimeMs& second);
// The row holding t keeps its value, which is returned. Otherwise a row for the half year
// containing t is appended with leap_seconds (returned), or kLeapUnknown when the table is
// full. Never loads the built-in table.
uint32_t SetLeapSeconds(const TimeMs& t, uint32_t leap_seconds);

// A copy of the current rows (for listings and checks).
std::vector<LeapRow> LeapTableRows();

// Empties the table, as at library load. For tests only: the table is never emptied while
// the library runs jobs.
void ResetLeapTableForTesting();

}  // namespace vox
