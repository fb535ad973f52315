// A whole job through voxrun whose files are two raw observation files (one of each byte
// order) carrying broadcast ephemerides of every system and satellite positions, and a precise
// orbit file: the engine log holds the scan messages and the listing of what was prepared, and
// the probe engine reads every ephemeris back through the streams with the values written,
// after the documented unit and layout conversions.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "probe_job_util.h"
#include "raw_writer.h"
#include "support/scratch.h"
#include "vox/vox_engine.h"

namespace vox::test {
namespace {

using voxtools::RawOrder;
using voxtools::RawWriter;

constexpr uint32_t kDay = 13204;  // March 2016
constexpr uint32_t kDaySeconds = kDay * 86400;
const std::string kSp3 = std::string(VOX_SHARED_DIR) + "/data/gnss/igs15904.sp3";

SatId Sat(unsigned system, unsigned number) {
  return static_cast<SatId>(system << 8 | number);
}
const SatId kG5 = Sat(0, 5), kG35 = Sat(0, 35), kR7 = Sat(1, 7), kC3 = Sat(2, 3), kE11 = Sat(3, 11),
            kS20 = Sat(4, 20), kS22 = Sat(4, 22);

// ---- The ephemerides written, and the records they must become.

voxtools::RawGpsEphemeris Gps(uint8_t number, uint32_t ms_of_day, float seed) {
  voxtools::RawGpsEphemeris e;
  e.number = number;
  e.time = {ms_of_day, kDay};
  e.g1 = 1000 + number, e.g2 = 2000 + number;
  for (int i = 0; i < 5; ++i)
    e.g3_g7[i] = seed + 0.125f * (i + 3);
  e.g8 = 1.25, e.g9 = seed * 9.0, e.g10 = -seed * 10.0;
  for (int i = 0; i < 6; ++i)
    e.g11_g16[i] = seed - 0.0625f * (i + 11);
  e.g17 = seed * 17.0, e.g18 = seed * 18.0, e.g19 = seed * 19.0f, e.g20 = 0.5, e.g21 = -21.0f;
  e.g22 = 22, e.g23 = 23, e.g24 = 0x1234, e.g25 = 0x04;
  return e;
}

vox_EphemerisData Head(SatId sat, uint32_t seconds, uint16_t ms) {
  vox_EphemerisData d;
  std::memset(&d, 0, sizeof d);
  d.head.seconds = seconds;
  d.head.ms = ms;
  d.head.sat = sat;
  return d;
}

vox_EphemerisData ExpectedGps(const voxtools::RawGpsEphemeris& e, SatId sat, uint8_t tag) {
  vox_EphemerisData d = Head(sat, kDaySeconds + e.time.ms_of_day / 1000, e.time.ms_of_day % 1000);
  vox_GpsEphemeris& g = d.gps;
  for (int i = 0; i < 4; ++i)
    g.g3_g6[i] = e.g3_g7[i];
  g.g7 = e.g3_g7[4];
  g.g8 = e.g8, g.g9 = e.g9, g.g10 = e.g10;
  g.g11 = e.g11_g16[0], g.g12 = e.g11_g16[1], g.g13 = e.g11_g16[2];
  for (int i = 0; i < 3; ++i)
    g.g14_g16[i] = e.g11_g16[3 + i];
  g.g17 = e.g17, g.g18 = e.g18, g.g19 = e.g19, g.g20 = e.g20, g.g21 = e.g21;
  g.g1 = e.g1, g.g2 = e.g2;
  g.g22_wide = e.g22, g.g22 = e.g22, g.g23 = e.g23;
  g.g25_bit2 = (e.g25 >> 2) & 1;
  g.g24_byte = tag == 13 ? static_cast<uint8_t>(e.g24 & 0xFF) : (e.g24 == 1 ? 0 : 1);
  return d;
}

voxtools::RawBdsEphemeris Bds() {
  voxtools::RawBdsEphemeris e;
  e.number = 3;
  e.time = {36000000, kDay};
  e.c1 = 31, e.c2 = 32;
  for (int i = 0; i < 5; ++i)
    e.c3_c7[i] = 3.5f + i;
  e.c8 = 8.25, e.c9 = 9.25, e.c10 = 10.25;
  for (int i = 0; i < 6; ++i)
    e.c11_c16[i] = 11.5f + i;
  e.c17 = 17.75, e.c18 = 18.75, e.c19 = 19.5f, e.c20 = 20.125, e.c21 = 21.5f;
  e.c22 = 122, e.c23 = 123, e.c24 = 124, e.c25 = 125;
  return e;
}

vox_EphemerisData ExpectedBds(const voxtools::RawBdsEphemeris& e) {
  vox_EphemerisData d = Head(kC3, kDaySeconds + 36000, 0);
  vox_GpsEphemeris& g = d.gps;
  for (int i = 0; i < 4; ++i)
    g.g3_g6[i] = e.c3_c7[i];
  g.g7 = e.c3_c7[4];
  g.g8 = e.c8, g.g9 = e.c9, g.g10 = e.c10;
  g.g11 = e.c11_c16[0], g.g12 = e.c11_c16[1], g.g13 = e.c11_c16[2];
  for (int i = 0; i < 3; ++i)
    g.g14_g16[i] = e.c11_c16[3 + i];
  g.g17 = e.c17, g.g18 = e.c18, g.g19 = e.c19, g.g20 = e.c20, g.g21 = e.c21;
  g.g1 = e.c1, g.g2 = e.c2;
  g.g22_wide = e.c22, g.g22 = e.c22, g.g23 = e.c23;
  g.g25_bit2 = e.c25;  // byte 120: C25
  g.g24_byte = e.c24;  // byte 121: C24
  return d;
}

voxtools::RawGalileoEphemeris Galileo() {
  voxtools::RawGalileoEphemeris e;
  e.number = 11;
  e.time = {36000000, kDay};
  e.e1 = 41, e.e2 = 42;
  for (int i = 0; i < 4; ++i)
    e.e3_e6[i] = 3.25f + i;
  for (int i = 0; i < 4; ++i)
    e.e7_e10[i] = 7.125 + i;
  for (int i = 0; i < 7; ++i)
    e.e11_e17[i] = 11.75f + i;
  e.e18 = 18.5, e.e19 = 19.5, e.e20 = 20.5f, e.e21 = 21.5, e.e22 = 22.5f;
  e.e23 = 0x2323, e.e24 = 24, e.e25 = 25;
  return e;
}

vox_EphemerisData ExpectedGalileo(const voxtools::RawGalileoEphemeris& e) {
  vox_EphemerisData d = Head(kE11, kDaySeconds + 36000, 0);
  vox_GalileoEphemeris& g = d.galileo;
  for (int i = 0; i < 4; ++i)
    g.e3_e6[i] = e.e3_e6[i];
  g.e7 = e.e7_e10[0];
  for (int i = 0; i < 3; ++i)
    g.e8_e10[i] = e.e7_e10[1 + i];
  g.e11 = e.e11_e17[0], g.e12 = e.e11_e17[1], g.e13 = e.e11_e17[2], g.e14 = e.e11_e17[3];
  for (int i = 0; i < 3; ++i)
    g.e15_e17[i] = e.e11_e17[4 + i];
  g.e18 = e.e18, g.e19 = e.e19, g.e20 = e.e20, g.e21 = e.e21, g.e22 = e.e22;
  g.e1 = e.e1, g.e2 = e.e2, g.e23 = e.e23, g.e24 = e.e24, g.e25 = e.e25;
  return d;
}

voxtools::RawGlonassEphemeris Glonass() {
  voxtools::RawGlonassEphemeris e;
  e.slot = 7;
  e.time = {36000000, kDay};
  e.r1 = 1.5f, e.r2 = -2.5f;
  e.position[0] = 12000.5, e.position[1] = -15000.25, e.position[2] = 18000.125;
  e.velocity[0] = 1.5f, e.velocity[1] = -2.25f, e.velocity[2] = 3.1f;
  e.acceleration[0] = 1e-6f, e.acceleration[1] = 2e-6f, e.acceleration[2] = -3e-6f;
  e.r3 = 33, e.r4 = 44;
  return e;
}

vox_EphemerisData ExpectedGlonass(const voxtools::RawGlonassEphemeris& e) {
  vox_EphemerisData d = Head(kR7, kDaySeconds + 36000, 0);
  vox_GlonassEphemeris& g = d.glonass;
  g.r1 = e.r1, g.r2 = e.r2;
  for (int i = 0; i < 3; ++i) {
    g.position[i] = e.position[i] * 1000.0;
    g.velocity[i] = static_cast<double>(e.velocity[i]) * 1000.0;
    g.acceleration[i] = e.acceleration[i] * 1000.0f;
  }
  g.r4 = e.r4, g.r3 = e.r3;
  return d;
}

voxtools::RawSbasEphemeris Sbas(uint8_t number, uint32_t ms_of_day, uint32_t reference,
                                bool rates) {
  voxtools::RawSbasEphemeris e;
  e.number = number;
  e.time = {ms_of_day, kDay};
  e.s1 = 1, e.s2 = 2;
  e.reference_seconds = reference;
  e.s3_s5[0] = 3000.5, e.s3_s5[1] = -4000.5, e.s3_s5[2] = rates ? 5.5 : 0.0;
  for (int i = 0; i < 8; ++i)
    e.s6_s13[i] = rates ? 6.5f + i : 0.0f;
  return e;
}

vox_EphemerisData ExpectedSbas(const voxtools::RawSbasEphemeris& e, SatId sat, uint32_t seconds) {
  vox_EphemerisData d = Head(sat, seconds, 0);
  vox_SbasEphemeris& s = d.sbas;
  s.s12 = e.s6_s13[6], s.s13 = e.s6_s13[7];
  for (int i = 0; i < 3; ++i)
    s.s3_s5[i] = e.s3_s5[i];
  for (int i = 0; i < 6; ++i)
    s.s6_s11[i] = e.s6_s13[i];
  s.s1 = e.s1, s.s2 = e.s2;
  return d;
}

// Epochs of G5 and R7 at 10:00:00 to 10:00:03, for the occupations.
void Epochs(RawWriter& w) {
  for (uint32_t s = 36000; s < 36004; ++s) {
    std::vector<voxtools::RawSatellite> sats(2);
    sats[0].code = voxtools::SatCode51('G', 5);
    sats[0].signals.push_back(voxtools::RawSignal::Tag51(16, 2.0e7, 1.0e8));
    sats[1].code = voxtools::SatCode51('R', 7);
    sats[1].signals.push_back(voxtools::RawSignal::Tag51(16, 2.1e7, 1.1e8));
    w.Epoch(51, s * 1000, sats);
  }
}

voxtools::RawSatPosition Position(uint16_t code, uint32_t ms_of_day, double seed) {
  voxtools::RawSatPosition p;
  p.code = code;
  p.time = {ms_of_day, kDay};
  p.position[0] = seed, p.position[1] = -seed / 2, p.position[2] = seed / 4;
  p.clock_us = seed / 1000;
  return p;
}

// The satellites' windows of validity, half widths in seconds (SBAS with rates: 300).
uint32_t HalfWindow(SatId sat) {
  switch (sat >> 8) {
    case 0:
      return 7200;
    case 1:
      return 900;
    case 4:
      return 300;
    default:
      return 3600;
  }
}

class ProbeEphemerisJobTest : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!std::filesystem::exists(kSp3)) GTEST_SKIP() << "no precise orbit file at " << kSp3;
    // File 1, little-endian: the ephemerides of every system, G5 out of time order with a
    // second record in the same second.
    RawWriter a(RawOrder::kLittle);
    a.Header().TimeRef("GPS", {0, kDay});
    a.GpsEphemeris(gps_[1], 13).GpsEphemeris(Gps(5, 36000500, 9.0f), 13);
    a.GpsEphemeris(gps_[2], 13).GpsEphemeris(gps_[0], 13).GpsEphemeris(g35_, 45);
    a.GlonassEphemeris(Glonass()).GalileoEphemeris(Galileo()).BdsEphemeris(Bds());
    a.SbasEphemeris(s20_).SbasEphemeris(s22_);
    Epochs(a);
    a.EndOfData();
    ASSERT_TRUE(a.Save(scratch_.File("a.raw")));
    // File 2, big-endian: a later G5 ephemeris and satellite positions of both tags.
    RawWriter b(RawOrder::kBig);
    b.Header().TimeRef("GPS", {0, kDay});
    b.GpsEphemeris(gps_[3], 13);
    b.SatPosition(Position(voxtools::SatCode8('G', 5), 36000000, 20000.5), 23);
    b.SatPosition(Position(voxtools::SatCode51('R', 7), 36000000, 19000.25), 56);
    b.SatPosition(Position(voxtools::SatCode51('R', 7), 36900000, 19100.75), 56);
    b.SatPosition(Position(voxtools::SatCode51('E', 11), 36000000, 23000.125), 56);
    Epochs(b);
    b.EndOfData();
    ASSERT_TRUE(b.Save(scratch_.File("b.raw")));

