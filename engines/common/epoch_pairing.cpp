#include "epoch_pairing.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace voxeng::io {

namespace {

int64_t ToleranceOf(int64_t interval_ms) {
  return interval_ms > 0 ? std::min(kMaxPairingMs, interval_ms / 10) : kMaxPairingMs;
}

DdEpoch Join(const EpochObs& b, const EpochObs& r, const OrbitLookup& orbit) {
  DdEpoch dd;
  dd.t_base = b.t;
  dd.t_rover = r.t;
  for (const SatObs& sb : b.sats) {
    const auto sr = std::find_if(r.sats.begin(), r.sats.end(),
                                 [&](const SatObs& s) { return s.prn == sb.prn; });
    if (sr == r.sats.end()) continue;
    const vox_GpsOrbitParams* o = orbit(sb.prn, b.t);
    if (o == nullptr) continue;
    const bool phase = sb.l1 != 0 && sr->l1 != 0;
    dd.sats.push_back(
        {sb.prn, o, sb.p1, sr->p1, phase ? sb.l1 : 0.0, phase ? sr->l1 : 0.0, sb.slip || sr->slip});
  }
  return dd;
}

}  // namespace

int64_t DiffMs(const TimeMs& a, const TimeMs& b) {
  return (int64_t{a.seconds} - int64_t{b.seconds}) * 1000 + (int64_t{a.ms} - int64_t{b.ms});
}

TimeMs ShiftMs(const TimeMs& t, int64_t ms) {
  const int64_t total = std::max<int64_t>(0, int64_t{t.seconds} * 1000 + t.ms + ms);
  return TimeMs{static_cast<uint32_t>(total / 1000), static_cast<uint16_t>(total % 1000)};
}

int64_t NominalIntervalMs(const std::vector<EpochObs>& epochs) {
  std::vector<int64_t> steps;
  for (size_t k = 1; k < epochs.size(); ++k)
    if (const int64_t d = DiffMs(epochs[k].time, epochs[k - 1].time); d > 0) steps.push_back(d);
  if (steps.empty()) return 0;
  std::nth_element(steps.begin(), steps.begin() + steps.size() / 2, steps.end());
  return steps[steps.size() / 2];
}

int64_t PairingToleranceMs(const std::vector<EpochObs>& base, const std::vector<EpochObs>& rover) {
  const int64_t a = NominalIntervalMs(base), b = NominalIntervalMs(rover);
  const int64_t smaller = a == 0 ? b : b == 0 ? a : std::min(a, b);
  return ToleranceOf(smaller);
}

std::vector<DdEpoch> PairEpochs(const std::vector<EpochObs>& base,
                                const std::vector<EpochObs>& rover, const OrbitLookup& orbit,
                                int64_t tolerance_ms) {
  std::vector<DdEpoch> out;
  size_t j = 0;  // rover epochs before j are paired or too early for every base epoch left
  for (size_t i = 0; i < base.size(); ++i) {
    const TimeMs& tb = base[i].time;
    while (j < rover.size() && DiffMs(rover[j].time, tb) < -tolerance_ms)
      ++j;
    if (j == rover.size()) break;
    size_t k = j;
    while (k + 1 < rover.size() &&
           std::llabs(DiffMs(rover[k + 1].time, tb)) < std::llabs(DiffMs(rover[k].time, tb)))
      ++k;
    const int64_t offset = std::llabs(DiffMs(rover[k].time, tb));
    if (offset > tolerance_ms) continue;
    // The next base epoch may lie nearer this rover epoch (irregular data): it takes it.
    if (i + 1 < base.size() && std::llabs(DiffMs(rover[k].time, base[i + 1].time)) < offset)
      continue;
    out.push_back(Join(base[i], rover[k], orbit));
    j = k + 1;
  }
  return out;
}

std::vector<EpochObs> ThinEpochs(std::vector<EpochObs> epochs, uint32_t interval_ms,
                                 uint32_t origin_seconds) {
  const int64_t interval = interval_ms;
  // Data already at about the interval (its tags drift) or coarser keeps every epoch.
  if (interval == 0 || interval * 10 <= NominalIntervalMs(epochs) * 11) return epochs;
  const int64_t tolerance = ToleranceOf(interval);
  const TimeMs origin{origin_seconds, 0};
  std::vector<EpochObs> out;
  bool any = false;
  int64_t last_slot = 0;
  int64_t last_offset = 0;
  for (EpochObs& e : epochs) {
    const int64_t since = DiffMs(e.time, origin);
    // Milliseconds stay exact in a double; floor keeps epochs before the origin right too.
    const auto slot = static_cast<int64_t>(std::floor(double(since) / double(interval) + 0.5));
    const int64_t offset = std::llabs(since - slot * interval);
    if (offset > tolerance) continue;
    if (any && slot == last_slot) {
      if (offset < last_offset) {
        out.back() = std::move(e);
        last_offset = offset;
      }
      continue;
    }
    out.push_back(std::move(e));
    any = true;
    last_slot = slot;
    last_offset = offset;
  }
  return out;
}

}  // namespace voxeng::io
