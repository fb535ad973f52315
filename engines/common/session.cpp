#include "session.h"

#include <algorithm>
#include <cmath>

#include "combinations.h"
#include "point_solution.h"

namespace voxeng::io {

namespace {

bool Before(const TimeMs& a, const TimeMs& b) {
  return a.seconds < b.seconds || (a.seconds == b.seconds && a.ms < b.ms);
}

}  // namespace

bool Overlap(const Occupation& a, const Occupation& b, TimeMs& from, TimeMs& to) {
  if (a.epochs == 0 || b.epochs == 0) return false;
  from = Before(a.first, b.first) ? b.first : a.first;
  to = Before(a.last, b.last) ? a.last : b.last;
  return Seconds(to) - Seconds(from) >= 1.0;
}

std::vector<EpochObs> ReadSpanEpochs(uint32_t occupation_id, uint32_t interval_ms,
                                     const TimeMs& from, const TimeMs& to,
                                     const StopRequest& stop) {
  const TimeMs wide_from = ShiftMs(from, -kMaxPairingMs), wide_to = ShiftMs(to, kMaxPairingMs);
  return ReadEpochs(occupation_id, interval_ms, &wide_from, &wide_to, stop);
}

std::vector<DdEpoch> PairEpochs(const std::vector<EpochObs>& base,
                                const std::vector<EpochObs>& rover, const Ephemerides& eph) {
  return PairEpochs(
      base, rover, [&eph](int prn, double t) { return eph.Find(prn, t); },
      PairingToleranceMs(base, rover));
}

std::optional<Vec3> MeanPointPosition(const std::vector<EpochObs>& epochs, const Ephemerides& eph,
                                      size_t step) {
  Vec3 sum{};
  size_t count = 0;
  Vec3 start{};
  for (size_t k = 0; k < epochs.size(); k += std::max<size_t>(step, 1)) {
    const EpochObs& e = epochs[k];
    std::vector<RangeObservation> obs;
    bool dual = true;
    for (const SatObs& s : e.sats)
      if (eph.Find(s.prn, e.t) && s.p2 == 0) dual = false;
    for (const SatObs& s : e.sats)
      if (const vox_GpsOrbitParams* orbit = eph.Find(s.prn, e.t))
        obs.push_back({s.prn, orbit, dual ? IonoFree(s.p1, s.p2) : s.p1, dual});
    PointOptions options;
    options.initial = start;
    const PointSolution sol = SolvePoint(e.t, obs, options);
    if (!sol.ok) continue;
    start = sol.position;
    sum = sum + sol.position;
    ++count;
  }
  if (count == 0) return std::nullopt;
  return (1.0 / count) * sum;
}

std::optional<BasePosition> ResolveBase(const Occupation& occupation,
                                        const std::vector<EpochObs>& epochs,
                                        const Ephemerides& eph) {
  if (const auto p = PointPosition(occupation.point_id)) {
    const char* source = p->site_type == VOX_SITE_KNOWN    ? "known"
                         : p->site_type == VOX_SITE_SOLVED ? "solved"
                                                           : "navigation mean";
    return BasePosition{p->xyz, p->rms, source};
  }
  if (const auto nav = NavCoord(occupation.id)) return BasePosition{*nav, 0, "navigation"};
  const size_t step = std::max<size_t>(1, epochs.size() / 60);
  if (const auto antenna = MeanPointPosition(epochs, eph, step))
    return BasePosition{MarkOf(*antenna, occupation), 0, "single-point"};
  return std::nullopt;
}

double ReportedRms(const SymMatrix& covariance, size_t epochs, double span_seconds, bool phase,
                   double length, bool troposphere_estimated) {
  constexpr double kCorrelationSeconds = 120.0;
  const double trace = covariance(0, 0) + covariance(1, 1) + covariance(2, 2);
  const double independent =
      std::clamp(span_seconds / kCorrelationSeconds + 1.0, 1.0, std::max(1.0, double(epochs)));
  double variance = std::max(trace, 0.0) * std::max(1.0, epochs / independent);
  const double troposphere = troposphere_estimated ? 0.005 : 0.015;
  if (phase) variance += troposphere * troposphere + (1e-6 * length) * (1e-6 * length);
  return std::sqrt(variance);
}

}  // namespace voxeng::io