    const ProbeRun run = RunProbeJob(scratch_, "Ephemeris",
                                     "ProbeEphemeris=G5,G35,R7,E11,C3,S20,S22\n"
                                     "NumFiles=3\nNumPoints=2\nNumOccups=2\nNumVectors=1\n"
                                     "[FILE:1]\nName=a.raw\n[FILE:2]\nName=b.raw\n[FILE:3]\nName=" +
                                         kSp3 +
                                         "\n[POINT:1]\nName=Base\n[POINT:2]\nName=Rover\n"
                                         "[OCCUP:1]\nFile=1\nPoint=1\n[OCCUP:2]\nFile=2\nPoint=2\n"
                                         "[VECTOR:1]\nPoints=1,2\n");
    ASSERT_EQ(run.exit_code, 0);
    probe_ = run.report;
    for (const std::string& text : temp_.EngineLogTexts())
      log_ += text;
  }

  // What the probe read of one satellite's stream, in order.
  std::vector<std::vector<uint8_t>> Read(const char* kind, SatId sat) const {
    char prefix[32];
    std::snprintf(prefix, sizeof prefix, "%s sat=%04X ", kind, sat);
    std::vector<std::vector<uint8_t>> out;
    for (const std::string& l : WithPrefix(probe_, prefix))
      out.push_back(FromHex(Field(l, "rec")));
    return out;
  }

  void ExpectStream(SatId sat, const std::vector<vox_EphemerisData>& want) const {
    SCOPED_TRACE("satellite " + std::to_string(sat));
    const auto got = Read("eph", sat);
    ASSERT_EQ(got.size(), want.size());
    for (size_t i = 0; i < want.size(); ++i) {
      ASSERT_EQ(got[i].size(), sizeof(vox_EphemerisData));
      for (size_t k = 0; k < sizeof(vox_EphemerisData); ++k)
        EXPECT_EQ(got[i][k], want[i].bytes[k]) << "record " << i << " byte " << k;
    }
  }

  ScratchDir scratch_;
  TempDirEnv temp_{scratch_, true};
  voxtools::RawGpsEphemeris gps_[4] = {Gps(5, 28800000, 1.0f), Gps(5, 36000000, 2.0f),
                                       Gps(5, 43200000, 3.0f), Gps(5, 50400000, 4.0f)};
  voxtools::RawGpsEphemeris g35_ = [] {
    voxtools::RawGpsEphemeris e = Gps(3, 36000000, 5.0f);
    e.g24 = 1;
    return e;
  }();
  voxtools::RawSbasEphemeris s20_ = Sbas(20, 36000500, 36010, true);
  voxtools::RawSbasEphemeris s22_ = Sbas(22, 36000000, 36000, false);
  std::vector<std::string> probe_;
  std::string log_;
};

