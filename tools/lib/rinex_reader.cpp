#include "rinex_reader.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdlib>

namespace voxtools::rinex {

namespace {

std::string Trim(const std::string& s) {
  const size_t b = s.find_first_not_of(" \t\r");
  if (b == std::string::npos) return {};
  const size_t e = s.find_last_not_of(" \t\r");
  return s.substr(b, e - b + 1);
}

// Columns [start, start + width) of a line, shorter (or empty) where the line ends earlier:
// RINEX writers drop trailing blanks.
std::string Column(const std::string& line, size_t start, size_t width) {
  if (start >= line.size()) return {};
  return line.substr(start, width);
}

std::string Label(const std::string& line) {
  return Trim(Column(line, 60, 20));
}

// A number of a fixed field; nullopt for a blank field, false in ok for anything else that is
// not a number. Navigation files write exponents with D.
std::optional<double> Number(const std::string& field, bool& ok) {
  std::string t = Trim(field);
  ok = true;
  if (t.empty()) return std::nullopt;
  std::replace(t.begin(), t.end(), 'D', 'E');
  std::replace(t.begin(), t.end(), 'd', 'e');
  if (t[0] == '+') t.erase(0, 1);
  double v = 0;
  const auto [end, ec] = std::from_chars(t.data(), t.data() + t.size(), v);
  if (ec != std::errc() || end != t.data() + t.size() || !std::isfinite(v)) {
    ok = false;
    return std::nullopt;
  }
  return v;
}

int64_t DaysFromCivil(int y, int m, int d) {
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const int64_t yoe = y - era * 400;
  const int64_t doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
  const int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + doe - 719468;
}

constexpr int64_t kGpsOriginDays = 3657;  // 1980-01-06 in days since 1970-01-01

// UTC dates (year, month) from which GPS - UTC took each value 1 to 18.
constexpr int kLeapDates[][2] = {{1981, 7}, {1982, 7}, {1983, 7}, {1985, 7}, {1988, 1}, {1990, 1},
                                 {1991, 1}, {1992, 7}, {1993, 7}, {1994, 7}, {1996, 1}, {1997, 7},
                                 {1999, 1}, {2006, 1}, {2009, 1}, {2012, 7}, {2015, 7}, {2017, 1}};

}  // namespace

RinexError::RinexError(const std::string& file, int line, const std::string& what)
    : std::runtime_error(file + (line > 0 ? ":" + std::to_string(line) : std::string()) + ": " +
                         what),
      line_(line) {}

double SecondsSinceGpsOrigin(const RinexTime& t) {
  const int64_t days = DaysFromCivil(t.year, t.month, t.day) - kGpsOriginDays;
  return static_cast<double>(days) * 86400.0 + t.hour * 3600.0 + t.minute * 60.0 + t.second;
}

int LeapSecondsAt(double utc_seconds) {
  int leap = 0;
  for (const auto& d : kLeapDates) {
    const double from = SecondsSinceGpsOrigin({d[0], d[1], 1, 0, 0, 0});
    if (utc_seconds >= from) ++leap;
  }
  return leap;
}

int FullYear(int year) {
  if (year >= 100) return year;
  return year >= 80 ? 1900 + year : 2000 + year;
}

// ---------------------------------------------------------------------------------------------
// Observation files

RinexFile::RinexFile(const std::string& path) : path_(path), in_(path) {
  if (!in_) throw RinexError(path, 0, "cannot open the file");
}

bool RinexFile::GetLine(std::string& line) {
  if (!std::getline(in_, line)) return false;
  ++line_no_;
  if (!line.empty() && line.back() == '\r') line.pop_back();
  return true;
}

void RinexFile::Fail(const std::string& what) const {
  throw RinexError(path_, line_no_, what);
}

double RinexFile::ReadVersionLine(std::string& line) {
  if (!GetLine(line)) Fail("empty file");
  if (Label(line) != "RINEX VERSION / TYPE")
    Fail("not a RINEX file: RINEX VERSION / TYPE expected");
  bool ok = true;
  const auto version = Number(Column(line, 0, 9), ok);
  if (!version || !ok) Fail("unreadable RINEX version");
  if (*version < 2.0 || *version >= 4.0) Fail("unsupported RINEX version");
  return *version;
}

ObsReader::ObsReader(const std::string& path) : RinexFile(path) {
  ReadHeader();
}

void ObsReader::ReadHeader() {
  std::string line;
  header_.version = ReadVersionLine(line);
  if (Column(line, 20, 1) != "O") Fail("not an observation file");
  const std::string sys = Column(line, 40, 1);
  header_.system = sys.empty() || sys == " " ? 'G' : sys[0];
  int pending_types = 0;
  char types_system = ' ';
  while (true) {
    if (!GetLine(line)) Fail("END OF HEADER missing");
    if (Label(line) == "END OF HEADER") break;
    HeaderLine(line, pending_types, types_system);
  }
  if (pending_types > 0) Fail("observation types cut short");
  if (header_.types_v2.empty() && header_.types_v3.empty()) Fail("no observation types");
}

void ObsReader::HeaderLine(const std::string& line, int& pending_types, char& types_system) {
  const std::string label = Label(line);
  bool ok = true;
  if (label == "MARKER NAME") {
    header_.marker_name = Trim(Column(line, 0, 60));
  } else if (label == "OBSERVER / AGENCY") {
    header_.observer = Trim(Column(line, 0, 20));
    header_.agency = Trim(Column(line, 20, 40));
  } else if (label == "REC # / TYPE / VERS") {
    header_.receiver_number = Trim(Column(line, 0, 20));
    header_.receiver_type = Trim(Column(line, 20, 20));
    header_.receiver_version = Trim(Column(line, 40, 20));
  } else if (label == "APPROX POSITION XYZ") {
    std::array<double, 3> xyz{};
    for (int i = 0; i < 3; ++i) {
      const auto v = Number(Column(line, 14 * i, 14), ok);
      if (!ok || !v) Fail("unreadable APPROX POSITION XYZ");
      xyz[i] = *v;
    }
    header_.approx_position = xyz;
  } else if (label == "INTERVAL") {
    const auto v = Number(Column(line, 0, 10), ok);
    if (!ok) Fail("unreadable INTERVAL");
    header_.interval = v.value_or(0);
  } else if (label == "LEAP SECONDS") {
    const auto v = Number(Column(line, 0, 6), ok);
    if (!ok || !v) Fail("unreadable LEAP SECONDS");
    header_.leap_seconds = static_cast<int>(*v);
  } else if (label == "TIME OF FIRST OBS") {
    const std::string ts = Trim(Column(line, 48, 3));
    if (!ts.empty())
      header_.time_system = ts;
    else if (header_.system == 'R')
      header_.time_system = "GLO";
    else if (header_.system == 'E')
      header_.time_system = "GAL";
    else if (header_.system == 'C')
      header_.time_system = "BDT";
  } else if (label == "# / TYPES OF OBSERV") {
    if (pending_types == 0) {
      const auto n = Number(Column(line, 0, 6), ok);
      if (!ok || !n || *n < 0) Fail("unreadable number of observation types");
      pending_types = static_cast<int>(*n);
      header_.types_v2.clear();
      translated_.clear();
    }
    for (int i = 0; i < 9 && pending_types > 0; ++i, --pending_types) {
      const std::string t = Trim(Column(line, 6 + 6 * i, 6));
      if (t.empty()) Fail("observation type missing");
      header_.types_v2.push_back(t);
    }
  } else if (label == "SYS / # / OBS TYPES") {
    if (pending_types == 0) {
      const std::string s = Column(line, 0, 1);
      if (s.empty() || s == " ") Fail("system letter of SYS / # / OBS TYPES missing");
      types_system = s[0];
      const auto n = Number(Column(line, 3, 3), ok);
      if (!ok || !n || *n < 0) Fail("unreadable number of observation types");
      pending_types = static_cast<int>(*n);
      header_.types_v3[types_system].clear();
      translated_.erase(types_system);
    }
    for (int i = 0; i < 13 && pending_types > 0; ++i, --pending_types) {
      const std::string t = Trim(Column(line, 7 + 4 * i, 3));
      if (t.size() != 3) Fail("observation type missing");
      header_.types_v3[types_system].push_back(t);
    }
  }
}

std::string TranslateV2Type(const std::string& type, char system,
                            const std::vector<std::string>& all) {
  if (type.size() != 2) return {};
  const char kind = type[0];
  const char band = type[1];
  auto has = [&](const char* t) { return std::find(all.begin(), all.end(), t) != all.end(); };
  const bool gps_like = system == 'G' || system == 'J';
  if (kind == 'P') {  // P code: GPS and GLONASS L1 and L2
    if ((gps_like || system == 'R') && (band == '1' || band == '2'))
      return std::string("C") + band + "P";
    return {};
  }
  if (kind != 'C' && kind != 'L' && kind != 'S') return {};
  // The attribute of the code a version 2 type stands for.
  std::string attr;
  switch (system) {
    case 'G':
    case 'J':
      attr = band == '1' ? "C" : band == '2' ? "X" : band == '5' ? "X" : "";
      break;
    case 'R':
      attr = band == '1' || band == '2' ? "C" : "";
      break;
    case 'S':
      attr = band == '1' ? "C" : band == '5' ? "X" : "";
      break;
    case 'E':
      attr = std::string("15678").find(band) != std::string::npos ? "X" : "";
      break;
    case 'C':
      attr = band == '2' || band == '6' || band == '7' ? "I" : "";
      break;
    default:
      break;
  }
  if (attr.empty()) return {};
  // A phase or strength on L1 or L2 goes with the P code when the file has no C/A code on that
  // band (L1) or has the P code there (L2): version 2 receivers track the L2 carrier with P.
  if (kind != 'C' && (gps_like || system == 'R')) {
    if (band == '1' && !has("C1") && has("P1")) attr = "P";
    if (band == '2' && has("P2")) attr = "P";
  }
  return std::string(1, kind) + band + attr;
}

const std::vector<std::string>& ObsReader::TypesOf(char system) {
  auto it = translated_.find(system);
  if (it != translated_.end()) return it->second;
  std::vector<std::string>& out = translated_[system];
  if (header_.version < 3.0) {
    for (const std::string& t : header_.types_v2)
      out.push_back(TranslateV2Type(t, system, header_.types_v2));
  } else {
    const auto v3 = header_.types_v3.find(system);
    if (v3 != header_.types_v3.end()) out = v3->second;
  }
  return out;
}

void ObsReader::SkipLines(int count) {
  std::string line;
  for (int i = 0; i < count; ++i)
    if (!GetLine(line)) Fail("file ends inside an event record");
}

// The observation fields of one satellite: 16 columns each (value F14.3, LLI, strength).
// Version 2 writes five per line, version 3 all of them on the satellite's line.
void ObsReader::ReadSatValues(SatObservations& sat, const std::string& first, bool v3) {
  size_t n = header_.types_v2.size();
  if (v3) {
    const auto it = header_.types_v3.find(sat.system);
    n = it == header_.types_v3.end() ? 0 : it->second.size();
  }
  sat.values.assign(n, ObsValue{});
  std::string line = first;
  size_t base = v3 ? 3 : 0;
  for (size_t i = 0; i < n; ++i) {
    if (!v3 && i > 0 && i % 5 == 0) {
      if (!GetLine(line)) Fail("file ends inside an epoch");
      if (line.size() > 80 || (!line.empty() && line[0] == '>')) Fail("observation line expected");
    }
    const size_t at = base + 16 * (v3 ? i : i % 5);
    bool ok = true;
    const auto v = Number(Column(line, at, 14), ok);
    if (!ok) Fail("unreadable observation value");
    ObsValue& o = sat.values[i];
    o.present = v.has_value() && *v != 0.0;
    o.value = v.value_or(0);
    const std::string lli = Column(line, at + 14, 1);
    const std::string ss = Column(line, at + 15, 1);
    if (!lli.empty() && lli[0] >= '0' && lli[0] <= '9') o.lli = static_cast<uint8_t>(lli[0] - '0');
    if (!ss.empty() && ss[0] >= '0' && ss[0] <= '9') o.strength = static_cast<uint8_t>(ss[0] - '0');
  }
}

static bool ParseSatId(const std::string& id, char default_system, char& system, unsigned& number) {
  if (id.size() != 3) return false;
  system = id[0] == ' ' ? default_system : id[0];
  const char* b = id.data() + 1;
  while (*b == ' ')
    ++b;
  unsigned n = 0;
  const auto [end, ec] = std::from_chars(b, id.data() + 3, n);
  if (ec != std::errc() || end != id.data() + 3) return false;
  number = n;
  return true;
}

bool ObsReader::Next(ObsEpoch& epoch) {
  return header_.version < 3.0 ? NextV2(epoch) : NextV3(epoch);
}

bool ObsReader::NextV2(ObsEpoch& epoch) {
  std::string line;
  while (true) {
    do {
      if (!GetLine(line)) return false;
    } while (Trim(line).empty());
    epoch = ObsEpoch{};
    epoch.line = line_no_;
    bool ok = true, ok_count = true;
    const auto flag = Number(Column(line, 26, 3), ok);
    const auto count = Number(Column(line, 29, 3), ok_count);
    if (!ok || !ok_count || !count || *count < 0) Fail("epoch line expected");
    epoch.flag = static_cast<int>(flag.value_or(0));
    if (epoch.flag >= 2 && epoch.flag <= 5) {
      if (epoch.flag == 4) {
        int pending = 0;
        char sys = ' ';
        for (int i = 0; i < static_cast<int>(*count); ++i) {
          if (!GetLine(line)) Fail("file ends inside an event record");
          HeaderLine(line, pending, sys);
        }
      } else {
        SkipLines(static_cast<int>(*count));
      }
      continue;
    }
    if (epoch.flag > 6 || epoch.flag < 0) Fail("unknown epoch flag");
    int fields[5];
    for (int i = 0; i < 5; ++i) {
      const auto v = Number(Column(line, 1 + 3 * i, 2), ok);
      if (!ok || !v) Fail("unreadable epoch time");
      fields[i] = static_cast<int>(*v);
    }
    const auto sec = Number(Column(line, 15, 11), ok);
    if (!ok || !sec) Fail("unreadable epoch time");
    epoch.time = {FullYear(fields[0]), fields[1], fields[2], fields[3], fields[4], *sec};
    const int n = static_cast<int>(*count);
    std::vector<std::string> ids;
    std::string list_line = line;
    for (int i = 0; i < n; ++i) {
      if (i > 0 && i % 12 == 0 && !GetLine(list_line)) Fail("file ends inside an epoch");
      const std::string id = Column(list_line, 32 + 3 * (i % 12), 3);
      if (id.size() != 3) Fail("satellite list cut short");
      ids.push_back(id);
    }
    for (const std::string& id : ids) {
      SatObservations sat;
      if (!ParseSatId(id, header_.system == 'M' ? 'G' : header_.system, sat.system, sat.number))
        Fail("unreadable satellite " + id);
      if (!GetLine(line)) Fail("file ends inside an epoch");
      if (line.size() > 80) Fail("observation line expected");
      ReadSatValues(sat, line, false);
      epoch.sats.push_back(std::move(sat));
    }
    if (epoch.flag == 6) continue;
    return true;
  }
}

bool ObsReader::NextV3(ObsEpoch& epoch) {
  std::string line;
  while (true) {
    do {
      if (!GetLine(line)) return false;
    } while (Trim(line).empty());
    if (line[0] != '>') Fail("epoch line expected");
    epoch = ObsEpoch{};
    epoch.line = line_no_;
    bool ok = true, ok_count = true;
    const auto flag = Number(Column(line, 29, 3), ok);
    const auto count = Number(Column(line, 32, 3), ok_count);
    if (!ok || !ok_count || !count || *count < 0) Fail("unreadable epoch line");
    epoch.flag = static_cast<int>(flag.value_or(0));
    const int n = static_cast<int>(*count);
    if (epoch.flag >= 2 && epoch.flag <= 5) {
      if (epoch.flag == 4) {
        int pending = 0;
        char sys = ' ';
        for (int i = 0; i < n; ++i) {
          if (!GetLine(line)) Fail("file ends inside an event record");
          HeaderLine(line, pending, sys);
        }
      } else {
        SkipLines(n);
      }
      continue;
    }
    if (epoch.flag > 6 || epoch.flag < 0) Fail("unknown epoch flag");
    const int starts[5] = {2, 7, 10, 13, 16};
    const int widths[5] = {4, 2, 2, 2, 2};
    int fields[5];
    for (int i = 0; i < 5; ++i) {
      const auto v = Number(Column(line, starts[i], widths[i]), ok);
      if (!ok || !v) Fail("unreadable epoch time");
      fields[i] = static_cast<int>(*v);
    }
    const auto sec = Number(Column(line, 18, 11), ok);
    if (!ok || !sec) Fail("unreadable epoch time");
    epoch.time = {fields[0], fields[1], fields[2], fields[3], fields[4], *sec};
    for (int i = 0; i < n; ++i) {
      if (!GetLine(line)) Fail("file ends inside an epoch");
      if (!line.empty() && line[0] == '>') Fail("satellite line expected");
      SatObservations sat;
      if (!ParseSatId(Column(line, 0, 3), header_.system, sat.system, sat.number))
        Fail("unreadable satellite");
      ReadSatValues(sat, line, true);
      epoch.sats.push_back(std::move(sat));
    }
    if (epoch.flag == 6) continue;
    return true;
  }
}

// ---------------------------------------------------------------------------------------------
// Navigation files

NavReader::NavReader(const std::string& path) : RinexFile(path) {
  ReadHeader();
}

void NavReader::ReadHeader() {
  std::string line;
  header_.version = ReadVersionLine(line);
  const std::string type = Column(line, 20, 1);
  if (header_.version < 3.0) {
    // Version 2 names the system by the file type: N GPS, G GLONASS, H SBAS (geostationary).
    if (type == "N")
      header_.system = 'G';
    else if (type == "G")
      header_.system = 'R';
    else if (type == "H")
      header_.system = 'S';
    else
      Fail("not a navigation file");
  } else {
    if (type != "N") Fail("not a navigation file");
    const std::string sys = Column(line, 40, 1);
    header_.system = sys.empty() || sys == " " ? 'G' : sys[0];
  }
  while (true) {
    if (!GetLine(line)) Fail("END OF HEADER missing");
    const std::string label = Label(line);
    if (label == "END OF HEADER") break;
    if (label == "LEAP SECONDS") {
      bool ok = true;
      const auto v = Number(Column(line, 0, 6), ok);
      if (!ok || !v) Fail("unreadable LEAP SECONDS");
      header_.leap_seconds = static_cast<int>(*v);
    }
  }
}

// Lines after the first line of a record: GLONASS and SBAS records are short (GLONASS gained
// a line in 3.05); every Keplerian system (GPS, QZSS, Galileo, BDS, IRNSS) writes seven.
int NavReader::OrbitLines(char system) const {
  if (system == 'R') return header_.version >= 3.05 ? 4 : 3;
  if (system == 'S') return 3;
  return 7;
}

bool NavReader::Next(NavRecord& record) {
  std::string line;
  do {
    if (!GetLine(line)) return false;
  } while (Trim(line).empty());
  record = NavRecord{};
  record.line = line_no_;
  const bool v3 = header_.version >= 3.0;
  bool ok = true;
  size_t values_at = 0;
  if (v3) {
    if (!ParseSatId(Column(line, 0, 3), header_.system, record.system, record.number))
      Fail("unreadable satellite");
    const int starts[5] = {4, 9, 12, 15, 18};
    const int widths[5] = {4, 2, 2, 2, 2};
    int f[5];
    for (int i = 0; i < 5; ++i) {
      const auto v = Number(Column(line, starts[i], widths[i]), ok);
      if (!ok || !v) Fail("unreadable time of clock");
      f[i] = static_cast<int>(*v);
    }
    const auto sec = Number(Column(line, 21, 2), ok);
    if (!ok || !sec) Fail("unreadable time of clock");
    record.toc = {f[0], f[1], f[2], f[3], f[4], *sec};
    values_at = 23;
  } else {
    record.system = header_.system;
    const auto prn = Number(Column(line, 0, 2), ok);
    if (!ok || !prn) Fail("unreadable satellite number");
    record.number = static_cast<unsigned>(*prn);
    int f[5];
    for (int i = 0; i < 5; ++i) {
      const auto v = Number(Column(line, 3 + 3 * i, 2), ok);
      if (!ok || !v) Fail("unreadable time of clock");
      f[i] = static_cast<int>(*v);
    }
    const auto sec = Number(Column(line, 17, 5), ok);
    if (!ok || !sec) Fail("unreadable time of clock");
    record.toc = {FullYear(f[0]), f[1], f[2], f[3], f[4], *sec};
    values_at = 22;
  }
  for (int i = 0; i < 3; ++i) {
    const auto v = Number(Column(line, values_at + 19 * i, 19), ok);
    if (!ok) Fail("unreadable number");
    record.values.push_back(v.value_or(0));
  }
  const int lines = OrbitLines(record.system);
  const size_t orbit_at = v3 ? 4 : 3;
  for (int l = 0; l < lines; ++l) {
    // A line may end early (its missing fields read as 0), but it must be there.
    if (!GetLine(line)) Fail("file ends inside a navigation record");
    for (int i = 0; i < 4; ++i) {
      const auto v = Number(Column(line, orbit_at + 19 * i, 19), ok);
      if (!ok) Fail("unreadable number");
      record.values.push_back(v.value_or(0));
    }
  }
  return true;
}

}  // namespace voxtools::rinex
