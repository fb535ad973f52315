#include "dd_geometry.h"

#include <algorithm>
#include <cmath>

#include "broadcast.h"
#include "point_solution.h"
#include "troposphere.h"

namespace voxeng::dd {

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

SymMatrix DdWeights(const std::vector<SatGeometry>& g, size_t ref, const std::vector<size_t>& rows,
                    double sigma) {
  // Single differences of variance 2 sigma^2 / sin^2(el); the reference's is shared by every
  // row, which correlates them.
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

void AddPhaseBlock(NormalEquations& ne, const std::vector<SatGeometry>& g, size_t ref,
                   const std::vector<int>& column, size_t unknowns, const DdOptions& o,
                   const std::vector<double>* known) {
  if (!g[ref].HasPhase()) return;
  std::vector<size_t> rows;
  std::vector<std::vector<double>> a;
  std::vector<double> l;
  const double lambda = o.wavelength;
  const double ref_phase = g[ref].obs->rover_phase - g[ref].obs->base_phase;
  for (size_t k = 0; k < g.size(); ++k) {
    if (k == ref || column[k] < 0 || !g[k].HasPhase()) continue;
    rows.push_back(k);
    auto row = PositionRow(g[k], g[ref], unknowns);
    double n = 0;
    if (known)
      n = (*known)[static_cast<size_t>(column[k])];
    else
      row[static_cast<size_t>(column[k])] = lambda;
    a.push_back(row);
    const double dd = (g[k].obs->rover_phase - g[k].obs->base_phase) - ref_phase;
    l.push_back(lambda * (dd - n) - (g[k].computed - g[ref].computed));
  }
  if (!rows.empty()) ne.AddCorrelated(a, l, DdWeights(g, ref, rows, o.phase_sigma));
}

double VarianceFactor(const NormalEquations& ne, const std::vector<double>& x) {
  double vtpv = ne.weighted_ll();
  for (size_t r = 0; r < x.size(); ++r)
    vtpv -= x[r] * ne.rhs()[r];
  const double redundancy = static_cast<double>(ne.observations()) - x.size();
  return redundancy > 0 ? std::sqrt(std::max(vtpv, 0.0) / redundancy) : 0.0;
}

int PickReference(std::span<const DdEpoch> epochs, const Vec3& base, std::span<const Vec3> rovers,
                  const DdOptions& o) {
  std::map<int, std::pair<int, double>> seen;  // sat -> epochs, summed elevation
  for (size_t k = 0; k < epochs.size(); ++k)
    for (const SatGeometry& g :
         Geometry(epochs[k], base, rovers[std::min(k, rovers.size() - 1)], o))
      if (g.HasPhase()) {
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

std::vector<int> AmbiguityColumns::Assign(const std::vector<SatGeometry>& g, int reference_sat,
                                          size_t first) {
  std::vector<int> column(g.size(), -1);
  std::map<int, int> still_open;
  for (size_t k = 0; k < g.size(); ++k) {
    const int sat = g[k].obs->sat;
    if (sat == reference_sat || !g[k].HasPhase()) continue;
    auto it = open_.find(sat);
    int col;
    if (it != open_.end() && !g[k].obs->slip) {
      col = it->second;
    } else {
      col = static_cast<int>(first + sat_of_column_.size());
      sat_of_column_.push_back(sat);
    }
    column[k] = col;
    still_open[sat] = col;
  }
  open_ = std::move(still_open);  // a satellite missing from this epoch starts a new arc
  return column;
}

namespace {

// Sequential conditional rounding: the most precise ambiguity first, each fix conditioning
// the others.
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

bool FixIntegers(const std::vector<double>& a, const SymMatrix& q, IntegerFix& fix) {
  const size_t m = a.size();
  SymMatrix qinv(m);
  if (m == 0 || !InvertSpd(q, qinv)) return false;
  fix.integers = Bootstrap(a, q);
  const double best = Distance(a, fix.integers, qinv);
  double second = INFINITY;
  for (size_t k = 0; k < m; ++k) {
    std::vector<double> other = fix.integers;
    other[k] += a[k] > fix.integers[k] ? 1.0 : -1.0;
    second = std::min(second, Distance(a, other, qinv));
  }
  fix.ratio = best > 0 ? second / best : INFINITY;
  return true;
}

}  // namespace voxeng::dd