TEST_F(ProbeEphemerisJobTest, TheEngineLogHoldsTheScanAndTheListing) {
  for (const char* name : {"a.raw", "b.raw"})
    EXPECT_NE(log_.find("Scan file: " + scratch_.File(name) + "\n - Reached EOF\n"),
              std::string::npos)
        << name << "\n"
        << log_;
  // The signal report of each raw file: L1 code and phase of GPS and GLONASS, nothing else.
  const std::string report =
      "GPS: CodeL1C PhaseL1C\nGLONASS: CodeL1C PhaseL1C\nBDS:\n"
      "GALILEO:\nSBAS:\n";
  const size_t first = log_.find(report);
  ASSERT_NE(first, std::string::npos) << log_;
  EXPECT_NE(log_.find(report, first + 1), std::string::npos);

  // The listing, after every file was scanned: the broadcast ephemerides (the store's content
  // shows in the streams below, the listing's form in its own test), the precise samples per
  // satellite (G5: 96 of the orbit file, one of the raw file), the occupations and the vector.
  const std::vector<std::string> lines = Lines(log_);
  EXPECT_NE(log_.find("\n005 - G05 - 1140861600.000 01 Mar 2016 10:00:00\n"), std::string::npos);
  EXPECT_NE(log_.find("\n131 - S22 - 1140861600.000 "), std::string::npos);
  const size_t listing = log_.find("Ephemeris:\n");
  const size_t precise = log_.find("\nPrecise Ephemeris:\n");
  const size_t occupations = log_.find("Occupation:\n");
  ASSERT_NE(listing, std::string::npos);
  ASSERT_NE(precise, std::string::npos);
  ASSERT_NE(occupations, std::string::npos);
  EXPECT_LT(listing, precise);
  EXPECT_LT(precise, occupations);
  ASSERT_EQ(WithPrefix(lines, "G05 - ").size(), 1u);
  EXPECT_TRUE(WithPrefix(lines, "G05 - ").front().ends_with(" - 97")) << log_;
  for (const char* occupation : {"OCCUP#02000001 Base, beg=", "OCCUP#02000002 Rover, beg="}) {
    const auto found = WithPrefix(lines, occupation);
    ASSERT_EQ(found.size(), 1u) << log_;
    EXPECT_NE(found[0].find(",      4 epochs, CHAIN#0400000"), std::string::npos) << found[0];
  }
  const size_t vector = log_.find("VECTOR: Base - Rover\nOCCUP: ");
  EXPECT_NE(vector, std::string::npos) << log_;
  EXPECT_LT(occupations, vector);
}

