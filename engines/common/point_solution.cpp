#include "point_solution.h"

#include <algorithm>
#include <cmath>

#include "broadcast.h"
#include "troposphere.h"

namespace voxeng {

double ElevationWeight(double zenith_sigma, double elevation) {
  const double s = std::max(std::sin(elevation), 0.1);
  return (s * s) / (zenith_sigma * zenith_sigma);
}

PointSolution SolvePoint(double t_receive, std::span<const RangeObservation> obs,
                         const PointOptions& options) {
  PointSolution sol;
  sol.position = options.initial;
  sol.residuals.assign(obs.size(), 0.0);
  for (int it = 0; it < options.max_iterations; ++it) {
    sol.iterations = it + 1;
    // Far from the Earth's surface elevations mean nothing: use every satellite unmasked and
    // without troposphere until the position is roughly right.
    const bool near_earth = Norm(sol.position) > 6.0e6;
    const Geodetic place = near_earth ? EcefToGeodetic(sol.position) : Geodetic{};
    NormalEquations ne(4);
    std::vector<double> row(4);
    int used = 0;
    for (size_t k = 0; k < obs.size(); ++k) {
      const RangeObservation& o = obs[k];
      sol.residuals[k] = 0;
      if (!o.orbit || o.range == 0) continue;
      const TransmitState ts =
          StateAtTransmit(*o.orbit, t_receive, o.range, near_earth ? sol.position : Vec3{});
      const Vec3 los = ts.state.position - sol.position;
      const double rho = Norm(los);
      double elevation = kPi / 2;
      double tropo = 0;
      if (near_earth) {
        elevation = Look(sol.position, ts.state.position).elevation;
        if (elevation < options.elevation_mask) continue;
        if (options.troposphere) tropo = TroposphereDelay(place.lat, place.height, elevation);
      }
      const double sat_clock = o.iono_free ? ts.state.clock : L1Clock(*o.orbit, ts.state);
      const double computed = rho + sol.clock - VOX_SPEED_OF_LIGHT * sat_clock + tropo;
      for (int c = 0; c < 3; ++c)
        row[c] = -los[c] / rho;
      row[3] = 1.0;
      const double misclosure = o.range - computed;
      sol.residuals[k] = misclosure;
      ne.Add(row, misclosure, ElevationWeight(options.code_sigma, elevation));
      ++used;
    }
    sol.used = used;
    if (used < 4) return sol;
    std::vector<double> dx;
    SymMatrix q(4);
    if (!ne.Solve(dx, &q)) return sol;
    for (int c = 0; c < 3; ++c)
      sol.position[c] += dx[c];
    sol.clock += dx[3];
    const double step = std::sqrt(dx[0] * dx[0] + dx[1] * dx[1] + dx[2] * dx[2]);
    if (step < 1e-4 && near_earth) {
      // Residuals after the last update: l - A dx, and the variance factor from them.
      double vtpv = ne.weighted_ll();
      for (int r = 0; r < 4; ++r)
        vtpv -= dx[r] * ne.rhs()[r];
      const int redundancy = used - 4;
      sol.sigma0 = redundancy > 0 ? std::sqrt(std::max(vtpv, 0.0) / redundancy) : 0.0;
      const double scale = redundancy > 0 ? sol.sigma0 * sol.sigma0 : 1.0;
      sol.covariance = q;
      for (double& v : sol.covariance.v)
        v *= scale;
      sol.pdop = std::sqrt(q(0, 0) + q(1, 1) + q(2, 2)) / options.code_sigma;
      sol.ok = true;
      return sol;
    }
  }
  return sol;
}

}  // namespace voxeng
