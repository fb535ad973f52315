// Navigation coordinates of occupations and the information-weighted mean that the library
// keeps for each point from them.
//
// Locking: engines store navigation coordinates from their own threads, and the site data
// reads the means, so the stored coordinates of every occupation and the mean of every point
// are read and written only under the task's solution lock. SetNavCoord and GetNavCoord take
// it themselves; NavigationMean expects the caller to hold it.
#pragma once

#include <optional>

#include "base/tlock.h"
#include "job/items.h"

namespace vox {

// A symmetric 3 x 3 matrix.
struct SymMatrix3 {
  double xx = 0, yy = 0, zz = 0, xy = 0, yz = 0, xz = 0;
};

// Pivots below this (1e-12 as a float) make a matrix count as singular.
constexpr double kPivotLimit = static_cast<double>(1e-12f);

// Inverse of a symmetric matrix by Gaussian elimination; nothing when a pivot falls below
// kPivotLimit. Each element of the inverse is rounded to single precision.
std::optional<SymMatrix3> InvertSymmetric3(const SymMatrix3& m);

// The covariance matrix of navigation coordinates, each product formed in single precision.
SymMatrix3 CovarianceOf(const NavCoord& c);

// Recomputes the point's mean from the navigation coordinates of its occupations. A point
// none of whose occupations has usable coordinates is left as it is. Caller holds the lock.
void NavigationMean(TPointItem& point);

// Stores the occupation's navigation coordinates and, when it stands on a point, refreshes
// that point's mean. True only when the occupation has a point.
bool SetNavCoord(TOccupItem& occupation, const NavCoord& coord, TLock& solution_lock);

// The occupation's stored navigation coordinates, if any.
std::optional<NavCoord> GetNavCoord(const TOccupItem& occupation, TLock& solution_lock);

}  // namespace vox