TEST_F(ProbeEphemerisJobTest, TheBroadcastStreamsDeliverEveryRecordConverted) {
  ExpectStream(kG5, {ExpectedGps(gps_[0], kG5, 13), ExpectedGps(gps_[1], kG5, 13),
                     ExpectedGps(gps_[2], kG5, 13), ExpectedGps(gps_[3], kG5, 13)});
  ExpectStream(kG35, {ExpectedGps(g35_, kG35, 45)});
  ExpectStream(kR7, {ExpectedGlonass(Glonass())});
  ExpectStream(kE11, {ExpectedGalileo(Galileo())});
  ExpectStream(kC3, {ExpectedBds(Bds())});
  // SBAS: the reference time of day on the reception day, milliseconds 0.
  ExpectStream(kS20, {ExpectedSbas(s20_, kS20, kDaySeconds + 36010)});
  ExpectStream(kS22, {ExpectedSbas(s22_, kS22, kDaySeconds + 36000)});
}

TEST_F(ProbeEphemerisJobTest, FindReturnsTheFirstEphemerisValidAtTheTime) {
  for (SatId sat : {kG5, kG35, kR7, kE11, kC3, kS20, kS22}) {
    std::vector<uint32_t> times;
    for (const auto& rec : Read("eph", sat)) {
      vox_EphemerisData d;
      std::memcpy(&d, rec.data(), sizeof d);
      times.push_back(d.head.seconds);
    }
    char prefix[32];
    std::snprintf(prefix, sizeof prefix, "eph_find sat=%04X ", sat);
    const auto finds = WithPrefix(probe_, prefix);
    ASSERT_EQ(finds.size(), times.size() * 17) << sat;
    for (const std::string& l : finds) {
      const uint32_t at =
          static_cast<uint32_t>(std::stoul(Field(l, "t")) + std::stol(Field(l, "d")));
      uint32_t want = 0;
      for (uint32_t t : times) {
        const bool always = sat == kS22;  // no rates: valid at every time
        if (always || (at + HalfWindow(sat) >= t && at <= t + HalfWindow(sat))) {
          want = t;
          break;
        }
      }
      EXPECT_EQ(Field(l, "found"), want != 0 ? "1" : "0") << l;
      EXPECT_EQ(Field(l, "seconds"), std::to_string(want)) << l;
    }
  }
}

