// The real RINEX files of two stations, converted by voxraw from-rinex at test time and read
// back through the library's own scan, epoch stream and ephemeris store: every epoch, every
// satellite and every value must arrive as the RINEX text states it, in both byte orders.
#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>
#include <fstream>
#include <map>
#include <set>

#include "base/sat.h"
#include "raw/epoch_stream.h"
#include "raw/precise_store.h"
#include "raw/scan.h"
#include "realdata.h"

namespace vox::test {
namespace {

namespace fs = std::filesystem;
constexpr double kC = 299792458.0;

struct Station {
  const char* name;
  const char* receiver;
};

void PrintTo(const Station& s, std::ostream* os) {
  *os << s.name;
}

class StationTest : public ::testing::TestWithParam<std::tuple<Station, bool>> {
 protected:
  std::string Path(const char* extension) const {
    return GnssDir() + "/" + std::get<0>(GetParam()).name + extension;
  }
  // The station's observation and navigation files, converted in the case's byte order.
  std::unique_ptr<Converted> Convert() const {
    std::vector<std::string> options;
    if (std::get<1>(GetParam())) options.push_back("--big-endian");
    return std::make_unique<Converted>(Path(".05o"), std::vector<std::string>{Path(".05n")},
                                       options);
  }
};

// RINEX 2 types of these files and where the stream delivers them: value index 2s is the code
// of slot s, 2s + 1 its phase.
const std::map<std::string, int> kValueOfType = {{"C1", 0}, {"L1", 1}, {"P2", 6}, {"L2", 7}};

TEST_P(StationTest, EveryEpochSatelliteAndValueReachesTheEpochStream) {
  REQUIRE_GNSS_DATA();
  const std::unique_ptr<Converted> converted = Convert();
  const Converted& c = *converted;
  ASSERT_EQ(c.run.exit_code, 0) << c.run.err;
  ASSERT_EQ(c.status, kScanComplete);
  EXPECT_EQ(c.file->receiver_text, std::get<0>(GetParam()).receiver);
  EXPECT_EQ(c.file->epoch_interval_ms, 30000u);

  const TextObs text = ReadTextObs(Path(".05o"));
  ASSERT_EQ(c.file->epoch_count, text.epochs.size());
  auto stream = EpochStream::Open(*c.occupation, 0, nullptr, nullptr);
  ASSERT_TRUE(stream);
  EXPECT_TRUE(stream->time_reference().gps);
  EXPECT_EQ(stream->time_reference().leap_seconds, 13u);  // from the navigation header

  vox_EpochData epoch;
  bool more = stream->Find(nullptr, epoch);
  size_t n = 0, values = 0;
  for (; more; more = stream->GetNext(epoch), ++n) {
    ASSERT_LT(n, text.epochs.size());
    const TextEpoch& te = text.epochs[n];
    const double t = GpsSeconds(te.year, te.month, te.day, te.hour, te.minute, te.second);
    ASSERT_EQ(epoch.seconds * 1000ll + epoch.ms, std::llround(t * 1000.0)) << "epoch " << n;
    ASSERT_EQ(epoch.sat_count, te.sats.size()) << "epoch " << n;
    for (const TextSat& ts : te.sats) {
      vox_EpochSatData d;
      ASSERT_TRUE(stream->GetSatellite(d)) << "epoch " << n << " G" << ts.number;
      ASSERT_EQ(d.sat, MakeSatId(SatSystem::kGps, ts.number));
      for (size_t k = 0; k < text.types.size(); ++k) {
        const int value = kValueOfType.at(text.types[k]);
        const bool code = value % 2 == 0;
        if (!ts.values[k]) continue;
        ASSERT_TRUE(d.presence & (1u << value)) << "epoch " << n << " " << text.types[k];
        EXPECT_EQ(d.values[value], code ? *ts.values[k] / kC : *ts.values[k])
            << "epoch " << n << " G" << ts.number << " " << text.types[k];
        ++values;
      }
    }
    vox_EpochSatData none;
    EXPECT_FALSE(stream->GetSatellite(none));
  }
  EXPECT_EQ(n, text.epochs.size());
  EXPECT_GT(values, 3000u);
}

TEST_P(StationTest, BroadcastEphemeridesReachTheStoreInOurFieldConvention) {
  REQUIRE_GNSS_DATA();
  const std::unique_ptr<Converted> converted = Convert();
  const Converted& c = *converted;
  ASSERT_EQ(c.run.exit_code, 0) << c.run.err;

  // The first record of each satellite and toe wins, in the store as in the file's order.
  std::set<std::pair<int, uint32_t>> seen;
  size_t checked = 0;
  for (const TextNav& r : ReadTextNavV2(Path(".05n"))) {
    const uint32_t week = static_cast<uint32_t>(r.v[21]);
    const uint32_t time = week * 604800u + static_cast<uint32_t>(r.v[11]);
    if (!seen.insert({r.prn, time}).second) continue;
    const TNavEphemItem* item = c.ephemerides.head(SatIndexOf(MakeSatId(SatSystem::kGps, r.prn)));
    while (item != nullptr && item->data.head.seconds != time)
      item = item->next;
    ASSERT_NE(item, nullptr) << "G" << r.prn << " toe " << r.v[11];
    const vox_GpsEphemeris& g = item->data.gps;
    const double toc = GpsSeconds(r.year, r.month, r.day, r.hour, r.minute, r.second);
    EXPECT_EQ(g.g1, static_cast<uint32_t>(r.v[11]));
    EXPECT_EQ(g.g2, static_cast<uint32_t>(std::fmod(toc, 604800.0)));
    const double as_float[] = {r.v[2], r.v[1], r.v[0], r.v[25], r.v[5]};  // af2 af1 af0 TGD dn
    for (int k = 0; k < 4; ++k)
      EXPECT_EQ(g.g3_g6[k], static_cast<float>(as_float[k]));
    EXPECT_EQ(g.g7, static_cast<float>(as_float[4]));
    EXPECT_EQ(g.g8, r.v[8]);                               // e
    EXPECT_EQ(g.g9, r.v[10]);                              // sqrt(A)
    EXPECT_EQ(g.g10, r.v[6]);                              // M0
    EXPECT_EQ(g.g11, static_cast<float>(r.v[18]));         // OMEGA dot
    EXPECT_EQ(g.g12, static_cast<float>(r.v[19]));         // IDOT
    EXPECT_EQ(g.g13, static_cast<float>(r.v[7]));          // Cuc
    EXPECT_EQ(g.g14_g16[0], static_cast<float>(r.v[9]));   // Cus
    EXPECT_EQ(g.g14_g16[1], static_cast<float>(r.v[16]));  // Crc
    EXPECT_EQ(g.g14_g16[2], static_cast<float>(r.v[4]));   // Crs
    EXPECT_EQ(g.g17, r.v[13]);                             // OMEGA0
    EXPECT_EQ(g.g18, r.v[17]);                             // omega
    EXPECT_EQ(g.g19, static_cast<float>(r.v[12]));         // Cic
    EXPECT_EQ(g.g20, r.v[15]);                             // i0
    EXPECT_EQ(g.g21, static_cast<float>(r.v[14]));         // Cis
    EXPECT_EQ(g.g22, static_cast<uint8_t>(r.v[3]));        // IODE
    EXPECT_EQ(g.g24_byte, static_cast<uint8_t>(r.v[24]));  // health
    ++checked;
  }
  EXPECT_EQ(c.ephemerides.Total(), checked);
  EXPECT_GT(checked, 100u);
}

INSTANTIATE_TEST_SUITE_P(
    TwoStations, StationTest,
    ::testing::Combine(::testing::Values(Station{"07590920", "TRIMBLE 5700 #00000 (1.24)"},
                                         Station{"30400920", "TRIMBLE 5700 #00000 (1.24)"}),
                       ::testing::Bool()),
    [](const auto& info) {
      return std::string(std::get<0>(info.param).name).substr(0, 4) +
             (std::get<1>(info.param) ? "_big" : "_little");
    });

// From 00:09:30 on, the receiver dates its epochs one millisecond after the second: they
// still belong to their grid points.
TEST(RinexConversion, IntervalKeepsTheEpochsNearestItsGrid) {
  REQUIRE_GNSS_DATA();
  Converted c(GnssDir() + "/07590920.05o", {}, {"--interval", "120"});
  ASSERT_EQ(c.run.exit_code, 0) << c.run.err;
  EXPECT_EQ(c.file->epoch_count, 30u);
  EXPECT_EQ(c.file->first_epoch.seconds % 120, 0u);
  EXPECT_EQ(c.file->last_epoch.seconds % 120, 0u);
  EXPECT_EQ(c.file->last_epoch.seconds - c.file->first_epoch.seconds, 29u * 120u);
}

TEST(RinexConversion, PositionOptionPrintsTheHeaderPosition) {
  REQUIRE_GNSS_DATA();
  Converted c(GnssDir() + "/07590920.05o", {}, {"--position"});
  ASSERT_EQ(c.run.exit_code, 0) << c.run.err;
  EXPECT_NE(c.run.out.find("PosX=-3976219.5082\nPosY=3382372.5671\nPosZ=3652512.9849\n"),
            std::string::npos)
      << c.run.out;
}

// Multi-GNSS RINEX 3 and mixed RINEX 2.11 files: every satellite our records can carry
// arrives with its first-frequency code in slot L1C, on the epoch stream's time scale
// (GLONASS + leap seconds, BDS + 14 s, with no leap seconds in the files: 17 from the table).
TEST(RinexConversion, MultiGnssFilesKeepEverySatelliteTheRecordsCanCarry) {
  REQUIRE_GNSS_DATA();
  const std::map<char, std::pair<std::vector<std::string>, double>> l1 = {
      {'G', {{"C1C", "C1"}, 0.0}},
      {'R', {{"C1C", "C1"}, 17.0}},
      {'E', {{"C1X", "C1C", "C1"}, 0.0}},
      {'C', {{"C2I", "C1I"}, 14.0}},
      {'S', {{"C1C", "C1"}, 0.0}}};
  for (const char* name : {"UCAL00CAN_S_20161700100_15M_01S_MO",
                           "FAA100PYF_R_20161700100_15M_01S_MO", "sptu0150.16o", "kerg1700.16o"}) {
    SCOPED_TRACE(name);
    const std::string obs = GnssDir() + "/multignss/" + name;
    Converted c(obs, {});
    ASSERT_EQ(c.run.exit_code, 0) << c.run.err;
    ASSERT_EQ(c.status, kScanComplete);
    const TextObs text = ReadTextObs(obs, 1);
    auto stream = EpochStream::Open(*c.occupation, 0, nullptr, nullptr);
    ASSERT_TRUE(stream);
    vox_EpochData epoch;
    ASSERT_TRUE(stream->Find(nullptr, epoch));
    std::map<SatId, vox_EpochSatData> got;
    for (vox_EpochSatData d; stream->GetSatellite(d);)
      got[d.sat] = d;
    size_t expected = 0;
    for (const TextSat& ts : text.epochs[0].sats) {
      const auto it = l1.find(ts.system);
      if (it == l1.end()) continue;  // QZSS beyond J05 and the like have no place
      const SatSystem sys = ts.system == 'G'   ? SatSystem::kGps
                            : ts.system == 'R' ? SatSystem::kGlonass
                            : ts.system == 'E' ? SatSystem::kGalileo
                            : ts.system == 'C' ? SatSystem::kBds
                                               : SatSystem::kSbas;
      const int number = ts.number;
      if (ts.system == 'S' && (number < 20 || number > 40)) continue;
      const std::vector<std::string>& types = text.TypesOf(ts.system);
      std::optional<double> code;
      for (const std::string& want : it->second.first)
        for (size_t k = 0; k < types.size() && !code; ++k)
          if (types[k] == want && ts.values[k]) code = ts.values[k];
      if (!code) continue;
      ++expected;
      const auto d = got.find(MakeSatId(sys, number));
      ASSERT_NE(d, got.end()) << ts.system << ts.number;
      ASSERT_TRUE(d->second.presence & 1u) << ts.system << ts.number;
      EXPECT_EQ(d->second.values[0], *code / kC + it->second.second) << ts.system << ts.number;
    }
    EXPECT_GT(expected, 15u);
  }
}

// ---- malformed input

class MalformedRinex : public ::testing::Test {
 protected:
  void SetUp() override {
    if (GnssDir().empty()) GTEST_SKIP() << "the real GNSS data is not present";
    lines_ = FileLines(GnssDir() + "/07590920.05o");
  }
  std::string Write(const std::vector<std::string>& lines, const std::string& name = "bad.05o") {
    const std::string path = scratch_.File(name);
    std::ofstream out(path);
    for (const std::string& l : lines)
      out << l << "\n";
    return path;
  }
  // Converts, expecting failure; the output's folder must hold nothing new afterwards.
  std::string Fail(const std::string& obs, const std::vector<std::string>& navs = {}) {
    const std::set<std::string> before = Names();
    std::vector<std::string> args = {"from-rinex", obs};
    args.insert(args.end(), navs.begin(), navs.end());
    args.insert(args.end(), {"-o", out_});
    const ToolRun r = RunVoxraw(args, scratch_.path().string());
    EXPECT_EQ(r.exit_code, 1);
    EXPECT_EQ(Names(), before);
    return r.err;
  }
  std::set<std::string> Names() const {
    std::set<std::string> names;
    for (const auto& e : fs::directory_iterator(scratch_.path()))
      names.insert(e.path().filename().string());
    return names;
  }

