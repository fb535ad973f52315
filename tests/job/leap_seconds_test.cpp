#include "job/leap_seconds.h"

#include <gtest/gtest.h>

#include "base/gps_time.h"
#include "vox/vox_sdk_leap.h"

namespace vox {
namespace {

// The table is process-wide: every test starts from the empty table of a fresh load.
class LeapTableTest : public ::testing::Test {
 protected:
  void SetUp() override { ResetLeapTableForTesting(); }
  void TearDown() override { ResetLeapTableForTesting(); }

  static bool ReadText(const char* text) {
    JobSection reader(text);
    return ReadLeapSection(reader);
  }
};

TEST_F(LeapTableTest, FirstQueryLoadsTheBuiltInTable) {
  const TimeMs origin{0, 0};
  EXPECT_EQ(GetLeapSeconds(origin), 0u);
  ASSERT_EQ(LeapTableRows().size(), 19u);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2016, 3, 15)), 17u);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2017, 3, 1)), 18u);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2020, 3, 1)), kLeapUnknown);
  // Span bounds: 1 s from 1981-07-01 on, the last row ends at 2017-07-01.
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(1981, 7, 1)), 1u);
  EXPECT_EQ(GetLeapSeconds(TimeMs{TimeMsFromDate(1981, 7, 1).seconds - 1, 0}), 0u);
  EXPECT_EQ(LeapTableRows().back().end, TimeMsFromDate(2017, 7, 1).seconds);
}

TEST_F(LeapTableTest, ChangesBetweenTwoTimes) {
  EXPECT_EQ(GetLeapChanges(TimeMsFromDate(2016, 6, 1), TimeMsFromDate(2017, 2, 1)), 1u);
  EXPECT_EQ(GetLeapChanges(TimeMsFromDate(2017, 2, 1), TimeMsFromDate(2016, 6, 1)), 0xFFFFFFFFu);
  // A time no row holds counts as 0.
  EXPECT_EQ(GetLeapChanges(TimeMsFromDate(2016, 6, 1), TimeMsFromDate(2021, 1, 1)),
            static_cast<uint32_t>(-17));
}

TEST_F(LeapTableTest, RowAppendedAtRunTimeCoversItsHalfYear) {
  GetLeapSeconds(TimeMs{0, 0});
  EXPECT_EQ(SetLeapSeconds(TimeMsFromDate(2020, 3, 10), 18), 18u);
  const LeapRow row = LeapTableRows().back();
  EXPECT_EQ(row.begin, TimeMsFromDate(2020, 1, 1).seconds);
  EXPECT_EQ(row.end, TimeMsFromDate(2020, 7, 1).seconds);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2020, 5, 1)), 18u);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2020, 9, 1)), kLeapUnknown);
  // A covered time keeps its value whatever the caller says.
  EXPECT_EQ(SetLeapSeconds(TimeMsFromDate(2016, 3, 1), 99), 17u);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2016, 3, 1)), 17u);
}

TEST_F(LeapTableTest, SetOnEmptyTableNeverLoadsBuiltIn) {
  EXPECT_EQ(SetLeapSeconds(TimeMsFromDate(2020, 9, 10), 18), 18u);
  ASSERT_EQ(LeapTableRows().size(), 1u);
  EXPECT_EQ(LeapTableRows()[0].begin, TimeMsFromDate(2020, 7, 1).seconds);
  EXPECT_EQ(GetLeapSeconds(TimeMsFromDate(2016, 3, 1)), kLeapUnknown);
}

TEST_F(LeapTableTest, FullTableRefusesNewRows) {
  for (int i = 0; i < 32; ++i)
    ASSERT_EQ(SetLeapSeconds(TimeMsFromDate(2000 + i, 2, 1), i), static_cast<uint32_t>(i));
  EXPECT_EQ(SetLeapSeconds(TimeMsFromDate(2040, 2, 1), 40), kLeapUnknown);
  EXPECT_EQ(LeapTableRows().size(), 32u);
}

TEST_F(LeapTableTest, JobSectionWithAnInvalidDateKeepsTheValidEntry) {
  ASSERT_TRUE(ReadText("[JOB]\nName=x\n[LEAP_SEC]\nNum=2\n0=1980.0\n1=2500.0\n"));
  const auto rows = LeapTableRows();
  ASSERT_EQ(rows.size(), 1u);
  EXPECT_EQ(rows[0].leap_seconds, 0u);
  EXPECT_EQ(rows[0].begin, 0u);
  EXPECT_EQ(rows[0].end, TimeMsFromDate(1980, 7, 1).seconds);
}

TEST_F(LeapTableTest, SectionsWithoutValidEntriesKeepTheOldTable) {
  GetLeapSeconds(TimeMs{0, 0});
  EXPECT_FALSE(ReadText("[LEAP_SEC]\nNum=3\n0=\n2=abc\n"));
  EXPECT_FALSE(ReadText("[LEAP_SEC]\nNum=0\n0=1990.0\n"));
  EXPECT_FALSE(ReadText("[JOB]\nNum=1\n0=1990.0\n"));
  EXPECT_EQ(LeapTableRows().size(), 19u);
}

TEST_F(LeapTableTest, EndYearCountsOnlyOnTheLastEntry) {
  ASSERT_TRUE(ReadText("[LEAP_SEC]\nNum=7\n5=1990.0,1995.0\n6=1991.0 , 1993.5\n"));
  const auto rows = LeapTableRows();
  ASSERT_EQ(rows.size(), 2u);
  EXPECT_EQ(rows[0].leap_seconds, 5u);
  EXPECT_EQ(rows[0].end, TimeMsFromDate(1991, 1, 1).seconds);
  EXPECT_EQ(rows[1].leap_seconds, 6u);
  EXPECT_EQ(rows[1].end, TimeMsFromDate(1993, 7, 1).seconds);
}

TEST_F(LeapTableTest, MoreThan32ValidEntriesKeepTheFirst32) {
  std::string text = "[LEAP_SEC]\nNum=40\n";
  for (int i = 0; i < 40; ++i)
    text += std::to_string(i) + "=" + std::to_string(1981 + i) + "\n";
  ASSERT_TRUE(ReadText(text.c_str()));
  const auto rows = LeapTableRows();
  ASSERT_EQ(rows.size(), 32u);
  EXPECT_EQ(rows.back().leap_seconds, 31u);
  EXPECT_EQ(rows.back().end, TimeMsFromDate(2012, 7, 1).seconds);
}

TEST(DecimalYearToGps, HalfYearsAndLimits) {
  EXPECT_EQ(DecimalYearToGps(1980.0), 0u);
  EXPECT_EQ(DecimalYearToGps(1979.5), 0u);
  EXPECT_EQ(DecimalYearToGps(1980.5), TimeMsFromDate(1980, 7, 1).seconds);
  EXPECT_EQ(DecimalYearToGps(2017.2), TimeMsFromDate(2017, 7, 1).seconds);
  EXPECT_EQ(DecimalYearToGps(std::nan("")), 0u);
  EXPECT_EQ(DecimalYearToGps(1e300), 0xFFFFFFFFu);
}

TEST(LeapExports, NullPointersAreRefused) {
  const TimeMs t{0, 0};
  EXPECT_EQ(vox_GetLeapSeconds(nullptr), 0xFFFFFFFFu);
  EXPECT_EQ(vox_GetLeapChanges(&t, nullptr), 0u);
  EXPECT_EQ(vox_SetLeapSeconds(nullptr, 3), 0xFFFFFFFFu);
}

}  // namespace
}  // namespace vox