TEST_F(ProbeEphemerisJobTest, TheShortFormsCarryTheFullRecordsBytes) {
  // GPS: the short record rearranges the full one.
  const auto full = Read("eph", kG5);
  const auto brief = Read("eph_short", kG5);
  ASSERT_EQ(brief.size(), full.size());
  for (size_t i = 0; i < full.size(); ++i) {
    const std::vector<uint8_t>& f = full[i];
    const std::vector<uint8_t>& s = brief[i];
    ASSERT_EQ(s.size(), sizeof(vox_ShortEphemerisData));
    EXPECT_EQ(s[0], 5);
    EXPECT_TRUE(std::equal(s.begin() + 1, s.begin() + 7, f.begin()));  // seconds, ms
    EXPECT_EQ(s[7], f[121]);
    const std::pair<size_t, size_t> moves[] = {{8, 8},   {16, 16},  {24, 104},  {28, 24},  {52, 48},
                                               {76, 72}, {100, 96}, {108, 108}, {118, 118}};
    const size_t widths[] = {8, 8, 4, 24, 24, 24, 8, 10, 3};
    for (size_t m = 0; m < 9; ++m)
      EXPECT_TRUE(std::equal(s.begin() + moves[m].first, s.begin() + moves[m].first + widths[m],
                             f.begin() + moves[m].second))
          << "record " << i << " short offset " << moves[m].first;
  }
  // GLONASS: number 128 + slot, R3 at 7, bytes 8 to 76 as they are.
  const auto rfull = Read("eph", kR7);
  const auto rbrief = Read("eph_short", kR7);
  ASSERT_EQ(rbrief.size(), 1u);
  ASSERT_EQ(rfull.size(), 1u);
  EXPECT_EQ(rbrief[0][0], 128 + 7);
  EXPECT_TRUE(std::equal(rbrief[0].begin() + 1, rbrief[0].begin() + 7, rfull[0].begin()));
  EXPECT_EQ(rbrief[0][7], rfull[0][77]);
  EXPECT_TRUE(std::equal(rbrief[0].begin() + 8, rbrief[0].begin() + 77, rfull[0].begin() + 8));
  // The plain functions return 0 whatever they deliver; find positions like the Ex form.
  for (SatId sat : {kG5, kG35, kR7}) {
    char prefix[40];
    std::snprintf(prefix, sizeof prefix, "eph_short_done sat=%04X ", sat);
    const auto done = WithPrefix(probe_, prefix);
    ASSERT_EQ(done.size(), 1u);
    EXPECT_EQ(Field(done[0], "open"), "1");
    EXPECT_EQ(Field(done[0], "returned"), "0");
  }
  const auto find = WithPrefix(probe_, "eph_short_find sat=0005 ");
  ASSERT_EQ(find.size(), 1u);
  EXPECT_EQ(Field(find[0], "filled"), "1");
  // At 14:00 the 12:00 ephemeris (window to 14:00 inclusive) comes first in time order.
  const auto found = FromHex(Field(find[0], "rec"));
  EXPECT_TRUE(std::equal(found.begin(), found.begin() + 16, brief[2].begin()));
}

