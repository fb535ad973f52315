#include "demo_report.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <sstream>

namespace voxdemo {

namespace {

using vox::tools::FanRec;
using vox::tools::MessageRec;
using vox::tools::OccupationRec;
using vox::tools::RayRec;
using vox::tools::ReadResult;
using vox::tools::VectorRec;

// Message types of the engines' warnings and errors (message flags 2 and 3).
constexpr uint32_t kWarningType = 4, kErrorType = 5;

double Distance(const double (&a)[3], const double (&b)[3]) {
  double s = 0;
  for (int c = 0; c < 3; ++c)
    s += (a[c] - b[c]) * (a[c] - b[c]);
  return std::sqrt(s);
}

// The truth station whose mark lies nearest p, and how far.
std::pair<std::string, double> Nearest(const Truth& truth, const double (&p)[3]) {
  std::pair<std::string, double> best{"", 1e300};
  for (const auto& [name, mark] : truth.marks) {
    const double d = Distance(mark.v, p);
    if (d < best.second) best = {name, d};
  }
  return best;
}

const char* KindOf(uint32_t flags) {
  switch (flags & 3u) {
    case 1:
      return "fixed";
    case 2:
      return "float";
    case 3:
      return "code";
    default:
      return "unknown";
  }
}

std::string Format(const char* format, auto... args) {
  char text[400];
  std::snprintf(text, sizeof text, format, args...);
  return text;
}

void ReportVector(const VectorRec& v, const Truth& truth, std::ostream& out) {
  if ((v.flags & 0x80000000u) == 0) {
    out << Format("  vector %u: no solution (see the messages)\n", v.number);
    return;
  }
  const double length = std::sqrt(v.baseline[0] * v.baseline[0] + v.baseline[1] * v.baseline[1] +
                                  v.baseline[2] * v.baseline[2]);
  out << Format(
      "  vector %u: %s, dX %.4f dY %.4f dZ %.4f m (length %.4f m), rms %.4f m, "
      "%u epochs\n",
      v.number, KindOf(v.flags), v.baseline[0], v.baseline[1], v.baseline[2], length, v.value_96,
      v.values_80[1]);
  double end[3];
  for (int c = 0; c < 3; ++c)
    end[c] = v.base[c] + v.baseline[c];
  const auto from = Nearest(truth, v.base);
  const auto to = Nearest(truth, end);
  if (from.first.empty() || from.first == to.first) return;
  const Xyz& a = truth.marks.at(from.first);
  const Xyz& b = truth.marks.at(to.first);
  double d[3];
  for (int c = 0; c < 3; ++c)
    d[c] = v.baseline[c] - (b.v[c] - a.v[c]);
  out << Format("            truth %s -> %s: difference %.4f m (dX %.4f dY %.4f dZ %.4f)\n",
                from.first.c_str(), to.first.c_str(),
                std::sqrt(d[0] * d[0] + d[1] * d[1] + d[2] * d[2]), d[0], d[1], d[2]);
}

void ReportFan(const FanRec& f, const std::vector<RayRec>& rays, const Truth& truth,
               std::ostream& out) {
  size_t kinds[4] = {}, matched = 0;
  double sum2 = 0, worst = 0;
  std::vector<double> errors;
  for (const RayRec& r : rays) {
    if (r.fan != f.number) continue;
    ++kinds[r.flags & 3u];
    const auto t = truth.track.find(std::llround(r.time.gps_seconds() * 1000.0));
    if (t == truth.track.end()) continue;
    double p[3];
    for (int c = 0; c < 3; ++c)
      p[c] = f.position[c] + r.offset[c];
    const double e = Distance(p, t->second.v);
    errors.push_back(e);
    sum2 += e * e;
    worst = std::max(worst, e);
    ++matched;
  }
  const size_t count = kinds[0] + kinds[1] + kinds[2] + kinds[3];
  out << Format("  fan %u: %zu rays (%zu fixed, %zu float, %zu code)\n", f.number, count, kinds[1],
                kinds[2], kinds[3]);
  if (matched == 0) return;
  std::nth_element(errors.begin(), errors.begin() + errors.size() / 2, errors.end());
  out << Format(
      "            error against the track (%zu rays): rms %.4f m, median %.4f m, "
      "max %.4f m\n",
      matched, std::sqrt(sum2 / matched), errors[errors.size() / 2], worst);
}

void ReportOccupation(const OccupationRec& o, const Truth& truth, std::ostream& out) {
  const bool has_nav = o.nav[0] != 0 || o.nav[1] != 0 || o.nav[2] != 0;
  std::string line = Format("  occupation %u (%s): ", o.occupation,
                            o.point_name.empty() ? "no point" : o.point_name.c_str());
  if (!has_nav) {
    out << line << "no navigation position\n";
    return;
  }
  line += Format("navigation position %.3f %.3f %.3f (sigma %.2f %.2f %.2f m)", o.nav[0], o.nav[1],
                 o.nav[2], o.nav_sigma[0], o.nav_sigma[1], o.nav_sigma[2]);
  const auto mark = truth.marks.find(o.point_name);
  if (mark != truth.marks.end())
    line += Format(", %.2f m from the true mark", Distance(mark->second.v, o.nav));
  out << line << "\n";
}

void ReportNmea(const std::string& path, std::ostream& out) {
  std::ifstream in(path);
  if (!in) {
    out << "  " << path << ": not written\n";
    return;
  }
  size_t fixes = 0;
  for (std::string line; std::getline(in, line);)
    fixes += line.rfind("$GPGGA", 0) == 0;
  out << Format("  %s: %zu fixes\n", path.c_str(), fixes);
}

}  // namespace

bool ReadTruth(const std::string& path, Truth& truth) {
  std::ifstream in(path);
  if (!in) return false;
  for (std::string line; std::getline(in, line);) {
    std::istringstream words(line);
    std::string kind;
    words >> kind;
    if (kind == "station") {
      std::string name;
      Xyz mark;
      if (words >> name >> mark.v[0] >> mark.v[1] >> mark.v[2]) truth.marks[name] = mark;
    } else if (kind == "kinematic") {
      double t;
      Xyz p;
      if (words >> t >> p.v[0] >> p.v[1] >> p.v[2]) truth.track[std::llround(t * 1000.0)] = p;
    }
  }
  return true;
}

bool Report(const ReadResult& result, const Truth& truth,
            const std::vector<std::string>& nmea_files, std::ostream& out) {
  std::vector<VectorRec> vectors;
  std::vector<FanRec> fans;
  std::vector<RayRec> rays;
  std::vector<OccupationRec> occupations;
  std::vector<std::string> problems;
  for (const auto& r : result.records) {
    if (const auto* v = std::get_if<VectorRec>(&r.body)) vectors.push_back(*v);
    if (const auto* f = std::get_if<FanRec>(&r.body)) fans.push_back(*f);
    if (const auto* ray = std::get_if<RayRec>(&r.body)) rays.push_back(*ray);
    if (const auto* o = std::get_if<OccupationRec>(&r.body)) occupations.push_back(*o);
    if (const auto* m = std::get_if<MessageRec>(&r.body))
      if ((m->type & 0xF) == kWarningType || (m->type & 0xF) == kErrorType)
        problems.push_back(m->text);
  }
  out << "occupations (raw filter)\n";
  if (occupations.empty()) out << "  none\n";
  for (const auto& o : occupations)
    ReportOccupation(o, truth, out);
  out << "vectors (static engine)\n";
  if (vectors.empty()) out << "  none\n";
  for (const auto& v : vectors)
    ReportVector(v, truth, out);
  out << "fans (kinematic engine)\n";
  if (fans.empty()) out << "  none\n";
  for (const auto& f : fans)
    ReportFan(f, rays, truth, out);
  if (!nmea_files.empty()) out << "NMEA files\n";
  for (const auto& path : nmea_files)
    ReportNmea(path, out);
  if (!problems.empty()) out << "warnings and errors\n";
  for (const auto& text : problems)
    out << "  " << text << "\n";
  if (result.fault) {
    out << Format("result file fault at offset %llu: %s\n",
                  static_cast<unsigned long long>(result.fault->offset),
                  result.fault->what.c_str());
    return false;
  }
  return true;
}

}  // namespace voxdemo
