#include "base/ellipsoid.h"

#include <cmath>

namespace vox {

namespace {

constexpr double kHalfPi = 1.5707963267948966;
constexpr double kTwoPi = 6.283185307179586;
// Below this distance from the polar axis a point counts as on the axis.
constexpr double kAxisDistance = 1e-10;
constexpr int kMaxIterations = 100;
constexpr double kTolerance = 1e-12;

}  // namespace

Ellipsoid MakeEllipsoid(double a, double inverse_flattening, double gm, double rotation_rate) {
  // The dependent fields are written in terms of 1/f, each in one fixed form, so that they
  // come out bit for bit the same wherever the record is built.
  const double rf = inverse_flattening;
  Ellipsoid el{};
  el.a = a;
  el.gm = gm;
  el.rotation_rate = rotation_rate;
  el.inverse_flattening = rf;
  el.f = 1.0 / rf;
  el.e2 = (2.0 * rf - 1.0) / (rf * rf);
  el.e = std::sqrt(el.e2);
  const double q = rf / (rf - 1.0);
  el.k = q * q;
  el.a_over_1_minus_f = a * rf / (rf - 1.0);
  return el;
}

const Ellipsoid& GpsEllipsoid() {
  static const Ellipsoid gps = MakeEllipsoid(6378137.0, 298.25722, 3.986005e14, 7.2921151467e-05);
  return gps;
}

Geodetic CartesianToGeodetic(const Ellipsoid& el, const Cartesian& pos) {
  Geodetic g;
  const double p = std::sqrt(pos.x * pos.x + pos.y * pos.y);
  if (p < kAxisDistance) {
    g.longitude = 0;
    if (pos.z == 0) {
      g.latitude = 0;
      g.height = -el.a;
    } else {
      g.height = std::fabs(pos.z) - el.a * std::sqrt(1.0 - el.e2);
      g.latitude = pos.z > 0 ? kHalfPi : -kHalfPi;
    }
    return g;
  }
  g.longitude = std::atan2(pos.y, pos.x);
  if (g.longitude < 0) g.longitude += kTwoPi;
  const double c = el.e2 * el.a_over_1_minus_f / p;
  const double t0 = pos.z / p;
  double t = t0;
  for (int i = 0; i < kMaxIterations; ++i) {
    const double next = c * t / std::sqrt(t * t + el.k) + t0;
    if (std::fabs(next - t) <= kTolerance) break;  // keeps the last accepted t
    t = next;
  }
  g.height = (p - el.a_over_1_minus_f / std::sqrt(t * t + el.k)) * std::sqrt(t * t + 1.0);
  g.latitude = std::atan(t);
  return g;
}

Cartesian GeodeticToCartesian(const Ellipsoid& el, const Geodetic& g) {
  const double sin_lat = std::sin(g.latitude);
  const double cos_lat = std::cos(g.latitude);
  const double n = el.a / std::sqrt(1.0 - el.e2 * sin_lat * sin_lat);
  Cartesian c;
  c.x = (n + g.height) * cos_lat * std::cos(g.longitude);
  c.y = (n + g.height) * cos_lat * std::sin(g.longitude);
  c.z = (n + g.height - el.e2 * n) * sin_lat;
  return c;
}

double EllipsoidalHeight(const Cartesian& position) {
  return CartesianToGeodetic(GpsEllipsoid(), position).height;
}

LocalFrame LocalFrameAt(double latitude, double longitude) {
  const double sin_lat = std::sin(latitude), cos_lat = std::cos(latitude);
  const double sin_lon = std::sin(longitude), cos_lon = std::cos(longitude);
  LocalFrame frame;
  frame.east = {-sin_lon, cos_lon, 0.0};
  frame.north = {-sin_lat * cos_lon, -sin_lat * sin_lon, cos_lat};
  frame.up = {cos_lat * cos_lon, cos_lat * sin_lon, sin_lat};
  return frame;
}

}  // namespace vox
