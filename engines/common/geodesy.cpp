#include "geodesy.h"

#include <cmath>

namespace voxeng {

namespace {
constexpr double kA = 6378137.0;
constexpr double kF = 1.0 / 298.257223563;
constexpr double kE2 = kF * (2.0 - kF);
}  // namespace

double Dot(const Vec3& a, const Vec3& b) {
  return a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
}
double Norm(const Vec3& a) {
  return std::sqrt(Dot(a, a));
}

Geodetic EcefToGeodetic(const Vec3& xyz) {
  Geodetic g;
  const double p = std::hypot(xyz[0], xyz[1]);
  g.lon = std::atan2(xyz[1], xyz[0]);
  if (p < 1e-9) {  // on the axis: the iteration below would divide by zero
    g.lat = xyz[2] >= 0 ? kPi / 2 : -kPi / 2;
    g.height = std::fabs(xyz[2]) - kA * std::sqrt(1.0 - kE2);
    return g;
  }
  // Fixed-point iteration on the latitude; converges to well below a micrometre in a few
  // rounds for any point near the Earth.
  double lat = std::atan2(xyz[2], p * (1.0 - kE2));
  double h = 0;
  for (int k = 0; k < 10; ++k) {
    const double s = std::sin(lat);
    const double n = kA / std::sqrt(1.0 - kE2 * s * s);
    h = p / std::cos(lat) - n;
    const double next = std::atan2(xyz[2], p * (1.0 - kE2 * n / (n + h)));
    const bool done = std::fabs(next - lat) < 1e-14;
    lat = next;
    if (done) break;
  }
  const double s = std::sin(lat);
  const double n = kA / std::sqrt(1.0 - kE2 * s * s);
  g.lat = lat;
  // Near the poles p/cos(lat) loses precision; use the z-based height there.
  g.height = std::fabs(lat) < 1.0 ? p / std::cos(lat) - n : xyz[2] / s - n * (1.0 - kE2);
  return g;
}

Vec3 GeodeticToEcef(const Geodetic& g) {
  const double s = std::sin(g.lat), c = std::cos(g.lat);
  const double n = kA / std::sqrt(1.0 - kE2 * s * s);
  return {(n + g.height) * c * std::cos(g.lon), (n + g.height) * c * std::sin(g.lon),
          (n * (1.0 - kE2) + g.height) * s};
}

std::array<Vec3, 3> EnuBasis(const Geodetic& g) {
  const double sl = std::sin(g.lat), cl = std::cos(g.lat);
  const double so = std::sin(g.lon), co = std::cos(g.lon);
  return {Vec3{-so, co, 0.0}, Vec3{-sl * co, -sl * so, cl}, Vec3{cl * co, cl * so, sl}};
}

Vec3 EcefToEnu(const Vec3& d, const Geodetic& g) {
  const auto b = EnuBasis(g);
  return {Dot(b[0], d), Dot(b[1], d), Dot(b[2], d)};
}

Vec3 EnuToEcef(const Vec3& enu, const Geodetic& g) {
  const auto b = EnuBasis(g);
  return enu[0] * b[0] + enu[1] * b[1] + enu[2] * b[2];
}

LookAngles Look(const Vec3& receiver, const Vec3& satellite) {
  const Vec3 enu = EcefToEnu(satellite - receiver, EcefToGeodetic(receiver));
  LookAngles a;
  a.elevation = std::atan2(enu[2], std::hypot(enu[0], enu[1]));
  a.azimuth = std::atan2(enu[0], enu[1]);
  if (a.azimuth < 0) a.azimuth += 2 * kPi;
  return a;
}

}  // namespace voxeng
