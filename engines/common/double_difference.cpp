#include "double_difference.h"

#include <algorithm>
#include <cmath>
#include <map>

#include "broadcast.h"
#include "point_solution.h"
#include "troposphere.h"

namespace voxeng {

namespace {

// What one satellite contributes to one epoch after the geometry is computed.
struct SatGeometry {
  const DdSatellite* obs = nullptr;
  Vec3 unit_rover{};     // from the rover towards the satellite
  double computed = 0;   // (rho + tropo) rover minus base, m
  double elevation = 0;  // at the base
};

std::vector<SatGeometry> Geometry(const DdEpoch& e, const Vec3& base, const Vec3& rover,
                                  const DdOptions& o) {
  std::vector<SatGeometry> out;
  const Geodetic gb = EcefToGeodetic(base), gr = EcefToGeodetic(rover);
  for (const DdSatellite& s : e.sats) {
    if (!s.orbit || s.base_code == 0 || s.rover_code == 0) continue;
    const TransmitState sb = StateAtTransmit(*s.orbit, e.t_base, s.base_code, base);
    const TransmitState sr = StateAtTransmit(*s.orbit, e.t_rover, s.rover_code, rover);
    SatGeometry g;
    g.obs = &s;
    g.elevation = Look(base, sb.state.position).elevation;
    if (g.elevation < o.elevation_mask) continue;
    const Vec3 lr = sr.state.position - rover;
    const double rho_r = Norm(lr), rho_b = Norm(sb.state.position - base);
    g.unit_rover = (1.0 / rho_r) * lr;
    g.computed = rho_r - rho_b;
    if (o.troposphere) {
      const double el_r = Look(rover, sr.state.position).elevation;
      g.computed += TroposphereDelay(gr.lat, gr.height, el_r) -
                    TroposphereDelay(gb.lat, gb.height, g.elevation);
    }
    out.push_back(g);
  }
  return out;
}

size_t HighestElevation(const std::vector<SatGeometry>& g) {
  size_t best = 0;
  for (size_t k = 1; k < g.size(); ++k)
    if (g[k].elevation > g[best].elevation) best = k;
  return best;
}

// Weight matrix of the double differences against reference `ref`: single differences of
// variance 2 sigma^2 / sin^2(el), and the reference's shared by every row.
SymMatrix DdWeights(const std::vector<SatGeometry>& g, size_t ref, const std::vector<size_t>& rows,
                    double sigma) {
  const size_t m = rows.size();
  SymMatrix c(m);
  const double vref = 2.0 / ElevationWeight(sigma, g[ref].elevation);
  for (size_t i = 0; i < m; ++i) {
    for (size_t k = 0; k < m; ++k)
      c(i, k) = vref;
    c(i, i) += 2.0 / ElevationWeight(sigma, g[rows[i]].elevation);
  }
  SymMatrix w(m);
  InvertSpd(c, w);
  return w;
}

std::vector<double> PositionRow(const SatGeometry& j, const SatGeometry& ref, size_t unknowns) {
  std::vector<double> row(unknowns, 0.0);
  for (int c = 0; c < 3; ++c)
    row[c] = -j.unit_rover[c] + ref.unit_rover[c];
  return row;
}

void AddCodeBlock(NormalEquations& ne, const std::vector<SatGeometry>& g, size_t ref,
                  size_t unknowns, const DdOptions& o) {
  std::vector<size_t> rows;
  std::vector<std::vector<double>> a;
  std::vector<double> l;
  const double ref_obs = g[ref].obs->rover_code - g[ref].obs->base_code;
  for (size_t k = 0; k < g.size(); ++k) {
    if (k == ref) continue;
    rows.push_back(k);
    a.push_back(PositionRow(g[k], g[ref], unknowns));
    const double dd = (g[k].obs->rover_code - g[k].obs->base_code) - ref_obs;
    l.push_back(dd - (g[k].computed - g[ref].computed));
  }
  if (!rows.empty()) ne.AddCorrelated(a, l, DdWeights(g, ref, rows, o.code_sigma));
}

void FinishCovariance(BaselineSolution& sol, const NormalEquations& ne, const SymMatrix& q,
                      size_t unknowns) {
  sol.observations = ne.observations();
  const double redundancy = static_cast<double>(ne.observations()) - unknowns;
  const double scale = redundancy > 0 ? sol.sigma0 * sol.sigma0 : 1.0;
  for (int r = 0; r < 3; ++r)
    for (int c = 0; c < 3; ++c)
      sol.covariance(r, c) = q(r, c) * scale;
}

double VarianceFactor(const NormalEquations& ne, const std::vector<double>& x) {
  double vtpv = ne.weighted_ll();
  for (size_t r = 0; r < x.size(); ++r)
    vtpv -= x[r] * ne.rhs()[r];
  const double redundancy = static_cast<double>(ne.observations()) - x.size();
  return redundancy > 0 ? std::sqrt(std::max(vtpv, 0.0) / redundancy) : 0.0;
}

}  // namespace

BaselineSolution SolveCodeBaseline(std::span<const DdEpoch> epochs, const Vec3& base,
                                   const Vec3& rover_approx, const DdOptions& options) {
  BaselineSolution sol;
  sol.rover = rover_approx;
  for (int it = 0; it < options.iterations; ++it) {
    NormalEquations ne(3);
    for (const DdEpoch& e : epochs) {
      const auto g = Geometry(e, base, sol.rover, options);
      if (g.size() < 2) continue;
      AddCodeBlock(ne, g, HighestElevation(g), 3, options);
    }
    std::vector<double> dx;
    SymMatrix q(3);
    if (ne.observations() < 3 || !ne.Solve(dx, &q)) return sol;
    for (int c = 0; c < 3; ++c)
      sol.rover[c] += dx[c];
    sol.sigma0 = VarianceFactor(ne, dx);
    FinishCovariance(sol, ne, q, 3);
    sol.ok = true;
    if (std::sqrt(dx[0] * dx[0] + dx[1] * dx[1] + dx[2] * dx[2]) < 1e-4) break;
  }
  return sol;
}

namespace {

// The reference satellite of a phase solution: the one in most epochs above the mask.
int PickReference(std::span<const DdEpoch> epochs, const Vec3& base, const Vec3& rover,
                  const DdOptions& o) {
  std::map<int, std::pair<int, double>> seen;  // sat -> epochs, summed elevation
  for (const DdEpoch& e : epochs)
    for (const SatGeometry& g : Geometry(e, base, rover, o))
      if (g.obs->base_phase != 0 && g.obs->rover_phase != 0) {
        auto& s = seen[g.obs->sat];
        ++s.first;
        s.second += g.elevation;
      }
  int best = 0;
  std::pair<int, double> score{-1, 0};
  for (const auto& [sat, s] : seen)
    if (s > score) {
      score = s;
      best = sat;
    }
  return best;
}

// Sequential conditional rounding: the most precise ambiguity first, each fix conditioning
// the others. Returns the integer vector.
std::vector<double> Bootstrap(std::vector<double> a, SymMatrix q) {
  const size_t m = a.size();
  std::vector<bool> done(m, false);
  std::vector<double> fixed(m, 0.0);
  for (size_t step = 0; step < m; ++step) {
    size_t i = m;
    for (size_t k = 0; k < m; ++k)
      if (!done[k] && (i == m || q(k, k) < q(i, i))) i = k;
    fixed[i] = std::round(a[i]);
    done[i] = true;
    const double d = a[i] - fixed[i], qii = q(i, i);
    for (size_t k = 0; k < m; ++k) {
      if (done[k]) continue;
      a[k] -= q(k, i) / qii * d;
      for (size_t c = 0; c < m; ++c)
        if (!done[c]) q(k, c) -= q(k, i) * q(i, c) / qii;
    }
  }
  return fixed;
}

double Distance(const std::vector<double>& a, const std::vector<double>& z, const SymMatrix& qinv) {
  double s = 0;
  for (size_t r = 0; r < a.size(); ++r)
    for (size_t c = 0; c < a.size(); ++c)
      s += (a[r] - z[r]) * qinv(r, c) * (a[c] - z[c]);
  return s;
}

}  // namespace

BaselineSolution SolvePhaseBaseline(std::span<const DdEpoch> epochs, const Vec3& base,
                                    const Vec3& rover_approx, const DdOptions& options,
                                    double min_ratio) {
  BaselineSolution sol = SolveCodeBaseline(epochs, base, rover_approx, options);
  if (!sol.ok) return sol;
  sol.ok = false;
  const int ref_sat = PickReference(epochs, base, sol.rover, options);
  sol.reference_sat = ref_sat;
  const double lambda = options.wavelength;

  std::vector<double> x;
  SymMatrix q;
  for (int it = 0; it < options.iterations; ++it) {
    // Ambiguity columns in order of first appearance.
    std::map<int, size_t> column;
    std::vector<int> order;
    std::vector<std::vector<SatGeometry>> geometry;
    for (const DdEpoch& e : epochs) {
      geometry.push_back(Geometry(e, base, sol.rover, options));
      for (const SatGeometry& g : geometry.back())
        if (g.obs->sat != ref_sat && g.obs->base_phase != 0 && g.obs->rover_phase != 0 &&
            !column.count(g.obs->sat)) {
          column[g.obs->sat] = 3 + order.size();
          order.push_back(g.obs->sat);
        }
    }
    const size_t unknowns = 3 + order.size();
    NormalEquations ne(unknowns);
    for (const auto& g : geometry) {
      auto ref = std::find_if(g.begin(), g.end(),
                              [&](const SatGeometry& s) { return s.obs->sat == ref_sat; });
      if (ref == g.end() || ref->obs->base_phase == 0 || ref->obs->rover_phase == 0) continue;
      const size_t r = static_cast<size_t>(ref - g.begin());
      AddCodeBlock(ne, g, r, unknowns, options);
      std::vector<size_t> rows;
      std::vector<std::vector<double>> a;
      std::vector<double> l;
      const double ref_phase = ref->obs->rover_phase - ref->obs->base_phase;
      for (size_t k = 0; k < g.size(); ++k) {
        if (k == r || g[k].obs->base_phase == 0 || g[k].obs->rover_phase == 0) continue;
        rows.push_back(k);
        auto row = PositionRow(g[k], *ref, unknowns);
        row[column[g[k].obs->sat]] = lambda;
        a.push_back(row);
        const double dd = (g[k].obs->rover_phase - g[k].obs->base_phase) - ref_phase;
        l.push_back(lambda * dd - (g[k].computed - ref->computed));
      }
      if (!rows.empty()) ne.AddCorrelated(a, l, DdWeights(g, r, rows, options.phase_sigma));
    }
    if (order.empty() || !ne.Solve(x, &q)) return sol;
    for (int c = 0; c < 3; ++c)
      sol.rover[c] += x[c];
    sol.ambiguity_sats = order;
    sol.ambiguities.assign(x.begin() + 3, x.end());
    sol.sigma0 = VarianceFactor(ne, x);
    FinishCovariance(sol, ne, q, unknowns);
    sol.ok = true;
    if (std::sqrt(x[0] * x[0] + x[1] * x[1] + x[2] * x[2]) < 1e-5) break;
  }

  // Integer fix: bootstrapped candidate, tested against every single-ambiguity neighbour.
  const size_t m = sol.ambiguities.size();
  SymMatrix qa(m), qa_inv(m);
  for (size_t r = 0; r < m; ++r)
    for (size_t c = 0; c < m; ++c)
      qa(r, c) = q(3 + r, 3 + c);
  if (!InvertSpd(qa, qa_inv)) return sol;
  const std::vector<double> best = Bootstrap(sol.ambiguities, qa);
  const double d_best = Distance(sol.ambiguities, best, qa_inv);
  double d_second = INFINITY;
  for (size_t k = 0; k < m; ++k) {
    std::vector<double> other = best;
    other[k] += sol.ambiguities[k] > best[k] ? 1.0 : -1.0;
    d_second = std::min(d_second, Distance(sol.ambiguities, other, qa_inv));
  }
  sol.ratio = d_best > 0 ? d_second / d_best : INFINITY;
  if (sol.ratio < min_ratio) return sol;
  // Position conditioned on the integers: x - Qxa Qa^-1 (a_float - a_fixed).
  std::vector<double> da(m);
  for (size_t r = 0; r < m; ++r) {
    da[r] = 0;
    for (size_t c = 0; c < m; ++c)
      da[r] += qa_inv(r, c) * (sol.ambiguities[c] - best[c]);
  }
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
  sol.ambiguities = best;
  sol.fixed = true;
  return sol;
}

}  // namespace voxeng
