// The reference raw filter: once per occupation, single-point positions from the broadcast
// GPS ephemerides, epoch by epoch (ionosphere-free code when both frequencies are there,
// else L1 code with the group delay), then the occupation's navigation coordinates as the
// mean of those positions. Along the way it writes an NMEA fix per epoch (vox drops them
// when the occupation has no GGAPath), reports progress and leaves a plot of the residuals.
//
// Navigation coordinates are stored for the mark: the antenna offsets of the occupation are
// taken off, because vox folds them into the point's navigation mean.
//
// Threads: vox may call _eng_ProcessOccupation on several threads at once; each call works
// on its own objects and writes through its own context. The stop request is shared.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <exception>
#include <map>
#include <string>
#include <vector>

#include "broadcast.h"
#include "combinations.h"
#include "dop.h"
#include "point_solution.h"
#include "sdk_io.h"

namespace {

using namespace voxeng;
using io::kError;
using io::kInfo;
using io::kWarning;

io::StopRequest g_stop;
std::atomic<int> g_running{0};

// Epoch positions are correlated over minutes (multipath, atmosphere), so the mean of an
// occupation improves with its length in such blocks, not with its epoch count.
constexpr double kCorrelationSeconds = 300.0;

struct EpochFix {
  double t = 0;
  Vec3 antenna{};
  std::vector<std::pair<int, double>> residuals;  // prn, m
  bool iono_free = false;
};

std::string Label(const io::Occupation& o) {
  char text[96];
  std::snprintf(text, sizeof text, "occupation %u (%s)", o.id & 0xFFFFFFu, o.name.c_str());
  return text;
}

// One epoch's single-point position; false when the epoch cannot be solved.
bool SolveEpoch(const io::EpochObs& epoch, const io::Ephemerides& eph, const Vec3& start,
                EpochFix& fix, PointSolution& sol) {
  std::vector<RangeObservation> obs;
  obs.reserve(epoch.sats.size());
  bool all_dual = true;
  for (const auto& s : epoch.sats)
    if (eph.Find(s.prn, epoch.t) && s.p2 == 0) all_dual = false;
  for (const auto& s : epoch.sats) {
    const vox_GpsOrbitParams* orbit = eph.Find(s.prn, epoch.t);
    if (orbit == nullptr) continue;
    // One combination for the whole epoch: mixing them would bias the clock estimate.
    if (all_dual)
      obs.push_back({s.prn, orbit, IonoFree(s.p1, s.p2), true});
    else
      obs.push_back({s.prn, orbit, s.p1, false});
  }
  PointOptions options;
  options.initial = start;
  sol = SolvePoint(epoch.t, obs, options);
  if (!sol.ok) return false;
  fix.t = epoch.t;
  fix.antenna = sol.position;
  fix.iono_free = all_dual;
  for (size_t k = 0; k < obs.size(); ++k)
    if (sol.residuals[k] != 0) fix.residuals.emplace_back(obs[k].sat, sol.residuals[k]);
  return true;
}

double EpochHdop(const io::EpochObs& epoch, const io::Ephemerides& eph, const Vec3& at) {
  std::vector<Vec3> sats;
  for (const auto& s : epoch.sats)
    if (const vox_GpsOrbitParams* orbit = eph.Find(s.prn, epoch.t))
      sats.push_back(EvaluateBroadcast(*orbit, epoch.t).position);
  return Hdop(at, sats, 10.0 * kDeg);
}

void WriteNmea(void* stream, const io::EpochObs& epoch, const Vec3& mark, int used, double hdop) {
  vox_NavSolutionData nav;
  std::memset(&nav, 0, sizeof nav);
  nav.seconds = epoch.time.seconds;
  nav.ms = epoch.time.ms;
  nav.sat_count = static_cast<uint32_t>(used);
  nav.x = mark[0];
  nav.y = mark[1];
  nav.z = mark[2];
  nav.hdop = hdop;
  vox_SetEpochNavSolutionEx(stream, &nav);
}

// Mean of the epoch positions with the covariance of that mean; positions more than four
// spreads (and 10 m) from a first mean are left out as blunders.
bool MeanOf(const std::vector<EpochFix>& fixes, double span, Vec3& mean, SymMatrix& cov,
            size_t& used) {
  std::vector<const EpochFix*> kept;
  for (const auto& f : fixes)
    kept.push_back(&f);
  for (int pass = 0; pass < 2; ++pass) {
    if (kept.empty()) return false;
    mean = {0, 0, 0};
    for (const EpochFix* f : kept)
      mean = mean + (1.0 / kept.size()) * f->antenna;
    double spread2 = 0;
    for (const EpochFix* f : kept) {
      const double d = Norm(f->antenna - mean);
      spread2 += d * d / kept.size();
    }
    const double limit = std::max(10.0, 4.0 * std::sqrt(spread2));
    if (pass == 0)
      std::erase_if(kept, [&](const EpochFix* f) { return Norm(f->antenna - mean) > limit; });
  }
  used = kept.size();
  cov = SymMatrix(3);
  for (const EpochFix* f : kept) {
    const Vec3 d = f->antenna - mean;
    for (int r = 0; r < 3; ++r)
      for (int c = 0; c < 3; ++c)
        cov(r, c) += d[r] * d[c] / std::max<size_t>(1, used - 1);
  }
  const double blocks =
      std::clamp(span / kCorrelationSeconds + 1.0, 1.0, static_cast<double>(used));
  // A single epoch's spread says nothing: give it a code solution's metre or so.
  const double floor = used > 1 ? 0.0 : 1.0;
  for (int r = 0; r < 3; ++r)
    for (int c = 0; c < 3; ++c)
      cov(r, c) = cov(r, c) / blocks + (r == c ? floor : 0.0);
  return true;
}

void StoreNavCoord(const io::Occupation& o, const Vec3& mark, const SymMatrix& cov) {
  vox_NavCoordData nav;
  std::memset(&nav, 0, sizeof nav);
  nav.x = mark[0];
  nav.y = mark[1];
  nav.z = mark[2];
  const double s[3] = {std::sqrt(std::max(cov(0, 0), 0.0)), std::sqrt(std::max(cov(1, 1), 0.0)),
                       std::sqrt(std::max(cov(2, 2), 0.0))};
  // Clamped so that the narrowing to float cannot overflow, whatever the epochs gave.
  const auto sigma = [&](int i) { return static_cast<float>(std::min(s[i], 1.0e9)); };
  const auto correlation = [&](int i, int j) {
    return s[i] * s[j] > 0 ? static_cast<float>(std::clamp(cov(i, j) / (s[i] * s[j]), -1.0, 1.0))
                           : 0.0f;
  };
  nav.sx = sigma(0);
  nav.sy = sigma(1);
  nav.sz = sigma(2);
  nav.rxy = correlation(0, 1);
  nav.rxz = correlation(0, 2);
  nav.ryz = correlation(1, 2);
  vox_SetNavCoord(o.id, &nav);
}

// The residual curves: one line per satellite, the epoch time on line 1.
void PlotResiduals(void* writer, const std::vector<EpochFix>& fixes) {
  std::map<int, bool> sats;  // prn -> seen with the ionosphere-free combination
  for (const auto& f : fixes)
    for (const auto& r : f.residuals)
      sats[r.first] = sats[r.first] || f.iono_free;
  if (sats.empty()) return;
  vox_PlotStream* plot = vox_OpenPlotStreamEx(writer);
  if (plot == nullptr) return;
  for (const auto& [prn, iono_free] : sats) {
    const std::string name = io::SatName(prn) + (iono_free ? " IonoFree" : " CA");
    vox_SetLine(plot, 1 + prn, 0, 0, name.c_str(), nullptr);
  }
  for (const auto& s : sats)
    vox_CreatePlot(plot, 0, 1 + s.first, 0);
  uint32_t epoch = 0;
  for (const auto& f : fixes) {
    vox_SendData(plot, 1, epoch, f.t);
    for (const auto& r : f.residuals)
      vox_SendData(plot, 1 + r.first, epoch, r.second);
    ++epoch;
  }
  vox_ClosePlotStream(plot);
}

void ProcessOccupation(const vox_ThreadContext* context) {
  io::Reporter report(context);
  const auto occupation = io::GetOccupation(context->id);
  if (!occupation) {
    char text[96];
    std::snprintf(text, sizeof text,
                  "occupation %u: unknown or without a raw file; no navigation position",
                  context->id & 0xFFFFFFu);
    report.Message(kWarning, text);
    return;
  }
  const io::Occupation& o = *occupation;
  void* stream = o.epochs ? vox_OpenEpochStream(o.id, 0, nullptr, nullptr) : nullptr;
  if (stream == nullptr) {
    report.Message(kWarning, Label(o) + ": no epochs; no navigation position");
    report.Progress(100);
    return;
  }
  io::Ephemerides eph;
  eph.Load(o.first.seconds, o.last.seconds + 1);
  if (eph.Empty()) {
    vox_CloseEpochStream(stream);
    report.Message(kWarning, Label(o) + ": no GPS broadcast ephemeris; no navigation position");
    report.Progress(100);
    return;
  }

  std::vector<EpochFix> fixes;
  uint32_t epochs = 0;
  Vec3 start{};
  vox_EpochData e;
  vox_EpochSatData s;
  for (int ok = vox_FindEpoch(stream, nullptr, &e); ok && !g_stop.Requested();
       ok = vox_GetNextEpoch(stream, &e)) {
    io::EpochObs epoch;
    epoch.time = TimeMs{e.seconds, e.ms};
    epoch.t = io::Seconds(epoch.time);
    std::memset(&s, 0, sizeof s);
    while (vox_GetEpochDataEx(stream, &s)) {
      if (((s.sat >> 8) & 7u) == 0) {
        const double p1 = (s.presence & 1u) ? s.values[0] : (s.presence & 4u) ? s.values[2] : 0;
        const double p2 = (s.presence & 64u) ? s.values[6] : (s.presence & 16u) ? s.values[4] : 0;
        if (p1 != 0)
          epoch.sats.push_back({s.sat & 0xFF, p1 * VOX_SPEED_OF_LIGHT, p2 * VOX_SPEED_OF_LIGHT});
      }
      std::memset(&s, 0, sizeof s);
    }
    ++epochs;
    EpochFix fix;
    PointSolution sol;
    if (SolveEpoch(epoch, eph, start, fix, sol)) {
      start = sol.position;
      const Vec3 mark = io::MarkOf(sol.position, o);
      WriteNmea(stream, epoch, mark, sol.used, EpochHdop(epoch, eph, sol.position));
      fixes.push_back(std::move(fix));
    }
    if (o.epochs)
      report.Progress(static_cast<int>(std::min<uint64_t>(99, epochs * 100ull / o.epochs)));
  }
  vox_CloseEpochStream(stream);
  if (g_stop.Requested()) {
    report.Message(kWarning, Label(o) + ": stopped on request; no navigation position");
    return;
  }

  Vec3 mean{};
  SymMatrix cov(3);
  size_t used = 0;
  const double span = fixes.empty() ? 0 : fixes.back().t - fixes.front().t;
  if (!MeanOf(fixes, span, mean, cov, used)) {
    char text[160];
    std::snprintf(text, sizeof text,
                  ": none of %u epochs could be solved (too few satellites with an ephemeris); "
                  "no navigation position",
                  epochs);
    report.Message(kWarning, Label(o) + text);
    report.Progress(100);
    return;
  }
  const Vec3 mark = io::MarkOf(mean, o);
  StoreNavCoord(o, mark, cov);
  PlotResiduals(report.writer(), fixes);
  char text[200];
  std::snprintf(text, sizeof text,
                ": %zu of %u epochs solved, navigation position %.3f %.3f %.3f (sigma %.2f %.2f "
                "%.2f m)",
                used, epochs, mark[0], mark[1], mark[2], std::sqrt(cov(0, 0)), std::sqrt(cov(1, 1)),
                std::sqrt(cov(2, 2)));
  report.Message(kInfo, Label(o) + text);
  report.Progress(100);
}

}  // namespace

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  return VOX_ENGINE_INTERFACE_VERSION;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {
  return 0x00010000u;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "kra_rawfilter";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {
  return 0;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineDescription(void) {
  return "Single-point GPS positions and navigation coordinates per occupation";
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  g_stop.Request();
  return 1;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessOccupation(vox_ThreadContext* context) {
  if (context == nullptr) return 0;
  // A new run clears an old stop request; calls running beside it keep theirs.
  if (g_running.fetch_add(1) == 0) g_stop.Clear();
  uint32_t result = 1;
  try {
    ProcessOccupation(context);
  } catch (const std::exception& e) {
    io::Reporter(context).Message(kError, std::string("raw filter failed: ") + e.what());
    result = 0;
  } catch (...) {
    result = 0;
  }
  g_running.fetch_sub(1);
  return result;
}
