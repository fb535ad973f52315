// The reference kinematic engine: per fan, epoch-by-epoch positions of the rover file against
// the occupation on the fan's base point, from double-differenced GPS L1 observations. Every
// epoch gets a code position; the session's carrier phases are then solved together (one
// ambiguity per satellite arc) and, when the integers are found, every epoch is fixed.
//
// What is stored: the fan result is the base mark (vox keeps the rays relative to it); one ray
// per solved epoch, at the rover's mark, with
//   flags bits 0-1: 1 fixed phase, 2 float phase, 3 code (vox makes NMEA qualities 4, 5, 2)
//   values: double differences of the epoch, reference satellite, position rms in mm
//   hdop and the satellites both receivers saw.
//
// Threads: the fans are processed one after the other on the caller's thread.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <exception>
#include <span>
#include <string>
#include <vector>

#include "broadcast.h"
#include "dd_params.h"
#include "dop.h"
#include "session.h"

namespace {

using namespace voxeng;
using io::kError;
using io::kInfo;
using io::kWarning;

io::StopRequest g_stop;

constexpr uint32_t kFixed = 1, kFloat = 2, kCode = 3;

struct Fan {
  uint32_t id = 0;
  uint32_t base_point = 0;
  uint32_t rover_file = 0;
  std::string base_name, rover_name;
};

std::vector<Fan> ListFans() {
  std::vector<Fan> out;
  void* stream = vox_OpenFanStream();
  if (stream == nullptr) return out;
  vox_FanData d;
  std::memset(&d, 0, sizeof d);
  while (vox_GetNextFan(stream, &d)) {
    d.base_point_name[63] = d.rover_file_name[63] = 0;
    out.push_back({d.id, d.base_point_id, d.rover_file_id, d.base_point_name, d.rover_file_name});
  }
  vox_CloseFanStream(stream);
  return out;
}

std::string Label(const Fan& f) {
  char text[180];
  std::snprintf(text, sizeof text, "fan %u (%s - %s)", f.id & 0xFFFFFFu, f.base_name.c_str(),
                f.rover_name.c_str());
  return text;
}

double Rms(const SymMatrix& cov) {
  const double trace = cov(0, 0) + cov(1, 1) + cov(2, 2);
  return trace > 0 ? std::sqrt(trace) : 0;
}

struct RayCount {
  size_t fixed = 0, floating = 0, code = 0;
};

class FanSolver {
 public:
  FanSolver(const Fan& f, io::Reporter& report, int done, int total)
      : f_(f), report_(report), done_(done), total_(total) {}

  bool Run() {
    params_ = ItemDdParams(vox_GetFanProperty, f_.id);
    options_.elevation_mask = params_.elevation_mask_deg * kDeg;
    std::vector<io::Occupation> bases, rovers;
    void* stream = vox_OpenROccupStream(f_.id, 0);
    if (stream != nullptr) {
      vox_ROccupData r;
      while (vox_GetNextROccup(stream, &r)) {
        const auto o = io::GetOccupation(r.occupation_id);
        if (!o || o->epochs == 0) continue;
        if (f_.base_point != 0 && o->point_id == f_.base_point)
          bases.push_back(*o);
        else if ((o->file_id | 0x04000000u) == (f_.rover_file | 0x04000000u))
          rovers.push_back(*o);
      }
      vox_CloseROccupStream(stream);
    }
    if (bases.empty()) return Fail("no occupation with data on the base point");
    if (rovers.empty()) return Fail("no occupation of the rover file");
    if (!PickPair(bases, rovers)) return Fail("the base and rover data do not overlap in time");

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
    Progress(20);
    return Solve(*base, epochs);
  }

 private:
  void Progress(int percent) { report_.Progress((done_ * 100 + percent) / std::max(total_, 1)); }

  bool Fail(const std::string& why) {
    report_.Message(kWarning, Label(f_) + ": no solution: " + why);
    vox_FanResult r;
    std::memset(&r, 0, sizeof r);
    vox_SetFanResultEx(report_.writer(), f_.id, &r);
    return false;
  }

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
    const Vec3 base_antenna = base_antenna_ = io::AntennaOf(base.mark, base_);
    // Code positions epoch by epoch, each starting from the one before.
    std::vector<BaselineSolution> code(epochs.size());
    std::vector<Vec3> approx(epochs.size(), base_antenna);
    Vec3 start = base_antenna;
    if (const auto nav = io::NavCoord(rover_.id)) start = io::AntennaOf(*nav, rover_);
    size_t code_ok = 0;
    for (size_t k = 0; k < epochs.size() && !g_stop.Requested(); ++k) {
      code[k] = SolveCodeBaseline(std::span(&epochs[k], 1), base_antenna, start, options_);
      if (code[k].ok) {
        start = approx[k] = code[k].rover;
        ++code_ok;
      }
    }
    if (g_stop.Requested()) return Fail("stopped on request");
    if (code_ok == 0) return Fail("too few satellites in common at every epoch");
    Progress(50);
    const KinematicSolution phase =
        SolveKinematicPhase(epochs, base_antenna, approx, options_, params_.min_ratio);
    if (g_stop.Requested()) return Fail("stopped on request");
    Progress(80);