TEST_F(ProbeEphemerisJobTest, ThePreciseStreamsDeliverTheFileAndTheRawSamples) {
  const auto lines = WithPrefix(probe_, "sp3 sat=0005 ");
  ASSERT_EQ(lines.size(), 97u);
  // The orbit file's 96 samples, every 15 minutes from 2010-07-01 00:00:00 (GPS week 1590,
  // day 4). The real-data tests compare every sample with the file's text; here the first
  // and the last arrive through the engine's functions.
  const uint32_t first = 1590 * 604800 + 4 * 86400;
  for (size_t i = 0; i < 96; ++i)
    EXPECT_EQ(Field(lines[i], "t"), std::to_string(first + 900 * i) + ".000") << lines[i];
  // "PG05 -25251.856884   1285.343331  -8289.755668    -10.679384"
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[0], "x")), -25251.856884 * 1000.0);
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[0], "y")), 1285.343331 * 1000.0);
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[0], "z")), -8289.755668 * 1000.0);
  EXPECT_FLOAT_EQ(std::stof(Field(lines[0], "clock")), static_cast<float>(-10.679384e-6));
  // "PG05 -25794.235286   1616.293976  -6332.242696    -10.910444"
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[95], "x")), -25794.235286 * 1000.0);
  EXPECT_FLOAT_EQ(std::stof(Field(lines[95], "clock")), static_cast<float>(-10.910444e-6));
  // The raw file's sample (tag 23) follows: kilometres and microseconds converted.
  EXPECT_EQ(Field(lines[96], "t"), std::to_string(kDaySeconds + 36000) + ".000");
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[96], "x")), 20000.5 * 1000.0);
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[96], "y")), -20000.5 / 2 * 1000.0);
  EXPECT_DOUBLE_EQ(std::stod(Field(lines[96], "z")), 20000.5 / 4 * 1000.0);
  EXPECT_FLOAT_EQ(std::stof(Field(lines[96], "clock")), static_cast<float>(20000.5 / 1000 * 1e-6));

  const auto glonass = WithPrefix(probe_, "sp3 sat=0107 ");
  ASSERT_EQ(glonass.size(), 2u);
  EXPECT_EQ(Field(glonass[1], "t"), std::to_string(kDaySeconds + 36900) + ".000");
  EXPECT_DOUBLE_EQ(std::stod(Field(glonass[1], "x")), 19100.75 * 1000.0);
  const auto galileo = WithPrefix(probe_, "sp3 sat=030B ");
  ASSERT_EQ(galileo.size(), 1u);
  EXPECT_DOUBLE_EQ(std::stod(Field(galileo[0], "z")), 23000.125 / 4 * 1000.0);
  // The short forms open the same lists (GPS and GLONASS).
  EXPECT_EQ(WithPrefix(probe_, "sp3_count sat=0005 count=97 short=97").size(), 1u);
  EXPECT_EQ(WithPrefix(probe_, "sp3_count sat=0107 count=2 short=2").size(), 1u);
  EXPECT_EQ(WithPrefix(probe_, "sp3_count sat=0204 count=0").size(), 0u);
}

}  // namespace
}  // namespace vox::test
