#include "job/navigation_mean.h"

#include <cmath>

namespace vox {
namespace {

double Single(double v) {
  return static_cast<double>(static_cast<float>(v));
}

struct Vec3 {
  double x = 0, y = 0, z = 0;
};

Vec3 Multiply(const SymMatrix3& m, const Vec3& v) {
  return {m.xx * v.x + m.xy * v.y + m.xz * v.z, m.xy * v.x + m.yy * v.y + m.yz * v.z,
          m.xz * v.x + m.yz * v.y + m.zz * v.z};
}

void Add(SymMatrix3& sum, const SymMatrix3& m) {
  sum.xx += m.xx;
  sum.yy += m.yy;
  sum.zz += m.zz;
  sum.xy += m.xy;
  sum.yz += m.yz;
  sum.xz += m.xz;
}

}  // namespace

std::optional<SymMatrix3> InvertSymmetric3(const SymMatrix3& m) {
  // A = L D L^T with unit lower triangular L; the inverse is L^-T D^-1 L^-1.
  const double d1 = m.xx;
  if (!(d1 >= kPivotLimit)) return std::nullopt;
  const double l21 = m.xy / d1;
  const double l31 = m.xz / d1;
  const double d2 = m.yy - m.xy * m.xy / d1;
  if (!(d2 >= kPivotLimit)) return std::nullopt;
  const double r = m.yz - m.xz * m.xy / d1;
  const double d3 = m.zz - m.xz * m.xz / d1 - r * r / d2;
  if (!(d3 >= kPivotLimit)) return std::nullopt;
  const double l32 = r / d2;
  // Rows of L^-1 below the diagonal.
  const double m21 = -l21;
  const double m31 = l21 * l32 - l31;
  const double m32 = -l32;
  SymMatrix3 inv;
  inv.zz = Single(1.0 / d3);
  inv.yy = Single(1.0 / d2 + m32 * m32 / d3);
  inv.xx = Single(1.0 / d1 + m21 * m21 / d2 + m31 * m31 / d3);
  inv.xy = Single(m21 / d2 + m31 * m32 / d3);
  inv.yz = Single(m32 / d3);
  inv.xz = Single(m31 / d3);
  return inv;
}

SymMatrix3 CovarianceOf(const NavCoord& c) {
  SymMatrix3 m;
  m.xx = c.sx * c.sx;
  m.yy = c.sy * c.sy;
  m.zz = c.sz * c.sz;
  m.xy = c.rxy * c.sx * c.sy;
  m.xz = c.rxz * c.sx * c.sz;
  m.yz = c.ryz * c.sy * c.sz;
  return m;
}

void NavigationMean(TPointItem& point) {
  SymMatrix3 information;
  Vec3 weighted;
  bool any = false;
  for (const TROccupItem& link : point.occupations) {
    const TOccupItem* occupation = link.occupation;
    if (occupation == nullptr || !occupation->nav_set) continue;
    const std::optional<SymMatrix3> n = InvertSymmetric3(CovarianceOf(occupation->nav));
    if (!n) continue;
    Add(information, *n);
    const Vec3 p = Multiply(*n, {occupation->nav.x, occupation->nav.y, occupation->nav.z});
    weighted.x += p.x;
    weighted.y += p.y;
    weighted.z += p.z;
    any = true;
  }
  if (!any) return;

  NavCoord mean;
  if (const std::optional<SymMatrix3> q = InvertSymmetric3(information)) {
    const Vec3 position = Multiply(*q, weighted);
    mean.x = position.x;
    mean.y = position.y;
    mean.z = position.z;
    mean.sx = std::sqrt(static_cast<float>(q->xx));
    mean.sy = std::sqrt(static_cast<float>(q->yy));
    mean.sz = std::sqrt(static_cast<float>(q->zz));
    mean.rxy = static_cast<float>(q->xy / (mean.sx * mean.sy));
    mean.rxz = static_cast<float>(q->xz / (mean.sx * mean.sz));
    mean.ryz = static_cast<float>(q->yz / (mean.sy * mean.sz));
  }
  point.nav_mean = mean;
  point.nav_mean_set = true;
}

bool SetNavCoord(TOccupItem& occupation, const NavCoord& coord, TLock& solution_lock) {
  TLockGuard guard(solution_lock);
  occupation.nav = coord;
  occupation.nav_set = true;
  if (occupation.point == nullptr) return false;
  NavigationMean(*occupation.point);
  return true;
}

std::optional<NavCoord> GetNavCoord(const TOccupItem& occupation, TLock& solution_lock) {
  TLockGuard guard(solution_lock);
  if (!occupation.nav_set) return std::nullopt;
  return occupation.nav;
}

}  // namespace vox
