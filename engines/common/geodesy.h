// Earth-centred coordinates, geodetic coordinates on the GPS ellipsoid, local east-north-up
// frames and satellite elevation. Engines cannot reach vox's own conversions, hence these.
#pragma once

#include <array>
#include <numbers>

namespace voxeng {

using Vec3 = std::array<double, 3>;
inline constexpr double kPi = std::numbers::pi;
inline constexpr double kDeg = kPi / 180.0;

inline Vec3 operator-(const Vec3& a, const Vec3& b) {
  return {a[0] - b[0], a[1] - b[1], a[2] - b[2]};
}
inline Vec3 operator+(const Vec3& a, const Vec3& b) {
  return {a[0] + b[0], a[1] + b[1], a[2] + b[2]};
}
inline Vec3 operator*(double s, const Vec3& a) {
  return {s * a[0], s * a[1], s * a[2]};
}
double Dot(const Vec3& a, const Vec3& b);
double Norm(const Vec3& a);

// The GPS ellipsoid: a = 6378137 m, 1/f = 298.257223563.
struct Geodetic {
  double lat = 0;     // rad
  double lon = 0;     // rad, -pi..pi
  double height = 0;  // m above the ellipsoid
};

Geodetic EcefToGeodetic(const Vec3& xyz);
Vec3 GeodeticToEcef(const Geodetic& g);

// Rows: east, north, up unit vectors at the given place.
std::array<Vec3, 3> EnuBasis(const Geodetic& g);
// The vector d (ECEF) expressed as east, north, up at the place g.
Vec3 EcefToEnu(const Vec3& d, const Geodetic& g);
Vec3 EnuToEcef(const Vec3& enu, const Geodetic& g);

struct LookAngles {
  double elevation = 0;  // rad
  double azimuth = 0;    // rad, from north through east
};
LookAngles Look(const Vec3& receiver, const Vec3& satellite);

}  // namespace voxeng
