// RINEX 3 navigation records of every system beside a real multi-GNSS observation file: each
// record reaches the ephemeris store on GPS time and in our field convention. The shared data
// holds no RINEX 3 navigation file, so the records are written here, one per system, with
// values chosen to be told apart.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>

#include "base/sat.h"
#include "raw/scan.h"
#include "realdata.h"

namespace vox::test {
namespace {

// One record: the satellite, toc, then the numbers (three on the first line, four per line).
std::string Record(const char* sat, const char* toc, const std::vector<double>& v) {
  std::string text = std::string(sat) + " " + toc;
  char field[32];
  for (size_t i = 0; i < v.size(); ++i) {
    if (i >= 3 && (i - 3) % 4 == 0) text += "\n    ";
    std::snprintf(field, sizeof field, "%19.12E", v[i]);
    text += field;
  }
  return text + "\n";
}

std::string Header(bool leap) {
  std::string h =
      "     3.03           N: GNSS NAV DATA    M: Mixed            RINEX VERSION / TYPE\n";
  if (leap) h += "    17                                                      LEAP SECONDS\n";
  return h + "                                                            END OF HEADER\n";
}

// Seconds of week of a GPS-origin time.
double Sow(double t) {
  return std::fmod(t, 604800.0);
}

std::vector<double> Kepler(double toe, double sqrt_a, double iod, double extra28) {
  // af0 af1 af2 | IOD Crs dn M0 | Cuc e Cus sqrtA | toe Cic OMEGA0 Cis | i0 Crc omega OMEGAdot
  // | IDOT spare week spare | accuracy health TGD TGD2/IODC | tx fit/AODC
  return {1.5e-4, 2.5e-12, 0.0,    iod,  12.5,    4.5e-9,  1.25,   1.5e-6,    0.0125, 2.5e-6,
          sqrt_a, toe,     3.5e-8, -2.0, -4.5e-8, 0.955,   210.5,  0.75,      -8e-9,  1.5e-10,
          1.0,    1902.0,  0.0,    2.0,  0.0,     -1.1e-8, 2.2e-9, toe - 600, extra28};
}

class Nav3Records : public ::testing::TestWithParam<bool> {};

TEST_P(Nav3Records, EverySystemReachesTheStoreOnGpsTime) {
  REQUIRE_GNSS_DATA();
  const bool leap_in_header = GetParam();
  ScratchDir scratch;
  const double t0 = GpsSeconds(2016, 6, 18, 2, 0, 0);  // toc of G, E, J; BDT toc of C
  const double toe = Sow(t0);
  std::string nav = Header(leap_in_header);
  nav += Record("G05", "2016 06 18 02 00 00", Kepler(toe, 5153.75, 50, 4.0));
  nav += Record("J01", "2016 06 18 02 00 00", Kepler(toe, 6493.25, 51, 0.0));
  nav += Record("E11", "2016 06 18 02 00 00", Kepler(toe, 5440.5, 77, 0.0));
  nav += Record("C14", "2016 06 18 02 00 00", Kepler(toe, 5282.625, 3, 9.0));
  // GLONASS: -tau_n, gamma_n, tk | X Vx Ax health | Y Vy Ay k | Z Vz Az age (km, km/s).
  nav += Record("R07", "2016 06 18 01 45 00",
                {-1.25e-5, 1.5e-12, 6300.0, 12000.5, 1.5, 1e-9, 0.0, -15000.25, -2.25, 2e-9, -3.0,
                 18000.125, 0.75, -3e-9, 0.0});
  // SBAS: agf0, agf1, tx | X Vx Ax health | Y Vy Ay URA | Z Vz Az IODN.
  nav += Record("S33", "2016 06 18 01 30 00",
                {5e-8, 1e-12, 5400.0, 40000.5, 0.001, 0.0, 0.0, 10000.25, -0.002, 0.0, 3.0, -50.125,
                 0.0005, 0.0, 201.0});
  // A system without a place in the raw records is left out.
  nav += Record("I05", "2016 06 18 02 00 00", Kepler(toe, 6493.0, 1, 0.0));
  const std::string nav_path = WriteFile(scratch.File("mixed.16p"), nav);

  Converted conv(GnssDir() + "/multignss/UCAL00CAN_S_20161700100_15M_01S_MO", {nav_path});
  ASSERT_EQ(conv.run.exit_code, 0) << conv.run.err;
  EXPECT_NE(conv.run.out.find("6 ephemerides"), std::string::npos) << conv.run.out;
  EXPECT_NE(conv.run.out.find("1 ephemerides of satellites or systems"), std::string::npos)
      << conv.run.out;
  ASSERT_EQ(conv.status, kScanComplete);
  const EphemerisStore& store = conv.ephemerides;
  ASSERT_EQ(store.Total(), 6u);
  auto head = [&](SatSystem s, unsigned n) {
    const TNavEphemItem* item = store.head(SatIndexOf(MakeSatId(s, n)));
    return item ? &item->data : nullptr;
  };

  const vox_EphemerisData* g = head(SatSystem::kGps, 5);
  ASSERT_NE(g, nullptr);
  EXPECT_EQ(g->head.seconds, t0);
  EXPECT_EQ(g->gps.g9, 5153.75);
  EXPECT_EQ(g->gps.g22, 50);
  EXPECT_EQ(g->gps.g24_byte, 0);

  const vox_EphemerisData* j = head(SatSystem::kGps, 33);  // QZSS J01
  ASSERT_NE(j, nullptr);
  EXPECT_EQ(j->gps.g9, 6493.25);
  EXPECT_EQ(j->gps.g24_byte, 0);  // healthy, as for every GPS-layout record

  const vox_EphemerisData* e = head(SatSystem::kGalileo, 11);
  ASSERT_NE(e, nullptr);
  EXPECT_EQ(e->head.seconds, t0);
  EXPECT_EQ(e->galileo.e8_e10[1], 5440.5);
  EXPECT_EQ(e->galileo.e1, static_cast<uint32_t>(toe));
  EXPECT_EQ(e->galileo.e21, 0.955);
  EXPECT_EQ(e->galileo.e23, 77);
  EXPECT_EQ(e->galileo.e3_e6[2], static_cast<float>(-1.1e-8));  // BGD E1/E5a
  EXPECT_EQ(e->galileo.e3_e6[3], static_cast<float>(2.2e-9));   // BGD E1/E5b

  const vox_EphemerisData* c = head(SatSystem::kBds, 14);
  ASSERT_NE(c, nullptr);
  EXPECT_EQ(c->head.seconds, t0 + 14);  // BDT runs 14 s behind GPS time
  EXPECT_EQ(c->gps.g1, static_cast<uint32_t>(toe));
  EXPECT_EQ(c->gps.g9, 5282.625);
  EXPECT_EQ(c->gps.g25_bit2, 9);  // AODC

  const vox_EphemerisData* r = head(SatSystem::kGlonass, 7);
  ASSERT_NE(r, nullptr);
  EXPECT_EQ(r->head.seconds, GpsSeconds(2016, 6, 18, 1, 45, 0) + 17);  // UTC + leap seconds
  EXPECT_EQ(r->glonass.r1, 1.25e-5f);                                  // tau_n
  EXPECT_EQ(r->glonass.position[0], 12000500.0);
  EXPECT_EQ(r->glonass.position[1], -15000250.0);
  EXPECT_EQ(r->glonass.position[2], 18000125.0);
  EXPECT_EQ(static_cast<int8_t>(r->glonass.r3), -3);

  const vox_EphemerisData* s = head(SatSystem::kSbas, 33);
  ASSERT_NE(s, nullptr);
  EXPECT_EQ(s->head.seconds, GpsSeconds(2016, 6, 18, 1, 30, 0));
  EXPECT_EQ(s->sbas.s3_s5[0], 40000500.0);
  EXPECT_EQ(s->sbas.s1, 201);
  EXPECT_EQ(s->sbas.s12, 5e-8f);
}

INSTANTIATE_TEST_SUITE_P(LeapSeconds, Nav3Records, ::testing::Bool(),
                         [](const auto& info) { return info.param ? "FromHeader" : "FromTable"; });

}  // namespace
}  // namespace vox::test
