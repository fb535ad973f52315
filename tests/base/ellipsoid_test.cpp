#include "base/ellipsoid.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include <unistd.h>

namespace vox {
namespace {

constexpr double kPi = 3.141592653589793;
constexpr double kDeg = kPi / 180.0;
constexpr double kTenthMm = 1e-4;

TEST(Ellipsoid, GpsRecordCarriesTheShortInverseFlattening) {
  const Ellipsoid& el = GpsEllipsoid();
  EXPECT_EQ(el.a, 6378137.0);
  EXPECT_EQ(el.inverse_flattening, 298.25722);
  EXPECT_EQ(el.gm, 3.986005e14);
  EXPECT_EQ(el.rotation_rate, 7.2921151467e-05);
  EXPECT_DOUBLE_EQ(el.f, 1 / 298.25722);
  EXPECT_DOUBLE_EQ(el.e2, el.f * (2 - el.f));
  EXPECT_DOUBLE_EQ(el.e * el.e, el.e2);
  EXPECT_DOUBLE_EQ(el.k, 1 / ((1 - el.f) * (1 - el.f)));
  EXPECT_DOUBLE_EQ(el.a_over_1_minus_f, el.a / (1 - el.f));
  EXPECT_EQ(&el, &GpsEllipsoid());
}

TEST(Ellipsoid, AxisAndEquatorCases) {
  const Ellipsoid& el = GpsEllipsoid();
  Geodetic g = CartesianToGeodetic(el, {6378137, 0, 0});
  EXPECT_EQ(g.latitude, 0);
  EXPECT_EQ(g.longitude, 0);
  EXPECT_NEAR(g.height, 0, 1e-9);

  g = CartesianToGeodetic(el, {0, 0, 6356752.3});
  EXPECT_EQ(g.longitude, 0);
  EXPECT_EQ(g.latitude, kPi / 2);
  EXPECT_NEAR(g.height, 0, 0.1);
  g = CartesianToGeodetic(el, {0, 0, -6356852.3});
  EXPECT_EQ(g.latitude, -kPi / 2);
  EXPECT_NEAR(g.height, 100, 0.1);

  g = CartesianToGeodetic(el, {0, -1, 0});
  EXPECT_DOUBLE_EQ(g.longitude, 3 * kPi / 2);
  EXPECT_EQ(g.latitude, 0);
  EXPECT_DOUBLE_EQ(g.height, 1 - el.a);

  g = CartesianToGeodetic(el, {0, 0, 0});
  EXPECT_EQ(g.latitude, 0);
  EXPECT_EQ(g.longitude, 0);
  EXPECT_EQ(g.height, -el.a);
  EXPECT_EQ(EllipsoidalHeight({0, 0, 0}), -6378137.0);
}

TEST(Ellipsoid, LongitudeLiesInZeroToTwoPi) {
  const Ellipsoid& el = GpsEllipsoid();
  for (double lon = -179.5; lon < 180; lon += 7.25) {
    const Cartesian c = GeodeticToCartesian(el, {30 * kDeg, lon * kDeg, 50});
    const Geodetic g = CartesianToGeodetic(el, c);
    EXPECT_GE(g.longitude, 0);
    EXPECT_LT(g.longitude, 2 * kPi);
    EXPECT_NEAR(std::remainder(g.longitude - lon * kDeg, 2 * kPi), 0, 1e-12);
    EXPECT_NEAR(g.latitude, 30 * kDeg, 1e-12);
    EXPECT_NEAR(g.height, 50, kTenthMm);
  }
}

TEST(Ellipsoid, LocalFrameIsOrthonormalAndPointsTheRightWay) {
  const double lat = 47 * kDeg, lon = 8 * kDeg;
  const LocalFrame f = LocalFrameAt(lat, lon);
  auto dot = [](const Cartesian& a, const Cartesian& b) {
    return a.x * b.x + a.y * b.y + a.z * b.z;
  };
  EXPECT_NEAR(dot(f.east, f.north), 0, 1e-15);
  EXPECT_NEAR(dot(f.east, f.up), 0, 1e-15);
  EXPECT_NEAR(dot(f.north, f.up), 0, 1e-15);
  EXPECT_NEAR(dot(f.up, f.up), 1, 1e-15);
  // One metre up from a point moves the geodetic height by one metre.
  const Ellipsoid& el = GpsEllipsoid();
  Cartesian c = GeodeticToCartesian(el, {lat, lon, 400});
  c = {c.x + f.up.x, c.y + f.up.y, c.z + f.up.z};
  EXPECT_NEAR(CartesianToGeodetic(el, c).height, 401, 1e-5);
  EXPECT_GT(f.north.z, 0);
  EXPECT_GT(f.east.y, 0);
}

// Runs PROJ's cct over lines of four numbers and returns its output lines' numbers.
std::vector<std::vector<double>> RunCct(const std::string& options, const std::string& input) {
  const auto folder = std::filesystem::temp_directory_path();
  const auto in_path = folder / ("vox_cct_in_" + std::to_string(::getpid()) + ".txt");
  std::ofstream(in_path) << input;
  const std::string command =
      "cct -d 12 " + options + " +proj=cart +a=6378137 +rf=298.25722 < " + in_path.string();
  std::vector<std::vector<double>> rows;
  FILE* pipe = popen(command.c_str(), "r");
  if (pipe) {
    char line[512];
    while (std::fgets(line, sizeof line, pipe)) {
      std::istringstream fields(line);
      std::vector<double> row;
      for (double v; fields >> v;)
        row.push_back(v);
      if (row.size() >= 3) rows.push_back(row);
    }
    pclose(pipe);
  }
  std::filesystem::remove(in_path);
  return rows;
}

bool CctAvailable() {
  return std::system("command -v cct > /dev/null 2>&1") == 0;
}

TEST(Ellipsoid, AgreesWithProjCctToATenthOfAMillimetre) {
  if (!CctAvailable()) GTEST_SKIP() << "cct (Debian package proj-bin) is not on PATH";
  const Ellipsoid& el = GpsEllipsoid();
  std::mt19937_64 random(20261206);
  std::uniform_real_distribution<double> lat_deg(-89.99, 89.99), lon_deg(-180, 180),
      height(-500, 40000);
  std::vector<Geodetic> points;
  std::ostringstream forward_input;
  forward_input.precision(17);
  for (int i = 0; i < 100; ++i) {
    const Geodetic g{lat_deg(random) * kDeg, lon_deg(random) * kDeg, height(random)};
    points.push_back(g);
    forward_input << g.longitude / kDeg << ' ' << g.latitude / kDeg << ' ' << g.height << " 0\n";
  }
  // Geodetic to Cartesian.
  const auto xyz = RunCct("", forward_input.str());
  ASSERT_EQ(xyz.size(), points.size());
  std::ostringstream inverse_input;
  inverse_input.precision(17);
  for (size_t i = 0; i < points.size(); ++i) {
    const Cartesian c = GeodeticToCartesian(el, points[i]);
    EXPECT_NEAR(c.x, xyz[i][0], kTenthMm) << i;
    EXPECT_NEAR(c.y, xyz[i][1], kTenthMm) << i;
    EXPECT_NEAR(c.z, xyz[i][2], kTenthMm) << i;
    inverse_input << c.x << ' ' << c.y << ' ' << c.z << " 0\n";
  }
  // Cartesian to geodetic, compared as distances on the ground.
  const auto geo = RunCct("-I", inverse_input.str());
  ASSERT_EQ(geo.size(), points.size());
  for (size_t i = 0; i < points.size(); ++i) {
    const Geodetic g = CartesianToGeodetic(el, GeodeticToCartesian(el, points[i]));
    const double lat = geo[i][1] * kDeg, lon = geo[i][0] * kDeg;
    EXPECT_NEAR((g.latitude - lat) * el.a, 0, kTenthMm) << i;
    EXPECT_NEAR(std::remainder(g.longitude - lon, 2 * kPi) * el.a * std::cos(lat), 0, kTenthMm)
        << i;
    EXPECT_NEAR(g.height, geo[i][2], kTenthMm) << i;
  }
}

}  // namespace
}  // namespace vox
