// The reference ellipsoid and the conversions between Earth-centred Cartesian coordinates
// and geodetic latitude, longitude and ellipsoidal height, plus the local east/north/up
// frame. The library works on one ellipsoid, the GPS frame's (GpsEllipsoid()); its inverse
// flattening is carried as 298.25722, and stored results depend on that value.
//
// Everything here is a pure function; GpsEllipsoid() is built once on first use and then
// only read, so any thread may call any of it.
#pragma once

namespace vox {

// The field order is the record's layout as engines know it.
struct Ellipsoid {
  double a;                   // semi-major axis, metres
  double e;                   // first eccentricity
  double gm;                  // gravitational constant, m^3/s^2
  double rotation_rate;       // earth rotation rate, rad/s
  double inverse_flattening;  // 1/f
  double f;                   // flattening
  double e2;                  // first eccentricity squared
  double k;                   // 1 / (1 - f)^2
  double a_over_1_minus_f;    // a / (1 - f), the polar radius of curvature
};

// Derives the dependent fields from a, 1/f, GM and the rotation rate.
Ellipsoid MakeEllipsoid(double a, double inverse_flattening, double gm, double rotation_rate);

// a = 6378137.0 m, 1/f = 298.25722, GM = 3.986005e14 m^3/s^2, rotation 7.2921151467e-05 rad/s.
const Ellipsoid& GpsEllipsoid();

struct Geodetic {
  double latitude = 0;   // radians, -pi/2 to pi/2
  double longitude = 0;  // radians, 0 to 2 pi
  double height = 0;     // metres above the ellipsoid
};

struct Cartesian {
  double x = 0, y = 0, z = 0;  // metres, Earth-centred, Earth-fixed
};

// Iterates on tan(latitude) (at most 100 times, to 1e-12). Points on the polar axis get
// longitude 0 and the pole's latitude; the centre of the Earth gets latitude 0 and height
// -a.
Geodetic CartesianToGeodetic(const Ellipsoid& ellipsoid, const Cartesian& position);
Cartesian GeodeticToCartesian(const Ellipsoid& ellipsoid, const Geodetic& position);

// The ellipsoidal height of an Earth-centred position on the GPS ellipsoid.
double EllipsoidalHeight(const Cartesian& position);

// Unit vectors of the local east, north and up directions at a latitude and longitude,
// in Earth-centred coordinates.
struct LocalFrame {
  Cartesian east, north, up;
};
LocalFrame LocalFrameAt(double latitude, double longitude);

}  // namespace vox
