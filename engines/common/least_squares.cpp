#include "least_squares.h"

#include <algorithm>
#include <cmath>

namespace voxeng {

void NormalEquations::Add(const std::vector<double>& a, double l, double w) {
  const size_t n = n_.n;
  for (size_t r = 0; r < n; ++r) {
    if (a[r] == 0) continue;
    for (size_t c = 0; c < n; ++c)
      n_(r, c) += a[r] * w * a[c];
    b_[r] += a[r] * w * l;
  }
  ll_ += l * w * l;
  ++count_;
}

void NormalEquations::AddCorrelated(const std::vector<std::vector<double>>& a,
                                    const std::vector<double>& l, const SymMatrix& w) {
  const size_t m = a.size(), n = n_.n;
  // wa = W * A (m x n), then N += A' * wa, b += wa' * l.
  std::vector<std::vector<double>> wa(m, std::vector<double>(n, 0.0));
  for (size_t i = 0; i < m; ++i)
    for (size_t k = 0; k < m; ++k)
      if (w(i, k) != 0)
        for (size_t c = 0; c < n; ++c)
          wa[i][c] += w(i, k) * a[k][c];
  for (size_t i = 0; i < m; ++i)
    for (size_t r = 0; r < n; ++r) {
      if (a[i][r] == 0) continue;
      for (size_t c = 0; c < n; ++c)
        n_(r, c) += a[i][r] * wa[i][c];
    }
  for (size_t i = 0; i < m; ++i)
    for (size_t c = 0; c < n; ++c)
      b_[c] += wa[i][c] * l[i];
  for (size_t i = 0; i < m; ++i)
    for (size_t k = 0; k < m; ++k)
      ll_ += l[i] * w(i, k) * l[k];
  count_ += m;
}

bool Cholesky(SymMatrix& m) {
  const size_t n = m.n;
  for (size_t j = 0; j < n; ++j) {
    double d = m(j, j);
    for (size_t k = 0; k < j; ++k)
      d -= m(j, k) * m(j, k);
    if (!(d > 0)) return false;
    m(j, j) = std::sqrt(d);
    for (size_t i = j + 1; i < n; ++i) {
      double s = m(i, j);
      for (size_t k = 0; k < j; ++k)
        s -= m(i, k) * m(j, k);
      m(i, j) = s / m(j, j);
    }
  }
  for (size_t i = 0; i < n; ++i)
    for (size_t j = i + 1; j < n; ++j)
      m(i, j) = 0;
  return true;
}

namespace {
// Solves L L' x = b with the factor of Cholesky().
void SolveFactored(const SymMatrix& l, std::vector<double>& x) {
  const size_t n = l.n;
  for (size_t i = 0; i < n; ++i) {
    for (size_t k = 0; k < i; ++k)
      x[i] -= l(i, k) * x[k];
    x[i] /= l(i, i);
  }
  for (size_t i = n; i-- > 0;) {
    for (size_t k = i + 1; k < n; ++k)
      x[i] -= l(k, i) * x[k];
    x[i] /= l(i, i);
  }
}
}  // namespace

bool InvertSpd(const SymMatrix& m, SymMatrix& inverse) {
  SymMatrix l = m;
  if (!Cholesky(l)) return false;
  inverse = SymMatrix(m.n);
  std::vector<double> col(m.n);
  for (size_t c = 0; c < m.n; ++c) {
    std::fill(col.begin(), col.end(), 0.0);
    col[c] = 1.0;
    SolveFactored(l, col);
    for (size_t r = 0; r < m.n; ++r)
      inverse(r, c) = col[r];
  }
  return true;
}

bool NormalEquations::Solve(std::vector<double>& x, SymMatrix* covariance) const {
  SymMatrix l = n_;
  if (!Cholesky(l)) return false;
  x = b_;
  SolveFactored(l, x);
  if (covariance && !InvertSpd(n_, *covariance)) return false;
  return true;
}

}  // namespace voxeng
