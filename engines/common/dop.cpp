#include "dop.h"

#include <cmath>
#include <vector>

#include "least_squares.h"

namespace voxeng {

double Hdop(const Vec3& receiver, std::span<const Vec3> satellites, double elevation_mask) {
  if (Norm(receiver) < 1.0e6) return 0;
  const Geodetic place = EcefToGeodetic(receiver);
  NormalEquations ne(4);
  int used = 0;
  for (const Vec3& sat : satellites) {
    if (Look(receiver, sat).elevation < elevation_mask) continue;
    const Vec3 los = EcefToEnu(sat - receiver, place);
    const double rho = Norm(los);
    if (rho <= 0) continue;
    ne.Add({-los[0] / rho, -los[1] / rho, -los[2] / rho, 1.0}, 0.0, 1.0);
    ++used;
  }
  SymMatrix q;
  if (used < 4 || !InvertSpd(ne.matrix(), q)) return 0;
  const double h = q(0, 0) + q(1, 1);
  return h > 0 ? std::sqrt(h) : 0;
}

}  // namespace voxeng
