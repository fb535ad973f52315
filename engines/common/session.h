// A session of two receivers, as the differential engines set it up: the time both
// occupations cover, the base position to start from, and the epochs of both joined into
// double-difference epochs.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "double_difference.h"
#include "epoch_pairing.h"
#include "sdk_io.h"

namespace voxeng::io {

// The span both occupations cover; false when they do not overlap by at least one second.
bool Overlap(const Occupation& a, const Occupation& b, TimeMs& from, TimeMs& to);

// The epochs of an occupation over the common span [from, to] widened by the largest pairing
// tolerance: an epoch tagged a few milliseconds before the other receiver's first epoch (or
// after its last) still pairs with it.
std::vector<EpochObs> ReadSpanEpochs(uint32_t occupation_id, uint32_t interval_ms,
                                     const TimeMs& from, const TimeMs& to, const StopRequest& stop);

// Epochs whose time tags lie within the pairing tolerance of the two receivers (see
// epoch_pairing.h), with every satellite both receivers saw and an orbit exists for.
std::vector<DdEpoch> PairEpochs(const std::vector<EpochObs>& base,
                                const std::vector<EpochObs>& rover, const Ephemerides& eph);

// The mean single-point antenna position of some epochs (every `step`-th), if any solves.
std::optional<Vec3> MeanPointPosition(const std::vector<EpochObs>& epochs, const Ephemerides& eph,
                                      size_t step);

// Where a base stands: the point's known (or solved, or navigation mean) position, else the
// occupation's navigation coordinates, else a single-point mean of its epochs.
struct BasePosition {
  Vec3 mark{};
  double rms = 0;
  std::string source;  // "known", "solved", "navigation mean", "navigation", "single-point"
};
std::optional<BasePosition> ResolveBase(const Occupation& occupation,
                                        const std::vector<EpochObs>& epochs,
                                        const Ephemerides& eph);

// The rms (m) to report for a differential position. The formal covariance of many epochs
// is far too optimistic: epochs close in time share their errors (multipath, atmosphere), so
// the covariance is scaled as if one epoch in two minutes were independent. Phase solutions
// also carry what no double difference removes: the troposphere difference of two sites (a
// centimetre and a half, or half a centimetre left when it was estimated) and the orbit error,
// a part per million of the length.
double ReportedRms(const SymMatrix& covariance, size_t epochs, double span_seconds, bool phase,
                   double length, bool troposphere_estimated = false);

}  // namespace voxeng::io