    vox_FanResult result;
    std::memset(&result, 0, sizeof result);
    result.has_position = 1;
    for (int c = 0; c < 3; ++c)
      result.position[c] = base.mark[c];
    vox_SetFanResultEx(report_.writer(), f_.id, &result);
    const RayCount count = WriteRays(epochs, code, phase);
    if (g_stop.Requested()) return false;

    char text[320];
    std::snprintf(text, sizeof text,
                  ": %zu rays of %zu common epochs (%zu fixed, %zu float, %zu code), base %s, "
                  "ambiguities %s, ratio %.1f",
                  count.fixed + count.floating + count.code, epochs.size(), count.fixed,
                  count.floating, count.code, base.source.c_str(),
                  phase.fixed ? "fixed" : (phase.ok ? "float" : "unsolved"), phase.ratio);
    report_.Message(kInfo, Label(f_) + text);
    return true;
  }

  RayCount WriteRays(const std::vector<DdEpoch>& epochs, const std::vector<BaselineSolution>& code,
                     const KinematicSolution& phase) {
    RayCount count;
    TRayStream* rays = vox_OpenRayStream(f_.id, 0);
    for (size_t k = 0; k < epochs.size(); ++k) {
      if (g_stop.Requested()) break;
      Vec3 antenna;
      SymMatrix cov(3);
      uint32_t kind;
      const bool use_phase =
          phase.ok && k < phase.epoch_ok.size() && phase.epoch_ok[k] &&
          (phase.fixed || !code[k].ok || Rms(phase.covariance[k]) < Rms(code[k].covariance));
      if (use_phase) {
        antenna = phase.rover[k];
        cov = phase.covariance[k];
        kind = phase.fixed ? kFixed : kFloat;
      } else if (code[k].ok) {
        antenna = code[k].rover;
        cov = code[k].covariance;
        kind = kCode;
      } else {
        continue;
      }
      (kind == kFixed ? count.fixed : kind == kFloat ? count.floating : count.code)++;
      std::vector<Vec3> sats;
      for (const DdSatellite& s : epochs[k].sats)
        sats.push_back(EvaluateBroadcast(*s.orbit, epochs[k].t_rover).position);
      const Vec3 mark = io::MarkOf(antenna, rover_);
      vox_RayData ray;
      std::memset(&ray, 0, sizeof ray);
      ray.time = io::ToTimeMs(epochs[k].t_rover);
      for (int c = 0; c < 3; ++c)
        ray.position[c] = mark[c];
      ray.values[0] = static_cast<uint32_t>(code[k].ok ? code[k].observations : 0);
      ray.values[1] = static_cast<uint32_t>(phase.reference_sat);
      const double rms = io::ReportedRms(cov, 1, 0, kind != kCode, Norm(antenna - base_antenna_));
      ray.values[2] = static_cast<uint32_t>(std::min(rms * 1000.0, 4.0e9));
      ray.flags = kind;
      ray.hdop = static_cast<float>(Hdop(antenna, sats, 0.0));
      ray.satellites = static_cast<uint32_t>(epochs[k].sats.size());
      vox_SetNextRayEx(report_.writer(), rays, &ray);
      if (k % 64 == 0) Progress(80 + static_cast<int>(k * 20 / std::max<size_t>(epochs.size(), 1)));
    }
    vox_CloseRayStream(rays);
    return count;
  }

  const Fan& f_;
  io::Reporter& report_;
  int done_, total_;
  io::Occupation base_, rover_;
  TimeMs from_{}, to_{};
  io::Ephemerides eph_;
  DdParams params_{};
  DdOptions options_;
  Vec3 base_antenna_{};
};

uint32_t RunGroup(vox_ThreadContext* context) {
  g_stop.Clear();
  io::Reporter report(context);
  const std::vector<Fan> fans = ListFans();
  if (fans.empty()) {
    report.Message(kWarning, "kinematic engine: the job has no fan");
    report.Progress(100);
    return 1;
  }
  const int total = static_cast<int>(fans.size());
  for (int k = 0; k < total && !g_stop.Requested(); ++k) {
    try {
      FanSolver(fans[k], report, k, total).Run();
    } catch (const std::exception& e) {
      report.Message(kError, Label(fans[k]) + ": no solution: " + e.what());
    } catch (...) {
      report.Message(kError, Label(fans[k]) + ": no solution: internal failure");
    }
  }
  if (g_stop.Requested()) {
    report.Message(kWarning, "kinematic engine: stopped on request");
    return 1;
  }
  report.Progress(100);
  return 1;
}

}  // namespace

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  return VOX_ENGINE_INTERFACE_VERSION;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {
  return 0x00010000u;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "kra_kinematic";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {
  return 2;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineDescription(void) {
  return "Kinematic GPS positions of a rover file against a base (code, float and fixed phase)";
}
VOXENG_EXPORT_DD_PARAMETERS()
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  g_stop.Request();
  return 1;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  if (context == nullptr) return 0;
  try {
    return RunGroup(context);
  } catch (...) {
    return 0;
  }
}
