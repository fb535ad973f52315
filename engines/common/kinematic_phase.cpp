// Kinematic carrier-phase solution: positions of every epoch and the ambiguities of the
// session in one least-squares adjustment. Each epoch's three position unknowns are
// eliminated from the normal equations as soon as its observations are in (a Schur
// complement), so only the ambiguities' matrix grows; after the ambiguities are solved (and
// fixed), each epoch's position follows by back-substitution.
#include <cmath>

#include "dd_geometry.h"

namespace voxeng {

using dd::SatGeometry;

namespace {

// The reduced normal equations of one epoch, kept for the back-substitution.
struct EpochBlock {
  bool used = false;
  SymMatrix p_inv{3};                    // (N_pp)^-1
  std::vector<std::vector<double>> npa;  // 3 rows x m ambiguity columns
  std::vector<double> bp = std::vector<double>(3, 0.0);
};

size_t ReferenceIndex(const std::vector<SatGeometry>& g, int ref_sat) {
  size_t r = 0;
  while (r < g.size() && (g[r].obs->sat != ref_sat || !g[r].HasPhase()))
    ++r;
  return r;
}

// Adds one epoch (positions eliminated) to the ambiguities' normal equations.
bool ReduceEpoch(const NormalEquations& ne, size_t m, SymMatrix& naa, std::vector<double>& ba,
                 EpochBlock& block) {
  const SymMatrix& n = ne.matrix();
  const std::vector<double>& b = ne.rhs();
  SymMatrix npp(3);
  for (int r = 0; r < 3; ++r)
    for (int c = 0; c < 3; ++c)
      npp(r, c) = n(r, c);
  if (!InvertSpd(npp, block.p_inv)) return false;
  block.npa.assign(3, std::vector<double>(m, 0.0));
  for (int r = 0; r < 3; ++r) {
    block.bp[r] = b[r];
    for (size_t c = 0; c < m; ++c)
      block.npa[r][c] = n(r, 3 + c);
  }
  // t = P^-1 * Npa (3 x m), then Naa += Naa of the epoch - Npa' t and ba += b_a - t' bp.
  std::vector<std::vector<double>> t(3, std::vector<double>(m, 0.0));
  for (int r = 0; r < 3; ++r)
    for (size_t c = 0; c < m; ++c)
      for (int k = 0; k < 3; ++k)
        t[r][c] += block.p_inv(r, k) * block.npa[k][c];
  for (size_t i = 0; i < m; ++i) {
    double bi = b[3 + i];
    for (int k = 0; k < 3; ++k)
      bi -= t[k][i] * block.bp[k];
    ba[i] += bi;
    for (size_t j = 0; j < m; ++j) {
      double v = n(3 + i, 3 + j);
      for (int k = 0; k < 3; ++k)
        v -= block.npa[k][i] * t[k][j];
      naa(i, j) += v;
    }
  }
  block.used = true;
  return true;
}

}  // namespace

KinematicSolution SolveKinematicPhase(std::span<const DdEpoch> epochs, const Vec3& base,
                                      std::span<const Vec3> rover_approx, const DdOptions& options,
                                      double min_ratio) {
  KinematicSolution sol;
  const size_t n = epochs.size();
  if (n == 0 || rover_approx.empty()) return sol;
  sol.rover.resize(n);
  sol.epoch_ok.assign(n, false);
  sol.covariance.assign(n, SymMatrix(3));
  // Start every epoch from its own code solution.
  for (size_t k = 0; k < n; ++k) {
    const Vec3 start = rover_approx[std::min(k, rover_approx.size() - 1)];
    const BaselineSolution code = SolveCodeBaseline(epochs.subspan(k, 1), base, start, options);
    sol.rover[k] = code.ok ? code.rover : start;
  }
  sol.reference_sat = dd::PickReference(epochs, base, sol.rover, options);

  SymMatrix naa_inv;
  for (int it = 0; it < options.iterations; ++it) {
    dd::AmbiguityColumns columns;
    std::vector<std::vector<SatGeometry>> geometry(n);
    std::vector<std::vector<int>> column_of(n);
    for (size_t k = 0; k < n; ++k) {
      geometry[k] = dd::Geometry(epochs[k], base, sol.rover[k], options);
      column_of[k] = columns.Assign(geometry[k], sol.reference_sat, 3);
    }
    const size_t m = columns.count();
    if (m == 0) return sol;
    SymMatrix naa(m);
    std::vector<double> ba(m, 0.0);
    std::vector<EpochBlock> blocks(n);
    for (size_t k = 0; k < n; ++k) {
      const size_t r = ReferenceIndex(geometry[k], sol.reference_sat);
      if (r == geometry[k].size()) continue;
      NormalEquations ne(3 + m);
      dd::AddCodeBlock(ne, geometry[k], r, 3 + m, options);
      dd::AddPhaseBlock(ne, geometry[k], r, column_of[k], 3 + m, options);
      ReduceEpoch(ne, m, naa, ba, blocks[k]);
    }
    if (!InvertSpd(naa, naa_inv)) return sol;
    std::vector<double> a(m, 0.0);
    for (size_t i = 0; i < m; ++i)
      for (size_t j = 0; j < m; ++j)
        a[i] += naa_inv(i, j) * ba[j];
    double largest_step = 0;
    for (size_t k = 0; k < n; ++k) {
      sol.epoch_ok[k] = blocks[k].used;
      if (!blocks[k].used) continue;
      std::vector<double> rhs = blocks[k].bp;
      for (int r = 0; r < 3; ++r)
        for (size_t c = 0; c < m; ++c)
          rhs[r] -= blocks[k].npa[r][c] * a[c];
      for (int r = 0; r < 3; ++r) {
        double dx = 0;
        for (int c = 0; c < 3; ++c)
          dx += blocks[k].p_inv(r, c) * rhs[c];
        sol.rover[k][r] += dx;
        largest_step = std::max(largest_step, std::fabs(dx));
      }
      sol.covariance[k] = blocks[k].p_inv;
    }
    sol.ambiguity_sats = columns.sats();
    sol.ambiguities = a;
    sol.ok = true;
    if (largest_step < 1e-4) break;
  }

  dd::IntegerFix fix;
  if (!dd::FixIntegers(sol.ambiguities, naa_inv, fix)) return sol;
  sol.ratio = fix.ratio;
  if (fix.ratio < min_ratio) return sol;
  // With the integers known every epoch stands alone: phase double differences to the
  // millimetre, code along only to keep the normal equations whole.
  for (int it = 0; it < 2; ++it) {
    dd::AmbiguityColumns columns;
    for (size_t k = 0; k < n; ++k) {
      const auto g = dd::Geometry(epochs[k], base, sol.rover[k], options);
      const auto column = columns.Assign(g, sol.reference_sat, 0);
      const size_t r = ReferenceIndex(g, sol.reference_sat);
      if (r == g.size()) continue;
      NormalEquations ne(3);
      dd::AddCodeBlock(ne, g, r, 3, options);
      dd::AddPhaseBlock(ne, g, r, column, 3, options, &fix.integers);
      std::vector<double> dx;
      SymMatrix q(3);
      if (!ne.Solve(dx, &q)) continue;
      for (int c = 0; c < 3; ++c)
        sol.rover[k][c] += dx[c];
      sol.covariance[k] = q;
    }
  }
  sol.ambiguities = fix.integers;
  sol.fixed = true;
  return sol;
}

}  // namespace voxeng
