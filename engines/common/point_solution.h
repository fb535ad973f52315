// Single-point positioning from pseudoranges: weighted least squares for the receiver
// position and clock, with elevation weights, the tropospheric model and the full
// covariance of the estimate.
#pragma once

#include <span>
#include <vector>

#include "geodesy.h"
#include "least_squares.h"
#include "vox/vox_sdk_fields.h"

namespace voxeng {

struct RangeObservation {
  int sat = 0;                                // caller's identifier of the satellite
  const vox_GpsOrbitParams* orbit = nullptr;  // broadcast ephemeris valid at the epoch
  double range = 0;                           // m: L1 code, or the ionosphere-free code
  bool iono_free = false;                     // false: L1 code, so TGD applies
};

struct PointOptions {
  double elevation_mask = 10.0 * kDeg;
  bool troposphere = true;
  double code_sigma = 1.0;  // m, zenith
  Vec3 initial{};           // start of the iteration; the Earth's centre works
  int max_iterations = 12;
};

struct PointSolution {
  bool ok = false;
  Vec3 position{};
  double clock = 0;         // receiver clock offset times c, m
  SymMatrix covariance{4};  // x, y, z, clock (m^2), scaled by the variance factor
  double sigma0 = 0;        // a-posteriori standard deviation of unit weight
  double pdop = 0;
  int used = 0;  // satellites in the final iteration
  int iterations = 0;
  std::vector<double> residuals;  // per observation, m; 0 for those not used
};

// Solves one epoch received at GPS time t_receive (the receiver's time tag, seconds since
// the time origin). Needs four satellites above the mask.
PointSolution SolvePoint(double t_receive, std::span<const RangeObservation> obs,
                         const PointOptions& options = {});

// Elevation weight shared by the estimators: 1 / sigma^2 with sigma = zenith / sin(el).
double ElevationWeight(double zenith_sigma, double elevation);

}  // namespace voxeng
