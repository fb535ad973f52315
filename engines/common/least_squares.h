// Weighted least squares through normal equations, small and dense: the estimators of the
// engines have a handful of unknowns (position, clock, a few ambiguities), so a Cholesky
// factorisation of N = A'WA is both fast and plenty accurate.
#pragma once

#include <cstddef>
#include <vector>

namespace voxeng {

// A square symmetric matrix in row-major order.
struct SymMatrix {
  size_t n = 0;
  std::vector<double> v;
  explicit SymMatrix(size_t size = 0) : n(size), v(size * size, 0.0) {}
  double& operator()(size_t r, size_t c) { return v[r * n + c]; }
  double operator()(size_t r, size_t c) const { return v[r * n + c]; }
};

class NormalEquations {
 public:
  explicit NormalEquations(size_t unknowns) : n_(unknowns), b_(unknowns, 0.0) {}

  // One observation: row a (size unknowns), misclosure l (observed minus computed), weight w.
  void Add(const std::vector<double>& a, double l, double w);
  // Several correlated observations: rows a (m rows), misclosures l, weight matrix w (m x m).
  void AddCorrelated(const std::vector<std::vector<double>>& a, const std::vector<double>& l,
                     const SymMatrix& w);
  // Adds w to the diagonal element k (a constraint pulling unknown k towards zero).
  void Constrain(size_t k, double w) { n_(k, k) += w; }

  // Solves; false when the normal matrix is not positive definite (too few or degenerate
  // observations). The covariance is the inverse of N (scale it by the variance factor).
  bool Solve(std::vector<double>& x, SymMatrix* covariance = nullptr) const;

  size_t observations() const { return count_; }
  double weighted_ll() const { return ll_; }  // l'Wl, for the variance factor
  const SymMatrix& matrix() const { return n_; }
  const std::vector<double>& rhs() const { return b_; }

 private:
  SymMatrix n_;
  std::vector<double> b_;
  size_t count_ = 0;
  double ll_ = 0;
};

// Cholesky factor L (lower, in place) of a positive definite matrix; false if not positive.
bool Cholesky(SymMatrix& m);
// Inverse of a positive definite matrix; false if not positive definite.
bool InvertSpd(const SymMatrix& m, SymMatrix& inverse);

}  // namespace voxeng
