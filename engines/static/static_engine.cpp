// The reference static engine: per vector, a baseline from double-differenced GPS L1
// observations of one occupation on each point. It solves the code double differences first,
// then the carrier phase with float ambiguities and, when the integer candidates are clearly
// separated, the fixed solution; it stores the best of these.
//
// What the vector result carries (the values vox stores as received):
//   solution_flags bits 0-1: 1 fixed phase, 2 float phase, 3 code only
//   stored_a: double differences used, common epochs, reference satellite, ambiguities
//   stored_b: baseline rms (m), also in baseline_rms; stored_c: ratio of the integer fix
//   stored_d: base occupation, rover occupation, first and last common epoch (GPS seconds)
//   stored_e: a-posteriori sigma of unit weight; stored_f: rms of the base position (m)
// The baseline runs mark to mark; the antenna offsets of both occupations are taken off.
//
// Threads: _eng_ProcessGroupMT hands the vectors to NumCPUs threads of the engine's own, each
// registered with vox_InitNewThread and writing through its own context; the vector list is
// read before they start and shared read-only, the next vector is taken with an atomic index.
#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <exception>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "dd_params.h"
#include "session.h"
#include "troposphere_refine.h"

namespace {

using namespace voxeng;
using io::kError;
using io::kInfo;
using io::kWarning;

io::StopRequest g_stop;

constexpr uint32_t kFixed = 1, kFloat = 2, kCode = 3;

struct Vector {
  uint32_t id = 0;
  uint32_t points[2] = {};
  std::string names[2];
};

std::vector<Vector> ListVectors() {
  std::vector<Vector> out;
  void* stream = vox_OpenVectorStream();
  if (stream == nullptr) return out;
  vox_VectorData d;
  std::memset(&d, 0, sizeof d);
  while (vox_GetNextVector(stream, &d)) {
    d.first_point_name[63] = d.second_point_name[63] = 0;
    out.push_back(
        {d.id, {d.first_point_id, d.second_point_id}, {d.first_point_name, d.second_point_name}});
  }
  vox_CloseVectorStream(stream);
  return out;
}

std::string Label(const Vector& v) {
  char text[180];
  std::snprintf(text, sizeof text, "vector %u (%s - %s)", v.id & 0xFFFFFFu, v.names[0].c_str(),
                v.names[1].c_str());
  return text;
}

// The occupations of the vector on each of its points.
void Occupations(const Vector& v, std::vector<io::Occupation> on[2]) {
  void* stream = vox_OpenROccupStream(v.id, 1);
  if (stream == nullptr) return;
  vox_ROccupData r;
  while (vox_GetNextROccup(stream, &r)) {
    const auto o = io::GetOccupation(r.occupation_id);
    if (!o || o->epochs == 0) continue;
    for (int k = 0; k < 2; ++k)
      if (o->point_id == v.points[k]) on[k].push_back(*o);
  }
  vox_CloseROccupStream(stream);
}

double Rms(const SymMatrix& cov) {
  const double trace = cov(0, 0) + cov(1, 1) + cov(2, 2);
  return trace > 0 ? std::sqrt(trace) : 0;
}

class VectorSolver {
 public:
  VectorSolver(const Vector& v, io::Reporter& report) : v_(v), report_(report) {}

  // Solves and stores the vector; false (with a message saying why) when it has no solution.
  bool Run() {
    params_ = ItemDdParams(vox_GetVectorProperty, v_.id);
    options_.elevation_mask = params_.elevation_mask_deg * kDeg;
    std::vector<io::Occupation> on[2];
    Occupations(v_, on);
    for (int k = 0; k < 2; ++k)
      if (on[k].empty()) return Fail("no occupation with data on point " + v_.names[k]);
    // The base is the end with a known position when only the second has one.
    const auto known0 = io::PointPosition(v_.points[0]);
    const auto known1 = io::PointPosition(v_.points[1]);
    reversed_ = !(known0 && known0->site_type == VOX_SITE_KNOWN) && known1 &&
                known1->site_type == VOX_SITE_KNOWN;
    if (!PickPair(on[reversed_ ? 1 : 0], on[reversed_ ? 0 : 1]))
      return Fail("the occupations of its points do not overlap in time");

    eph_.Load(from_.seconds, to_.seconds + 1);
    if (eph_.Empty()) return Fail("no GPS broadcast ephemeris for the common span");
    const auto base_epochs = io::ReadSpanEpochs(base_.id, params_.interval_ms, from_, to_, g_stop);
    const auto rover_epochs =
        io::ReadSpanEpochs(rover_.id, params_.interval_ms, from_, to_, g_stop);
    if (g_stop.Requested()) return Fail("stopped on request");
    const auto base = io::ResolveBase(base_, base_epochs, eph_);
    if (!base) return Fail("no position for the base point");
    const std::vector<DdEpoch> epochs = io::PairEpochs(base_epochs, rover_epochs, eph_);
    if (epochs.empty()) return Fail("no common epochs with satellites and ephemerides");
    report_.Progress(30);
    return Solve(*base, epochs);
  }

