// Leap seconds, the GPS L2C rules, the NMEA output and damaged input of the epoch stream, in
// both byte orders.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "epoch_test_files.h"
#include "job/leap_seconds.h"
#include "support/scratch.h"
#include "vox/vox_sdk_epoch.h"

namespace vox::test {
namespace {

// Some cases register a file's leap seconds with the process-wide table; each case starts
// and leaves with the table empty, so that no other test (they share one process on Windows)
// sees the rows it added.
class EpochValuesTest : public ::testing::TestWithParam<RawOrder> {
 protected:
  void SetUp() override { ResetLeapTableForTesting(); }
  void TearDown() override { ResetLeapTableForTesting(); }
};

// Code values of every system on one time scale, in GPS-time and UTC-based files of both
// epoch record kinds, are checked value for value by the probe job test (probe_epoch_job_test).

TEST_P(EpochValuesTest, LeapSecondsOfTheRecordAreReportedToTheTable) {
  // A day in March 2020, which the built-in table does not cover.
  const uint32_t day = 14670;
  const TimeMs t{day * 86400 + 3600, 0};
  RawWriter w(GetParam());
  w.Header().TimeRef("UTC", {0, day}, 5u, 18u);
  w.Epoch(51, 1000, {Sat(51, 'G', 3, {{0, 2.0e7, {}}})}).EndOfData();
  ScannedFile f(w);
  auto s = f.Open();
  ASSERT_TRUE(s);
  EXPECT_EQ(s->time_reference().leap_seconds, 18u);
  EXPECT_FALSE(s->time_reference().gps);
  EXPECT_EQ(GetLeapSeconds(t), 18u);
  EXPECT_EQ(FirstSatellite(*s)->values[0], 2.0e7 / kC - 18.0);
}

TEST_P(EpochValuesTest, UncoveredTimeWithoutLeapSecondsCountsZero) {
  const uint32_t day = 40000;  // 2089
  RawWriter w(GetParam());
  w.Header().TimeRef("UTC", {0, day});
  w.Epoch(51, 1000, {Sat(51, 'G', 3, {{0, 2.0e7, {}}})}).EndOfData();
  ScannedFile f(w);
  auto s = f.Open();
  ASSERT_TRUE(s);
  EXPECT_EQ(s->time_reference().leap_seconds, 0u);
}

constexpr int kL2cCode = 4, kL2cPhase = 5, kL2pCode = 6, kL2pPhase = 7;

// GPS 5 with L2C and L2P code and phase under each L2C decision of the scan (the scan's own
// replaced by the test's): L2P stays as it is, L2C is corrected or taken from L2P.
TEST_P(EpochValuesTest, L2cDecisionsChooseTheL2cValues) {
  struct Case {
    bool usable, agreeing;
    double l2c_code, l2c_phase;
  };
  const Case cases[] = {
      {true, true, 2.1e7 / kC, 1.1e8 - 0.25},  // both masks: corrected by the offset
      {true, false, 2.1e7 / kC, 1.2e8},        // usable only: L2P phase, the L2C code stays
      {false, false, 2.2e7 / kC, 1.2e8},       // neither: L2P code and phase
  };
  ScannedFile f(
      BuildFile(GetParam(), {{1000, {Sat(51, 'G', 5, {{2, 2.1e7, 1.1e8}, {3, 2.2e7, 1.2e8}})}}}));
  for (const Case& c : cases) {
    SCOPED_TRACE(std::string("usable ") + (c.usable ? "1" : "0") + " agreeing " +
                 (c.agreeing ? "1" : "0"));
    f.ClearRules();
    f.file.c2_l2_offset = 0.25;
    if (c.usable) f.file.c2_usable_mask = 1u << 4;
    if (c.agreeing) f.file.c2_agreeing_mask = 1u << 4;
    auto s = f.Open();
    const auto d = FirstSatellite(*s);
    ASSERT_TRUE(d);
    EXPECT_EQ(d->presence, 0xF0u);
    EXPECT_EQ(d->values[kL2cCode], c.l2c_code);
    EXPECT_EQ(d->values[kL2cPhase], c.l2c_phase);
    EXPECT_EQ(d->values[kL2pCode], 2.2e7 / kC);
    EXPECT_EQ(d->values[kL2pPhase], 1.2e8);
  }
}

TEST_P(EpochValuesTest, L2cUsableOnlyWithoutL2pLosesItsPhase) {
  ScannedFile f(BuildFile(GetParam(), {{1000, {Sat(51, 'G', 5, {{2, 2.1e7, 1.1e8}})}}}));
  f.ClearRules();
  f.file.c2_usable_mask = 1u << 4;
  auto s = f.Open();
  const auto d = FirstSatellite(*s, -1.0);
  EXPECT_EQ(d->presence, 1u << kL2cCode);
  EXPECT_EQ(d->values[kL2cPhase], -1.0);
}

size_t Count(const std::string& text, const std::string& what) {
  size_t n = 0;
  for (size_t p = text.find(what); p != std::string::npos; p = text.find(what, p + 1))
    ++n;
  return n;
}

TEST_P(EpochValuesTest, FirstSolutionCreatesTheNmeaFileAndLaterOnesAppend) {
  ScannedFile f(BuildFile(GetParam(), Seconds(51, 10, 13)));
  const std::string path = (std::filesystem::temp_directory_path() /
                            ("vox_epoch_nmea_" + std::to_string(::getpid()) + ".txt"))
                               .string();
  {
    std::ofstream old(path);
    old << "left over from an earlier run\n";
  }
  f.occupation.nmea_path = path;
  vox_NavSolutionData sol{};
  sol.seconds = At(10).seconds;
  sol.ms = 0;
  sol.x = 4000000.0, sol.y = 1000000.0, sol.z = 4800000.0;
  sol.sat_count = 7;
  sol.hdop = 1.25;
  for (int pass = 0; pass < 2; ++pass) {
    void* s = f.Open().release();
    ASSERT_NE(s, nullptr);
    EXPECT_EQ(vox_SetEpochNavSolutionEx(s, &sol), 0);
    EXPECT_EQ(vox_SetEpochNavSolutionEx(s, &sol), 0);
    EXPECT_EQ(vox_CloseEpochStream(s), 1);
    const std::string text = ReadFile(path);
    EXPECT_EQ(text.find("left over"), std::string::npos);
    EXPECT_EQ(Count(text, "$GPZDA"), 1u) << "each stream starts a fresh file";
    EXPECT_EQ(Count(text, "$GPGGA"), 2u);
    EXPECT_NE(text.find(",1,07,1.2,"), std::string::npos) << "quality 1, satellites, HDOP";
  }
  std::filesystem::remove(path);
}

TEST_P(EpochValuesTest, NoNmeaPathOrAFailedOutputDropsSolutions) {
  ScannedFile f(BuildFile(GetParam(), Seconds(51, 10, 13)));
  vox_NavSolutionData sol{};
  void* s = f.Open().release();
  EXPECT_EQ(vox_SetEpochNavSolutionEx(s, &sol), 0);
  EXPECT_EQ(static_cast<EpochStream*>(s)->NavOutput(0x2), nullptr);
  vox_CloseEpochStream(s);
  f.occupation.nmea_path = "/nonexistent-folder/for/sure/out.nmea";
  s = f.Open().release();
  EXPECT_EQ(vox_SetEpochNavSolutionEx(s, &sol), 0);
  EXPECT_EQ(static_cast<EpochStream*>(s)->NavOutput(0x2), nullptr);
  vox_CloseEpochStream(s);
}

TEST_P(EpochValuesTest, NullArgumentsAndBrokenFilesGiveNothing) {
  EXPECT_EQ(vox_FindEpoch(nullptr, nullptr, nullptr), 0);
  EXPECT_EQ(vox_GetNextEpoch(nullptr, nullptr), 0);
  EXPECT_EQ(vox_GetEpochDataEx(nullptr, nullptr), 0);
  EXPECT_EQ(vox_SetEpochNavSolutionEx(nullptr, nullptr), 0);
  EXPECT_EQ(vox_CloseEpochStream(nullptr), 1);

  ScannedFile f(BuildFile(GetParam(), Seconds(51, 10, 13)));
  void* s = f.Open().release();
  EXPECT_EQ(vox_FindEpoch(s, nullptr, nullptr), 0);
  vox_CloseEpochStream(s);

  f.occupation.time_ref_position = f.occupation.first_epoch_position;  // not a time reference
  EXPECT_FALSE(f.Open());

  TOccupItem lonely(9);
  EXPECT_FALSE(EpochStream::Open(lonely, 0, nullptr, nullptr));
  TOccupItem empty(8);
  TChainItem file(8, "/nonexistent", false, false);
  empty.SetFile(&file);
  EXPECT_FALSE(EpochStream::Open(empty, 0, nullptr, nullptr)) << "no epochs";
}

TEST_P(EpochValuesTest, TruncatedFileEndsTheStream) {
  RawWriter w = BuildFile(GetParam(), Seconds(51, 10, 14));
  ScannedFile whole(w);
  std::vector<uint8_t> bytes = w.bytes();
  bytes.resize(bytes.size() - 20);  // cut into the last epoch
  TempRawFile cut(bytes);
  whole.file.path = cut.path();
  auto s = whole.Open();
  ASSERT_TRUE(s);
  EXPECT_EQ(Delivered(*s).size(), 3u);
}

TEST_P(EpochValuesTest, ThinningGoesOnPastTheGridShiftOfTwoWeeks) {
  // Hourly epochs over 16 days, one time reference per day, thinned to 7 hours: the grid
  // base moves on after 1216800 s, and epochs just before the new base must not stop it.
  RawWriter w(GetParam());
  w.Header();
  for (uint32_t day = 0; day < 16; ++day) {
    w.TimeRef("GPS", {0, kDay + day});
    for (uint32_t hour = 0; hour < 24; ++hour)
      w.Epoch(51, hour * 3600000, {Sat(51, 'G', 1, {{0, 2.0e7, {}}})});
  }
  w.EndOfData();
  ScannedFile f(w);
  ASSERT_EQ(f.file.epoch_count, 16u * 24u);
  auto s = f.Open(7 * 3600 * 1000);
  ASSERT_TRUE(s);
  const std::vector<uint64_t> t = Delivered(*s);
  ASSERT_GT(t.size(), 2u);
  for (size_t i = 1; i < t.size(); ++i)
    EXPECT_GE(t[i] - t[i - 1], 7u * 3600 * 1000) << i;
  EXPECT_GE(t.back(), Ms(At(15 * 86400))) << "deliveries stopped at " << t.back();
  EXPECT_GE(t.size(), 50u);
}

INSTANTIATE_TEST_SUITE_P(Orders, EpochValuesTest,
                         ::testing::Values(RawOrder::kLittle, RawOrder::kBig),
                         [](const auto& info) {
                           return std::string(info.param == RawOrder::kBig ? "Big" : "Little");
                         });

}  // namespace
}  // namespace vox::test