  ScratchDir scratch_;
  std::string out_ = scratch_.File("out.raw");
  std::vector<std::string> lines_;
};

TEST_F(MalformedRinex, BadNumberNamesItsLineAndLeavesNoOutput) {
  // Line 30 (1-based) is an observation line of the second epoch.
  lines_[29].replace(2, 4, "x.y.");
  const std::string err = Fail(Write(lines_));
  EXPECT_NE(err.find("bad.05o:30:"), std::string::npos) << err;
}

TEST_F(MalformedRinex, FileCutInsideAnEpochNamesItsLastLine) {
  lines_.resize(17 + 1 + 3);  // header, the first epoch line and three of its eight satellites
  const std::string err = Fail(Write(lines_));
  EXPECT_NE(err.find("bad.05o:21:"), std::string::npos) << err;
}

TEST_F(MalformedRinex, FailureKeepsAnEarlierFileUnderTheOutputName) {
  {
    std::ofstream old(out_);
    old << "earlier";
  }
  lines_[40].replace(20, 3, "abc");
  const std::string err = Fail(Write(lines_));
  EXPECT_NE(err.find(":41:"), std::string::npos) << err;
  std::ifstream in(out_);
  std::string content;
  std::getline(in, content);
  EXPECT_EQ(content, "earlier");
}

TEST_F(MalformedRinex, DamagedNavigationRecordNamesTheNavigationFile) {
  std::vector<std::string> nav = FileLines(GnssDir() + "/07590920.05n");
  nav[14].replace(10, 5, "#####");  // an orbit line of the first record
  const std::string err = Fail(GnssDir() + "/07590920.05o", {Write(nav, "bad.05n")});
  EXPECT_NE(err.find("bad.05n:15:"), std::string::npos) << err;
}

// ---- the precise orbit file

TEST(PreciseOrbitFile, EverySampleReachesThePreciseStreamAsTheTextStatesIt) {
  REQUIRE_GNSS_DATA();
  const std::string path = GnssDir() + "/igs15904.sp3";
  TChainItem file(1, path, false, false);
  PreciseStore store;
  ScanSinks sinks;
  sinks.precise = &store;
  sinks.log.write = [](void*, const char*) {};
  ASSERT_EQ(ScanFile(file, sinks), kScanComplete);

  std::map<SatId, std::vector<TextSp3Sample>> by_sat;
  for (const TextSp3Sample& s : ReadTextSp3(path))
    by_sat[MakeSatId(SatSystem::kGps, s.number)].push_back(s);
  ASSERT_EQ(by_sat.size(), 32u);
  size_t checked = 0;
  for (const auto& [sat, samples] : by_sat) {
    auto cursor = store.Open(sat, 0, 0xFFFFFFFFu);
    ASSERT_TRUE(cursor);
    for (const TextSp3Sample& s : samples) {
      vox_PreciseEphemerisData d;
      ASSERT_TRUE(GetNextPrecise(*cursor, d));
      const double t = GpsSeconds(s.year, s.month, s.day, s.hour, s.minute, s.second);
      ASSERT_EQ(d.seconds * 1000ll + d.ms, std::llround(t * 1000.0));
      EXPECT_DOUBLE_EQ(d.x, s.x * 1000.0);
      EXPECT_DOUBLE_EQ(d.y, s.y * 1000.0);
      EXPECT_DOUBLE_EQ(d.z, s.z * 1000.0);
      EXPECT_FLOAT_EQ(d.clock, static_cast<float>(s.clock * 1e-6));
      ++checked;
    }
    vox_PreciseEphemerisData extra;
    EXPECT_FALSE(GetNextPrecise(*cursor, extra));
  }
  EXPECT_EQ(checked, 96u * 32u);
  size_t stored = 0;
  for (unsigned i = 0; i < kSatIndexCount; ++i)
    stored += store.count(i);
  EXPECT_EQ(stored, checked) << "samples of satellites the file does not name";
}

}  // namespace
}  // namespace vox::test