 private:
  bool Fail(const std::string& why) {
    report_.Message(kWarning, Label(v_) + ": no solution: " + why);
    vox_VectorResult r;
    std::memset(&r, 0, sizeof r);
    r.reversed = reversed_ ? 1 : 0;
    vox_SetVectorResultEx(report_.writer(), v_.id, &r);
    return false;
  }

  // The pair of occupations with the longest common span.
  bool PickPair(const std::vector<io::Occupation>& bases,
                const std::vector<io::Occupation>& rovers) {
    double best = 0;
    for (const auto& b : bases)
      for (const auto& r : rovers) {
        TimeMs from, to;
        if (b.id == r.id || !io::Overlap(b, r, from, to)) continue;
        const double length = io::Seconds(to) - io::Seconds(from);
        if (length > best) {
          best = length;
          base_ = b;
          rover_ = r;
          from_ = from;
          to_ = to;
        }
      }
    return best > 0;
  }

  bool Solve(const io::BasePosition& base, const std::vector<DdEpoch>& epochs) {
    const Vec3 base_antenna = io::AntennaOf(base.mark, base_);
    // Start the rover from its navigation coordinates, else from the base itself: the code
    // solution converges from kilometres away.
    Vec3 start = base_antenna;
    if (const auto nav = io::NavCoord(rover_.id)) start = io::AntennaOf(*nav, rover_);
    const BaselineSolution code = SolveCodeBaseline(epochs, base_antenna, start, options_);
    if (!code.ok) return Fail("too few satellites in common for a code solution");
    if (g_stop.Requested()) return Fail("stopped on request");
    report_.Progress(60);
    BaselineSolution best = code;
    uint32_t kind = kCode;
    const BaselineSolution phase =
        SolvePhaseBaseline(epochs, base_antenna, code.rover, options_, params_.min_ratio);
    if (phase.ok && (phase.fixed || Rms(phase.covariance) < Rms(code.covariance))) {
      best = phase;
      kind = phase.fixed ? kFixed : kFloat;
    }
    if (kind == kFixed) {
      BaselineSolution refined = best;
      double zenith = 0;
      if (RefineWithZenithDelay(epochs, base_antenna, refined, options_, zenith)) {
        best = refined;
        zenith_ = zenith;
      }
    }
    report_.Progress(95);
    Store(base, best, kind, epochs);
    return true;
  }

  void Store(const io::BasePosition& base, const BaselineSolution& s, uint32_t kind,
             const std::vector<DdEpoch>& epochs) {
    const Vec3 rover_mark = io::MarkOf(s.rover, rover_);
    const Vec3 baseline = rover_mark - base.mark;
    const double rms =
        io::ReportedRms(s.covariance, epochs.size(), epochs.back().t_base - epochs.front().t_base,
                        kind != kCode, Norm(baseline), zenith_.has_value());
    vox_VectorResult r;
    std::memset(&r, 0, sizeof r);
    r.solved = 1;
    r.reversed = reversed_ ? 1 : 0;
    for (int c = 0; c < 3; ++c) {
      r.base[c] = base.mark[c];
      r.baseline[c] = baseline[c];
    }
    r.base_rms = static_cast<float>(base.rms);
    r.baseline_rms = static_cast<float>(rms);
    r.solution_flags = kind;
    r.stored_a[0] = static_cast<uint32_t>(s.observations);
    r.stored_a[1] = static_cast<uint32_t>(epochs.size());
    r.stored_a[2] = static_cast<uint32_t>(s.reference_sat);
    r.stored_a[3] = static_cast<uint32_t>(s.ambiguities.size());
    r.stored_b = static_cast<float>(rms);
    // A perfect fit makes the ratio unbounded; a float must still hold it.
    r.stored_c = static_cast<float>(std::min(s.ratio, 1.0e6));
    r.stored_d[0] = base_.id;
    r.stored_d[1] = rover_.id;
    // The nominal seconds: a receiver tags its epochs a few ms either side of them.
    r.stored_d[2] = static_cast<uint32_t>(std::floor(epochs.front().t_base + 0.5));
    r.stored_d[3] = static_cast<uint32_t>(std::floor(epochs.back().t_base + 0.5));
    r.stored_e = static_cast<float>(std::min(s.sigma0, 1.0e9));
    r.stored_f = static_cast<float>(base.rms);
    vox_SetVectorResultEx(report_.writer(), v_.id, &r);

    static const char* const kKinds[] = {"", "fixed", "float", "code"};
    char text[320];
    std::snprintf(text, sizeof text,
                  ": %s solution from %zu epochs, %zu double differences, base %s: "
                  "dX %.4f dY %.4f dZ %.4f m, length %.4f m, rms %.4f m, ratio %.1f",
                  kKinds[kind], epochs.size(), s.observations, base.source.c_str(), baseline[0],
                  baseline[1], baseline[2], Norm(baseline), rms, s.ratio);
    std::string line = Label(v_) + text;
    if (zenith_) {
      std::snprintf(text, sizeof text, ", relative zenith delay %.1f mm", *zenith_ * 1000.0);
      line += text;
    }
    report_.Message(kInfo, line);
  }

