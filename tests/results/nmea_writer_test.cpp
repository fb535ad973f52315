#include "results/nmea_writer.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <string>

#include <gtest/gtest.h>

#include "base/ellipsoid.h"
#include "base/gps_time.h"
#include "job/leap_seconds.h"
#include "result_test_util.h"

namespace vox {
namespace {

constexpr double kRadiansPerDegree = 3.14159265358979323846 / 180.0;

std::string Field(const NmeaAngle& a, bool longitude) {
  char text[32];
  std::snprintf(text, sizeof text, longitude ? "%05u.%07u,%c" : "%04u.%07u,%c", a.degrees_minutes,
                a.fraction, a.hemisphere);
  return text;
}

TEST(NmeaFields, LatitudeAndLongitude) {
  EXPECT_EQ(Field(NmeaLatitude(45.5 * kRadiansPerDegree), false), "4530.0000000,N");
  EXPECT_EQ(Field(NmeaLatitude(-33.25 * kRadiansPerDegree), false), "3315.0000000,S");
  EXPECT_EQ(Field(NmeaLongitude(350.0 * kRadiansPerDegree), true), "01000.0000000,W");
  EXPECT_EQ(Field(NmeaLongitude(-10.0 * kRadiansPerDegree), true), "01000.0000000,W");
  EXPECT_EQ(Field(NmeaLongitude(11.5 * kRadiansPerDegree), true), "01130.0000000,E");
  // 59.99999999 minutes of 12 degrees round up to a whole minute, which carries.
  const double degrees = 12.0 + 59.99999999 / 60.0;
  EXPECT_EQ(Field(NmeaLatitude(degrees * kRadiansPerDegree), false), "1300.0000000,N");
}

TEST(NmeaFields, ChecksumIsUpperCaseXorBetweenDollarAndStar) {
  std::string s = "$GPGGA,123519,4807.038,N,01131.000,E,1,08,0.9,545.4,M,46.9,M,,*00\r\n";
  PutNmeaChecksum(s);
  EXPECT_EQ(s.substr(s.size() - 5), "*47\r\n");
  std::string z = "$GPZDA,201530.00,04,07,2002,00,00*00\r\n";
  PutNmeaChecksum(z);
  EXPECT_EQ(z.substr(z.size() - 5), "*60\r\n");
}

TEST(NmeaTime, LeapSecondsMoveTheTimeBack) {
  const TimeMs t = TimeMsFromDate(2018, 3, 1, 12, 0, 0);
  const NmeaUtc utc = NmeaUtcTime(t, 18);
  EXPECT_EQ(utc.hhmmss, 115942u);
  EXPECT_EQ(utc.day, 1);
  EXPECT_EQ(utc.month, 3);
  EXPECT_EQ(utc.year, 2018);
  // Across midnight the date goes back as well.
  const NmeaUtc early = NmeaUtcTime(TimeMsFromDate(2018, 1, 1, 0, 0, 5), 18);
  EXPECT_EQ(early.hhmmss, 235947u);
  EXPECT_EQ(early.day, 31);
  EXPECT_EQ(early.year, 2017);
}

TEST(NmeaTime, UncoveredTimesUseTheLatestKnownCount) {
  ResetLeapTableForTesting();
  EXPECT_EQ(NmeaLeapSeconds(TimeMsFromDate(2017, 3, 1)), 18u);
  // The built-in table ends in mid-2017; later times keep its last count.
  EXPECT_EQ(NmeaLeapSeconds(TimeMsFromDate(2021, 3, 1)), 18u);
  EXPECT_EQ(NmeaLeapSeconds(TimeMsFromDate(2016, 3, 1)), 17u);
  ResetLeapTableForTesting();
}

TEST(NmeaTime, ZoneFromTheClocksWhenTheValueIs28800) {
  using platform::LocalDateTime;
  using platform::UtcDateTime;
  const LocalDateTime local{2020, 2, 1, 7, 0, 0};
  const UtcDateTime utc{2020, 1, 31, 23, 0, 0};
  EXPECT_EQ(NmeaZoneSeconds(-3600, local, utc), -3600);
  EXPECT_EQ(NmeaZoneSeconds(28800, local, utc), -28800);  // local a day ahead, month wrap
  EXPECT_EQ(NmeaZoneSeconds(28800, LocalDateTime{2020, 2, 29, 20, 0, 0},
                            UtcDateTime{2020, 3, 1, 2, 0, 0}),
            21600);  // a day behind, leap-year February
  EXPECT_EQ(NmeaZoneSeconds(28800, LocalDateTime{2020, 6, 1, 12, 30, 0},
                            UtcDateTime{2020, 6, 1, 10, 0, 0}),
            -9000);
}

NmeaFix FixAt(double lat_deg, double lon_deg, double height) {
  const Cartesian c = GeodeticToCartesian(
      GpsEllipsoid(), Geodetic{lat_deg * kRadiansPerDegree, lon_deg * kRadiansPerDegree, height});
  NmeaFix fix;
  fix.time = TimeMsFromDate(2017, 3, 1, 12, 0, 0);
  fix.time.ms = 250;
  fix.x = c.x;
  fix.y = c.y;
  fix.z = c.z;
  fix.hdop = 1.25f;
  fix.satellites = 7;
  fix.quality = 4;
  return fix;
}

TEST(NmeaSentences, ZdaWithZoneThenGga) {
  const std::string text = FormatNmeaFix(FixAt(45.5, 350.0, 100.0), true, -19800, 18);
  EXPECT_EQ(text.substr(0, 38), "$GPZDA,115942.25,01,03,2017,-5,30*76\r\n");
  const size_t gga = text.find("$GPGGA");
  ASSERT_NE(gga, std::string::npos);
  EXPECT_EQ(
      text.substr(gga),
      "$GPGGA,115942.250,4530.0000000,N,01000.0000000,W,4,07,1.2,100.0000,M,0.0,M,,0000*40\r\n");
}

class NmeaOutputTest : public testing::Test {
 protected:
  void TearDown() override { ResetLeapTableForTesting(); }
};

TEST_F(NmeaOutputTest, FirstFixWritesZdaThenGgaAndLaterFixesOnlyGga) {
  const std::string path = test::TempPath("out.nmea");
  TBufFile out;
  ASSERT_TRUE(out.OpenWrite(path, kNmeaOpenMode));
  uint32_t counter = 0;
  EXPECT_TRUE(WriteNmeaFix(out, counter, FixAt(45.5, 350.0, 100.0)));
  EXPECT_TRUE(WriteNmeaFix(out, counter, FixAt(-33.25, 151.2, -20.0)));
  EXPECT_EQ(counter, 2u);
  ASSERT_TRUE(out.Close());
  const auto bytes = test::ReadBytes(path);
  const std::string text(bytes.begin(), bytes.end());
  size_t zda = 0, gga = 0;
  for (size_t at = 0; (at = text.find('$', at)) != std::string::npos; ++at) {
    (text.compare(at, 6, "$GPZDA") == 0 ? zda : gga) += 1;
  }
  EXPECT_EQ(zda, 1u);
  EXPECT_EQ(gga, 2u);
  EXPECT_NE(text.find(",3315.0000000,S,"), std::string::npos);
  // Every sentence's checksum is the XOR between "$" and "*".
  for (size_t at = 0; (at = text.find('$', at)) != std::string::npos; ++at) {
    const size_t star = text.find('*', at);
    unsigned sum = 0;
    for (size_t i = at + 1; i < star; ++i)
      sum ^= static_cast<uint8_t>(text[i]);
    char hex[3];
    std::snprintf(hex, sizeof hex, "%02X", sum);
    EXPECT_EQ(text.substr(star + 1, 2), hex);
  }

  // The same file through an independent NMEA parser, where one is installed (the Linux
  // build installs it; the Windows programs run under an emulator without Node.js).
#ifdef _WIN32
  GTEST_SKIP() << "the independent NMEA check runs in the Linux build";
#else
  const std::string node_modules = std::string(VOX_BUILD_DIR) + "/npm/node_modules";
  if (std::system("node --version > /dev/null 2>&1") != 0) {
    GTEST_SKIP() << "node is not installed: independent NMEA check skipped";
  }
  const std::string command = "NODE_PATH='" + node_modules +
                              "' node '" VOX_RESULTS_TEST_DIR "/nmea_check.js' '" + path +
                              "' > /dev/null";
  const int status = std::system(command.c_str());
  if (WIFEXITED(status) && WEXITSTATUS(status) == 77) {
    GTEST_SKIP() << "npm package nmea-simple not in " << node_modules
                 << ": independent NMEA check skipped";
  }
  EXPECT_EQ(status, 0) << command;
#endif
}

TEST_F(NmeaOutputTest, AnOutputThatCannotBeCreatedReceivesNothing) {
  TBufFile out;
  EXPECT_FALSE(out.OpenWrite("/nonexistent-folder/x/out.nmea", kNmeaOpenMode));
  uint32_t counter = 0;
  EXPECT_FALSE(WriteNmeaFix(out, counter, FixAt(10, 10, 0)));
  EXPECT_EQ(counter, 0u);
  TBufFile never_opened;
  EXPECT_FALSE(WriteNmeaFix(never_opened, counter, FixAt(10, 10, 0)));
}

TEST_F(NmeaOutputTest, APositionThatIsNotANumberIsDropped) {
  const std::string path = test::TempPath("nan.nmea");
  TBufFile out;
  ASSERT_TRUE(out.OpenWrite(path, kNmeaOpenMode));
  uint32_t counter = 0;
  NmeaFix fix = FixAt(10, 10, 0);
  fix.x = std::nan("");
  EXPECT_FALSE(WriteNmeaFix(out, counter, fix));
  EXPECT_EQ(counter, 0u);
}

}  // namespace
}  // namespace vox
