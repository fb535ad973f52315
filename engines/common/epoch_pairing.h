// Joining the epochs of two receivers, and thinning one receiver's epochs to an interval,
// when the receivers tag their epochs a few milliseconds off the nominal instant.
//
// Receivers that let their clock drift (and steer it only by whole milliseconds, or not at
// all) tag an epoch by their own clock: 00:09:30.003 at one station and 00:09:29.996 at the
// other are the same nominal epoch. Requiring equal tags loses almost every epoch of such
// data; these functions match tags within a tolerance instead.
//
// Why no observation needs shifting to a common instant: every pseudorange and phase is a
// measurement at its own receiver's tag, and the double-difference geometry computes each
// receiver's ranges at that receiver's own tag, from the transmit time its own pseudorange
// gives (tag minus range over c, which needs no knowledge of the receiver clock). Each
// receiver's clock error then enters all of its satellites alike and cancels between
// satellites; the satellite clock drifts by far less than a millimetre of range in a few
// milliseconds, so it still cancels between receivers. Extrapolating the phase to a common instant
// would need its rate, which is noisier than this exact model; the geometry per receiver is
// both simpler and exact.
//
// Pure functions on the caller's values; no state, callable from any thread.
#pragma once

#include <cstdint>
#include <functional>
#include <vector>

#include "double_difference.h"
#include "sdk_io.h"

namespace voxeng::io {

// The largest offset that still pairs two epochs, whatever their interval.
inline constexpr int64_t kMaxPairingMs = 100;

// a minus b, in milliseconds.
int64_t DiffMs(const TimeMs& a, const TimeMs& b);
// t moved by ms milliseconds (clamped at the time origin).
TimeMs ShiftMs(const TimeMs& t, int64_t ms);

// The usual spacing of consecutive epochs (the median, so that gaps and odd epochs do not
// count), in ms; 0 with fewer than two epochs.
int64_t NominalIntervalMs(const std::vector<EpochObs>& epochs);

// The pairing tolerance of two receivers: a tenth of the smaller nominal interval, at most
// kMaxPairingMs (which also applies when neither interval is known). A tenth of the interval
// keeps every epoch from ever lying within the tolerance of two epochs of the other receiver.
int64_t PairingToleranceMs(const std::vector<EpochObs>& base, const std::vector<EpochObs>& rover);

// The broadcast orbit of a satellite valid at a time, or null.
using OrbitLookup = std::function<const vox_GpsOrbitParams*(int prn, double t)>;

// Double-difference epochs of the base and rover epochs whose tags lie within tolerance_ms of
// each other (each epoch pairs at most once, with the nearest of the other receiver), with
// every satellite both saw and an orbit exists for. Each keeps its receiver's own tag.
std::vector<DdEpoch> PairEpochs(const std::vector<EpochObs>& base,
                                const std::vector<EpochObs>& rover, const OrbitLookup& orbit,
                                int64_t tolerance_ms);

// The epochs nearest the multiples of interval_ms (counted from origin_seconds), one per
// multiple, when they lie within a tenth of the interval (at most kMaxPairingMs) of it.
// Epochs already at about the interval (up to a tenth more) or coarser are all kept: there
// is nothing to thin.
std::vector<EpochObs> ThinEpochs(std::vector<EpochObs> epochs, uint32_t interval_ms,
                                 uint32_t origin_seconds);

}  // namespace voxeng::io