  const Vector& v_;
  io::Reporter& report_;
  bool reversed_ = false;
  io::Occupation base_, rover_;
  TimeMs from_{}, to_{};
  io::Ephemerides eph_;
  DdParams params_{};
  DdOptions options_;
  std::optional<double> zenith_;  // relative zenith delay of the rover, when estimated
};

// Solves vectors taken one by one from the shared index until none is left; reports the
// part of its expected share done as this worker's progress.
void Work(const std::vector<Vector>& vectors, std::atomic<size_t>& next, io::Reporter& report,
          size_t share) {
  size_t done = 0;
  for (size_t k; !g_stop.Requested() && (k = next.fetch_add(1)) < vectors.size();) {
    try {
      VectorSolver(vectors[k], report).Run();
    } catch (const std::exception& e) {
      report.Message(kError, Label(vectors[k]) + ": no solution: " + e.what());
    } catch (...) {
      report.Message(kError, Label(vectors[k]) + ": no solution: internal failure");
    }
    ++done;
    report.Progress(
        static_cast<int>(std::min<size_t>(100, done * 100 / std::max<size_t>(share, 1))));
  }
}

uint32_t RunGroup(vox_ThreadContext* context, uint32_t threads) {
  g_stop.Clear();
  io::Reporter report(context);
  const std::vector<Vector> vectors = ListVectors();
  if (vectors.empty()) {
    report.Message(kWarning, "static engine: the job has no vector with occupations");
    report.Progress(100);
    return 1;
  }
  std::atomic<size_t> next{0};
  threads = std::clamp<uint32_t>(threads, 1, static_cast<uint32_t>(vectors.size()));
  if (threads == 1) {
    // On the caller's thread and writer the progress is the share of vectors done.
    Work(vectors, next, report, vectors.size());
  } else {
    const size_t share = (vectors.size() + threads - 1) / threads;
    std::vector<std::thread> pool;
    for (uint32_t t = 0; t < threads; ++t) {
      try {
        pool.emplace_back([&, base = *context]() mutable {
          vox_InitNewThread(&base);
          io::Reporter own(&base);
          Work(vectors, next, own, share);
          vox_DeleteThread(&base);
        });
      } catch (...) {
        break;  // no more threads: those started (or the caller) do the rest
      }
    }
    for (auto& t : pool)
      t.join();
    if (pool.empty()) Work(vectors, next, report, vectors.size());
  }
  if (g_stop.Requested()) {
    report.Message(kWarning, "static engine: stopped on request");
    return 1;
  }
  report.Progress(100);
  return 1;
}

uint32_t Guarded(vox_ThreadContext* context, uint32_t threads) {
  if (context == nullptr) return 0;
  try {
    return RunGroup(context, threads);
  } catch (...) {
    return 0;
  }
}

}  // namespace

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  return VOX_ENGINE_INTERFACE_VERSION;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {
  return 0x00010000u;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "kra_static";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {
  return 1;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineDescription(void) {
  return "Static GPS baselines from double differences (code, float and fixed L1 phase)";
}
VOXENG_EXPORT_DD_PARAMETERS()
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  g_stop.Request();
  return 1;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  return Guarded(context, 1);
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroupMT(vox_ThreadContext* context) {
  return Guarded(context, vox_GetThreadCount());
}
