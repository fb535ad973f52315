#include "realdata.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <sstream>
#include <stdexcept>

#include "raw/scan.h"

namespace vox::test {

namespace fs = std::filesystem;

namespace {

std::string Cut(const std::string& line, size_t at, size_t n) {
  return at >= line.size() ? std::string() : line.substr(at, n);
}

bool Blank(const std::string& s) {
  return s.find_first_not_of(' ') == std::string::npos;
}

double Num(std::string s) {
  std::replace(s.begin(), s.end(), 'D', 'E');
  return std::strtod(s.c_str(), nullptr);
}

std::string Quote(const std::string& s) {
  std::string q = "'";
  for (char c : s)
    q += c == '\'' ? std::string("'\\''") : std::string(1, c);
  return q + "'";
}

}  // namespace

std::string GnssDir() {
  const std::string dir = std::string(VOX_SHARED_DIR) + "/data/gnss";
  return fs::exists(dir + "/07590920.05o") ? dir : std::string();
}

ToolRun RunVoxraw(const std::vector<std::string>& args, const std::string& scratch) {
  std::string command = Quote(VOXRAW_PATH);
  for (const std::string& a : args)
    command += " " + Quote(a);
  const std::string out = scratch + "/voxraw.out", err = scratch + "/voxraw.err";
  command += " >" + Quote(out) + " 2>" + Quote(err);
  ToolRun r;
  const int status = std::system(command.c_str());
  r.exit_code = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  r.out = ReadFile(out);
  r.err = ReadFile(err);
  fs::remove(out);
  fs::remove(err);
  return r;
}

Converted::Converted(const std::string& obs, const std::vector<std::string>& navs,
                     const std::vector<std::string>& options) {
  path = scratch.File("out.raw");
  std::vector<std::string> args = {"from-rinex", obs};
  args.insert(args.end(), navs.begin(), navs.end());
  args.insert(args.end(), {"-o", path});
  args.insert(args.end(), options.begin(), options.end());
  run = RunVoxraw(args, scratch.path().string());
  if (run.exit_code != 0) return;
  file = std::make_unique<TChainItem>(1, path, false, false);
  occupation = std::make_unique<TOccupItem>(1);
  occupation->SetFile(file.get());
  ScanSinks sinks;
  sinks.ephemerides = &ephemerides;
  sinks.log.write = [](void*, const char*) {};
  status = ScanFile(*file, sinks);
}

double GpsSeconds(int y, int m, int d, int hour, int minute, double second) {
  // Days from 1980-01-06, counted by the civil calendar.
  auto days = [](int yy, int mm, int dd) {
    yy -= mm <= 2;
    const long era = yy / 400;
    const long yoe = yy - era * 400;
    const long doy = (153 * (mm + (mm > 2 ? -3 : 9)) + 2) / 5 + dd - 1;
    return era * 146097 + yoe * 365 + yoe / 4 - yoe / 100 + doy;
  };
  return (days(y, m, d) - days(1980, 1, 6)) * 86400.0 + hour * 3600.0 + minute * 60.0 + second;
}

double Distance(const std::array<double, 3>& a, const std::array<double, 3>& b) {
  return std::sqrt((a[0] - b[0]) * (a[0] - b[0]) + (a[1] - b[1]) * (a[1] - b[1]) +
                   (a[2] - b[2]) * (a[2] - b[2]));
}

const std::vector<std::string>& TextObs::TypesOf(char system) const {
  for (const auto& [s, list] : types_v3)
    if (s == system) return list;
  return types;
}

TextObs ReadTextObs(const std::string& path, size_t max_epochs) {
  const std::vector<std::string> lines = FileLines(path);
  TextObs obs;
  const bool v3 = Num(Cut(lines.at(0), 0, 9)) >= 3.0;
  size_t i = 1;
  char v3_system = ' ';
  int pending = 0;
  for (; i < lines.size(); ++i) {
    const std::string& l = lines[i];
    const std::string label = Cut(l, 60, 20);
    if (label.rfind("END OF HEADER", 0) == 0) break;
    if (label.rfind("APPROX POSITION XYZ", 0) == 0)
      obs.position = {{Num(Cut(l, 0, 14)), Num(Cut(l, 14, 14)), Num(Cut(l, 28, 14))}};
    if (label.rfind("# / TYPES OF OBSERV", 0) == 0) {
      if (pending == 0) pending = std::atoi(Cut(l, 0, 6).c_str());
      for (int k = 0; k < 9 && pending > 0; ++k, --pending)
        obs.types.push_back(Cut(l, 10 + 6 * k, 2));
    }
    if (label.rfind("SYS / # / OBS TYPES", 0) == 0) {
      if (pending == 0) {
        v3_system = l[0];
        pending = std::atoi(Cut(l, 3, 3).c_str());
        obs.types_v3.push_back({v3_system, {}});
      }
      for (int k = 0; k < 13 && pending > 0; ++k, --pending)
        obs.types_v3.back().second.push_back(Cut(l, 7 + 4 * k, 3));
    }
  }
  ++i;
  while (i < lines.size() && obs.epochs.size() < max_epochs) {
    const std::string& l = lines[i++];
    TextEpoch e{};
    int count = 0;
    std::vector<std::string> ids;
    // Event epochs (flags 2 to 5) carry that many lines of their own, not observations.
    const int flag = std::atoi(Cut(l, v3 ? 31 : 28, 1).c_str());
    if (flag >= 2 && flag <= 5) {
      i += std::atoi(Cut(l, v3 ? 32 : 29, 3).c_str());
      continue;
    }
    if (v3) {
      e.year = std::atoi(Cut(l, 2, 4).c_str());
      e.month = std::atoi(Cut(l, 7, 2).c_str());
      e.day = std::atoi(Cut(l, 10, 2).c_str());
      e.hour = std::atoi(Cut(l, 13, 2).c_str());
      e.minute = std::atoi(Cut(l, 16, 2).c_str());
      e.second = Num(Cut(l, 18, 11));
      count = std::atoi(Cut(l, 32, 3).c_str());
    } else {
      e.year = 2000 + std::atoi(Cut(l, 1, 2).c_str());
      e.month = std::atoi(Cut(l, 4, 2).c_str());
      e.day = std::atoi(Cut(l, 7, 2).c_str());
      e.hour = std::atoi(Cut(l, 10, 2).c_str());
      e.minute = std::atoi(Cut(l, 13, 2).c_str());
      e.second = Num(Cut(l, 15, 11));
      count = std::atoi(Cut(l, 29, 3).c_str());
      std::string list = l;
      for (int k = 0; k < count; ++k) {
        if (k > 0 && k % 12 == 0) list = lines[i++];
        ids.push_back(Cut(list, 32 + 3 * (k % 12), 3));
      }
    }
    for (int k = 0; k < count; ++k) {
      TextSat s;
      std::string line = lines[i++];
      const std::string id = v3 ? Cut(line, 0, 3) : ids[k];
      s.system = id[0] == ' ' ? 'G' : id[0];
      s.number = std::atoi(id.substr(1).c_str());
      const std::vector<std::string>& types = obs.TypesOf(s.system);
      for (size_t t = 0; t < types.size(); ++t) {
        if (!v3 && t > 0 && t % 5 == 0) line = lines[i++];
        const std::string f = Cut(line, (v3 ? 3 : 0) + 16 * (v3 ? t : t % 5), 14);
        if (Blank(f) || Num(f) == 0.0)
          s.values.push_back(std::nullopt);
        else
          s.values.push_back(Num(f));
      }
      e.sats.push_back(s);
    }
    obs.epochs.push_back(e);
  }
  return obs;
}

std::vector<TextNav> ReadTextNavV2(const std::string& path) {
  const std::vector<std::string> lines = FileLines(path);
  size_t i = 0;
  while (i < lines.size() && Cut(lines[i], 60, 13) != "END OF HEADER")
    ++i;
  ++i;
  std::vector<TextNav> out;
  while (i + 8 <= lines.size()) {
    const std::string& l = lines[i];
    TextNav n{};
    n.prn = std::atoi(Cut(l, 0, 2).c_str());
    n.year = 2000 + std::atoi(Cut(l, 3, 2).c_str());
    n.month = std::atoi(Cut(l, 6, 2).c_str());
    n.day = std::atoi(Cut(l, 9, 2).c_str());
    n.hour = std::atoi(Cut(l, 12, 2).c_str());
    n.minute = std::atoi(Cut(l, 15, 2).c_str());
    n.second = Num(Cut(l, 17, 5));
    for (int k = 0; k < 3; ++k)
      n.v[k] = Num(Cut(l, 22 + 19 * k, 19));
    for (int r = 1; r <= 7; ++r)
      for (int k = 0; k < 4; ++k)
        n.v[3 + 4 * (r - 1) + k] = Num(Cut(lines[i + r], 3 + 19 * k, 19));
    out.push_back(n);
    i += 8;
  }
  return out;
}

std::vector<TextSp3Sample> ReadTextSp3(const std::string& path) {
  std::vector<TextSp3Sample> out;
  TextSp3Sample epoch{};
  for (const std::string& l : FileLines(path)) {
    if (l.rfind("* ", 0) == 0) {
      epoch.year = std::atoi(Cut(l, 3, 4).c_str());
      epoch.month = std::atoi(Cut(l, 8, 2).c_str());
      epoch.day = std::atoi(Cut(l, 11, 2).c_str());
      epoch.hour = std::atoi(Cut(l, 14, 2).c_str());
      epoch.minute = std::atoi(Cut(l, 17, 2).c_str());
      epoch.second = Num(Cut(l, 20, 11));
    } else if (!l.empty() && l[0] == 'P') {
      TextSp3Sample s = epoch;
      s.system = l[1] == ' ' ? 'G' : l[1];
      s.number = std::atoi(Cut(l, 2, 2).c_str());
      s.x = Num(Cut(l, 4, 14));
      s.y = Num(Cut(l, 18, 14));
      s.z = Num(Cut(l, 32, 14));
      s.clock = Num(Cut(l, 46, 14));
      out.push_back(s);
    }
  }
  return out;
}

}  // namespace vox::test
