#include "double_difference.h"

#include <cmath>

#include "dd_geometry.h"

namespace voxeng {

using dd::SatGeometry;

BaselineSolution SolveCodeBaseline(std::span<const DdEpoch> epochs, const Vec3& base,
                                   const Vec3& rover_approx, const DdOptions& options) {
  BaselineSolution sol;
  sol.rover = rover_approx;
  for (int it = 0; it < options.iterations; ++it) {
    NormalEquations ne(3);
    for (const DdEpoch& e : epochs) {
      const auto g = dd::Geometry(e, base, sol.rover, options);
      if (g.size() >= 2) dd::AddCodeBlock(ne, g, dd::HighestElevation(g), 3, options);
    }
    std::vector<double> dx;
    SymMatrix q(3);
    if (ne.observations() < 3 || !ne.Solve(dx, &q)) return sol;
    for (int c = 0; c < 3; ++c)
      sol.rover[c] += dx[c];
    sol.sigma0 = dd::VarianceFactor(ne, dx);
    sol.observations = ne.observations();
    const double scale = ne.observations() > 3 ? sol.sigma0 * sol.sigma0 : 1.0;
    for (int r = 0; r < 3; ++r)
      for (int c = 0; c < 3; ++c)
        sol.covariance(r, c) = q(r, c) * scale;
    sol.ok = true;
    if (std::sqrt(dx[0] * dx[0] + dx[1] * dx[1] + dx[2] * dx[2]) < 1e-4) break;
  }
  return sol;
}

BaselineSolution SolvePhaseBaseline(std::span<const DdEpoch> epochs, const Vec3& base,
                                    const Vec3& rover_approx, const DdOptions& options,
                                    double min_ratio) {
  BaselineSolution sol = SolveCodeBaseline(epochs, base, rover_approx, options);
  if (!sol.ok) return sol;
  sol.ok = false;
  const int ref_sat = dd::PickReference(epochs, base, std::span(&sol.rover, 1), options);
  sol.reference_sat = ref_sat;

  std::vector<double> x;
  SymMatrix q;
  for (int it = 0; it < options.iterations; ++it) {
    dd::AmbiguityColumns columns;
    std::vector<std::vector<SatGeometry>> geometry;
    std::vector<std::vector<int>> column_of;
    for (const DdEpoch& e : epochs) {
      geometry.push_back(dd::Geometry(e, base, sol.rover, options));
      column_of.push_back(columns.Assign(geometry.back(), ref_sat, 3));
    }
    const size_t unknowns = 3 + columns.count();
    NormalEquations ne(unknowns);
    for (size_t k = 0; k < geometry.size(); ++k) {
      const auto& g = geometry[k];
      size_t r = 0;
      while (r < g.size() && g[r].obs->sat != ref_sat)
        ++r;
      if (r == g.size()) continue;
      dd::AddCodeBlock(ne, g, r, unknowns, options);
      dd::AddPhaseBlock(ne, g, r, column_of[k], unknowns, options);
    }
    if (columns.count() == 0 || !ne.Solve(x, &q)) return sol;
    for (int c = 0; c < 3; ++c)
      sol.rover[c] += x[c];
    sol.ambiguity_sats = columns.sats();
    sol.ambiguities.assign(x.begin() + 3, x.end());
    sol.sigma0 = dd::VarianceFactor(ne, x);
    sol.observations = ne.observations();
    const double scale = ne.observations() > unknowns ? sol.sigma0 * sol.sigma0 : 1.0;
    for (int r = 0; r < 3; ++r)
      for (int c = 0; c < 3; ++c)
        sol.covariance(r, c) = q(r, c) * scale;
    sol.ok = true;
    if (std::sqrt(x[0] * x[0] + x[1] * x[1] + x[2] * x[2]) < 1e-5) break;
  }

  const size_t m = sol.ambiguities.size();
  SymMatrix qa(m), qa_inv(m);
  for (size_t r = 0; r < m; ++r)
    for (size_t c = 0; c < m; ++c)
      qa(r, c) = q(3 + r, 3 + c);
  dd::IntegerFix fix;
  if (!dd::FixIntegers(sol.ambiguities, qa, fix) || !InvertSpd(qa, qa_inv)) return sol;
  sol.ratio = fix.ratio;
  if (fix.ratio < min_ratio) return sol;
  // Position conditioned on the integers: x - Qxa Qa^-1 (a_float - a_fixed), and the
  // covariance Qxx - Qxa Qa^-1 Qax.
  std::vector<double> da(m, 0.0);
  for (size_t r = 0; r < m; ++r)
    for (size_t c = 0; c < m; ++c)
      da[r] += qa_inv(r, c) * (sol.ambiguities[c] - fix.integers[c]);
  for (int r = 0; r < 3; ++r)
    for (size_t c = 0; c < m; ++c)
      sol.rover[r] -= q(r, 3 + c) * da[c];
  const double scale = sol.sigma0 > 0 ? sol.sigma0 * sol.sigma0 : 1.0;
  for (int r = 0; r < 3; ++r)
    for (int c = 0; c < 3; ++c) {
      double s = q(r, c);
      for (size_t i = 0; i < m; ++i)
        for (size_t j = 0; j < m; ++j)
          s -= q(r, 3 + i) * qa_inv(i, j) * q(3 + j, c);
      sol.covariance(r, c) = s * scale;
    }
  sol.ambiguities = fix.integers;
  sol.fixed = true;
  return sol;
}

}  // namespace voxeng
