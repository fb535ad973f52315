#include "raw/sp3_reader.h"

#include <charconv>
#include <cmath>
#include <cstring>
#include <optional>

#include "base/gps_time.h"

namespace vox {
namespace {

// Columns first to last (counted from 0, both included) of line, clipped to its length.
std::string_view Columns(std::string_view line, size_t first, size_t last) {
  if (first >= line.size()) return {};
  return line.substr(first, last - first + 1);
}

std::string_view Trim(std::string_view s) {
  while (!s.empty() && s.front() == ' ')
    s.remove_prefix(1);
  while (!s.empty() && s.back() == ' ')
    s.remove_suffix(1);
  return s;
}

// The integer at the start of the columns after leading blanks; 0 when there is none.
int ColumnInt(std::string_view line, size_t first, size_t last) {
  std::string_view s = Trim(Columns(line, first, last));
  if (!s.empty() && s.front() == '+') s.remove_prefix(1);
  int value = 0;
  std::from_chars(s.data(), s.data() + s.size(), value);
  return value;
}

// The decimal number in the columns, read the same way whatever the locale; 0 when there
// is none.
double ColumnDouble(std::string_view line, size_t first, size_t last) {
  std::string_view s = Trim(Columns(line, first, last));
  if (!s.empty() && s.front() == '+') s.remove_prefix(1);
  double value = 0;
  std::from_chars(s.data(), s.data() + s.size(), value);
  return value;
}

std::string_view WithoutCarriageReturn(std::string_view line) {
  if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
  return line;
}

// Reads the next line into buffer; nullopt at the end of the file.
std::optional<std::string_view> NextLine(TBufFile& file, char (&buffer)[kPreciseLineCapacity]) {
  if (file.ReadLine(buffer, kPreciseLineCapacity, '\n') == 0) return std::nullopt;
  return WithoutCarriageReturn(std::string_view(buffer, std::strlen(buffer)));
}

char First(std::string_view line) {
  return line.empty() ? '\0' : line.front();
}

// The epoch of a "*" line; nullopt when it lies outside the time range of the system.
std::optional<TimeMs> EpochTime(std::string_view line) {
  const TimeMs midnight =
      TimeMsFromDate(ColumnInt(line, 3, 6), ColumnInt(line, 8, 9), ColumnInt(line, 11, 12));
  const double seconds_of_day = (ColumnInt(line, 14, 15) * 60.0 + ColumnInt(line, 17, 18)) * 60.0 +
                                ColumnDouble(line, 20, 30);
  const double total_ms = std::floor(midnight.seconds * 1000.0 + seconds_of_day * 1000.0 + 0.5);
  if (!(total_ms >= 0.0 && total_ms < 4294967296000.0)) return std::nullopt;
  const auto ms = static_cast<uint64_t>(total_ms);
  return TimeMs{static_cast<uint32_t>(ms / 1000), static_cast<uint16_t>(ms % 1000)};
}

// The satellite of a "P" line (column 1 the system, columns 2 and 3 the number).
std::optional<SatId> LineSatellite(std::string_view line) {
  if (line.size() < 4) return std::nullopt;
  int number = ColumnInt(line, 2, 3);
  SatSystem system;
  switch (line[1]) {
    case ' ':
    case 'G':
      system = SatSystem::kGps;
      break;
    case 'J':
      system = SatSystem::kGps, number += 32;
      break;  // QZSS rides on GPS 33 to 37
    case 'R':
      system = SatSystem::kGlonass;
      break;
    case 'C':
      system = SatSystem::kBds;
      break;
    case 'E':
      system = SatSystem::kGalileo;
      break;
    case 'S':
      system = SatSystem::kSbas;
      break;
    default:
      return std::nullopt;
  }
  if (number < 0 || !IsValidSatellite(system, static_cast<unsigned>(number))) return std::nullopt;
  return MakeSatId(system, static_cast<unsigned>(number));
}

void InsertPositionLine(std::string_view line, TimeMs time, PreciseStore& store) {
  const std::optional<SatId> sat = LineSatellite(line);
  if (!sat) return;
  // Kilometres and microseconds in the file; metres and seconds in the store.
  store.Insert(*sat, time, ColumnDouble(line, 4, 17) * 1000.0, ColumnDouble(line, 18, 31) * 1000.0,
               ColumnDouble(line, 32, 45) * 1000.0,
               static_cast<float>(ColumnDouble(line, 46, 59) * 1e-6));
}

}  // namespace

bool IsPreciseOrbitHeader(std::string_view line) {
  line = WithoutCarriageReturn(line);
  if (line.size() != 60) return false;
  if (line[0] != '#' || line[1] < 'a' || line[1] > 'c') return false;
  if (line[2] != 'P' && line[2] != 'V') return false;
  if (line[7] != ' ' || line[10] != ' ' || line[13] != ' ') return false;
  const int year = ColumnInt(line, 3, 6);
  const int month = ColumnInt(line, 8, 9);
  const int day = ColumnInt(line, 11, 12);
  return year >= 1970 && year <= 2070 && month >= 1 && month <= 12 && day >= 1 && day <= 31;
}

bool IsPreciseOrbitFile(TBufFile& file) {
  char buffer[kPreciseLineCapacity];
  file.Seek(0);
  const std::optional<std::string_view> line = NextLine(file, buffer);
  return line && IsPreciseOrbitHeader(*line);
}

int ReadPreciseOrbitFile(TBufFile& file, PreciseStore& store) {
  char buffer[kPreciseLineCapacity];
  file.Seek(0);

  std::optional<std::string_view> line = NextLine(file, buffer);
  if (!line) return kPreciseFileEnded;
  if (line->size() < 3 || (*line)[0] != '#' || (*line)[1] < 'a' || (*line)[1] > 'c' ||
      ((*line)[2] != 'P' && (*line)[2] != 'V'))
    return kPreciseFileMalformed;
  const int epochs = ColumnInt(*line, 32, 38);

  line = NextLine(file, buffer);
  if (!line) return kPreciseFileEnded;
  if (!line->starts_with("##")) return kPreciseFileMalformed;

  line = NextLine(file, buffer);
  if (!line) return kPreciseFileEnded;
  if (First(*line) != '+') return kPreciseFileMalformed;
  const int satellites = ColumnInt(*line, 3, 5);

  bool at_epoch_line = false;  // the epoch line was already read while reading positions
  for (int epoch = 0; epoch < epochs; ++epoch) {
    // Find the epoch line; header, comment and other "+" lines come before the first one.
    while (!at_epoch_line) {
      line = NextLine(file, buffer);
      if (!line) return kPreciseFileEnded;
      const char c = First(*line);
      if (c == '*') break;
      if (c != '%' && c != '+' && c != '/') return kPreciseFileMalformed;
    }
    at_epoch_line = false;
    const std::optional<TimeMs> time = EpochTime(*line);

    // Position lines; velocity and correlation lines between them are skipped uncounted.
    for (int positions = 0; positions < satellites;) {
      line = NextLine(file, buffer);
      if (!line) return kPreciseFileEnded;
      const char c = First(*line);
      if (c == 'P') {
        ++positions;
        if (time) InsertPositionLine(*line, *time, store);
      } else if (c == '*') {
        // An epoch with fewer position lines than announced: the next epoch begins here,
        // and its samples must not be taken for this epoch's.
        at_epoch_line = true;
        break;
      }
    }
  }
  return kPreciseFileComplete;
}

}  // namespace vox
