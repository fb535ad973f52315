#include "troposphere_refine.h"

#include <algorithm>
#include <cmath>

#include "dd_geometry.h"

namespace voxeng {

namespace {

// Wet mapping: how much more delay a slanted path collects than the zenith one.
double Mapping(double elevation) {
  return 1.0 / std::max(std::sin(elevation), 0.1);
}

}  // namespace

bool RefineWithZenithDelay(std::span<const DdEpoch> epochs, const Vec3& base, BaselineSolution& sol,
                           const DdOptions& options, double& zenith) {
  if (!sol.fixed || sol.ambiguities.empty()) return false;
  Vec3 rover = sol.rover;
  double t = 0;
  SymMatrix q(4);
  NormalEquations last(4);
  std::vector<double> x;
  for (int it = 0; it < 3; ++it) {
    dd::AmbiguityColumns columns;
    NormalEquations ne(4);
    for (const DdEpoch& e : epochs) {
      const auto g = dd::Geometry(e, base, rover, options);
      const auto column = columns.Assign(g, sol.reference_sat, 0);
      size_t r = 0;
      while (r < g.size() && (g[r].obs->sat != sol.reference_sat || !g[r].HasPhase()))
        ++r;
      if (r == g.size()) continue;
      std::vector<size_t> rows;
      std::vector<std::vector<double>> a;
      std::vector<double> l;
      const double ref_phase = g[r].obs->rover_phase - g[r].obs->base_phase;
      for (size_t k = 0; k < g.size(); ++k) {
        if (k == r || column[k] < 0 || !g[k].HasPhase()) continue;
        const size_t c = static_cast<size_t>(column[k]);
        if (c >= sol.ambiguities.size()) return false;  // not the session that was fixed
        auto row = dd::PositionRow(g[k], g[r], 4);
        row[3] = Mapping(g[k].elevation) - Mapping(g[r].elevation);
        const double dd = (g[k].obs->rover_phase - g[k].obs->base_phase) - ref_phase;
        l.push_back(options.wavelength * (dd - sol.ambiguities[c]) -
                    (g[k].computed - g[r].computed) - row[3] * t);
        rows.push_back(k);
        a.push_back(std::move(row));
      }
      if (!rows.empty()) ne.AddCorrelated(a, l, dd::DdWeights(g, r, rows, options.phase_sigma));
    }
    if (!ne.Solve(x, &q)) return false;
    for (int c = 0; c < 3; ++c)
      rover[c] += x[c];
    t += x[3];
    last = ne;
    if (std::sqrt(x[0] * x[0] + x[1] * x[1] + x[2] * x[2]) < 1e-5) break;
  }
  const double sigma0 = dd::VarianceFactor(last, x);
  const double scale = sigma0 > 0 ? sigma0 * sigma0 : 1.0;
  sol.rover = rover;
  for (int r = 0; r < 3; ++r)
    for (int c = 0; c < 3; ++c)
      sol.covariance(r, c) = q(r, c) * scale;
  sol.sigma0 = sigma0;
  zenith = t;
  return true;
}

}  // namespace voxeng
