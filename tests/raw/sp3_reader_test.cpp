#include "raw/sp3_reader.h"

#include <gtest/gtest.h>
#include <stdlib.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>

#include "base/gps_time.h"

namespace vox {
namespace {

namespace fs = std::filesystem;

const SatId kG01 = MakeSatId(SatSystem::kGps, 1);

std::string HeaderLine(char version, int year, int epochs) {
  char line[128];
  std::snprintf(line, sizeof line, "#%cP%4d %2d %2d %2d %2d %11.8f %7d ORBIT IGS05 HLM  IGS",
                version, year, 7, 1, 0, 0, 0.0, epochs);
  return line;
}

std::string EpochLine(int hour, int minute, double seconds) {
  char line[64];
  std::snprintf(line, sizeof line, "*  2010  7  1 %2d %2d %11.8f", hour, minute, seconds);
  return line;
}

std::string PositionLine(char system, int number, double x, double y, double z, double clock) {
  char line[96];
  std::snprintf(line, sizeof line, "P%c%02d%14.6f%14.6f%14.6f%14.6f", system, number, x, y, z,
                clock);
  return line;
}

class Sp3ReaderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string pattern = (fs::temp_directory_path() / "sp3_reader_test_XXXXXX").string();
    ASSERT_NE(mkdtemp(pattern.data()), nullptr);
    dir_ = pattern;
  }
  void TearDown() override { fs::remove_all(dir_); }

  // Header with announced epochs and satellites, then body lines; returns the read status.
  int Read(int epochs, int satellites, const std::vector<std::string>& body) {
    std::string text = HeaderLine('c', 2010, epochs) + "\n";
    text += "## 1590 345600.00000000   900.00000000 55378 0.0000000000000\n";
    char plus[64];
    std::snprintf(plus, sizeof plus, "+  %3d   G01G02", satellites);
    text += std::string(plus) + "\n++         0  2\n%c G  cc GPS ccc\n/* comment\n";
    for (const std::string& line : body)
      text += line + "\n";
    return ReadText(text);
  }
  int ReadText(const std::string& text) {
    const std::string path = (dir_ / "orbit.sp3").string();
    std::ofstream(path, std::ios::binary) << text;
    TBufFile file;
    EXPECT_TRUE(file.OpenRead(path));
    return ReadPreciseOrbitFile(file, store_);
  }

  fs::path dir_;
  PreciseStore store_;
};

const TimeMs kDay = TimeMsFromDate(2010, 7, 1);

TEST(Sp3Header, Recognition) {
  const std::string good = HeaderLine('c', 2010, 96);
  ASSERT_EQ(good.size(), 60u);
  EXPECT_TRUE(IsPreciseOrbitHeader(good));
  EXPECT_TRUE(IsPreciseOrbitHeader(good + "\r"));
  EXPECT_TRUE(IsPreciseOrbitHeader(HeaderLine('a', 1970, 96)));
  EXPECT_TRUE(IsPreciseOrbitHeader(HeaderLine('b', 2070, 96)));
  EXPECT_FALSE(IsPreciseOrbitHeader(good + " "));  // 61 characters
  EXPECT_FALSE(IsPreciseOrbitHeader(good.substr(0, 59)));
  EXPECT_FALSE(IsPreciseOrbitHeader(HeaderLine('c', 1969, 96)));
  EXPECT_FALSE(IsPreciseOrbitHeader(HeaderLine('c', 2071, 96)));
  EXPECT_FALSE(IsPreciseOrbitHeader(HeaderLine('d', 2010, 96)));
  std::string velocity = good;
  velocity[2] = 'V';
  EXPECT_TRUE(IsPreciseOrbitHeader(velocity));
  for (size_t column : {0u, 2u, 7u, 10u, 13u}) {
    std::string bad = good;
    bad[column] = 'X';
    EXPECT_FALSE(IsPreciseOrbitHeader(bad)) << column;
  }
  std::string month = good;
  month.replace(8, 2, "13");
  EXPECT_FALSE(IsPreciseOrbitHeader(month));
  std::string day = good;
  day.replace(11, 2, " 0");
  EXPECT_FALSE(IsPreciseOrbitHeader(day));
}

TEST_F(Sp3ReaderTest, ReadsPositionsAndSkipsUncountedLines) {
  const int status = Read(
      2, 3,
      {EpochLine(0, 0, 0.0), PositionLine('G', 1, 18392.619117, 7490.690408, -17846.346485, 12.5),
       "VG01  1234.5 1234.5 1234.5 0.0",  // velocity: not counted
       "EP  55    48    78     91  -12  34", PositionLine('J', 1, 1.0, 2.0, 3.0, 0.0),  // GPS 33
       PositionLine('X', 2, 1.0, 2.0, 3.0, 0.0),  // counted, not used
       EpochLine(0, 15, 30.5), PositionLine(' ', 1, 4.0, 5.0, 6.0, -1.0),
       PositionLine('R', 24, 7.0, 8.0, 9.0, 0.0),
       PositionLine('R', 25, 7.0, 8.0, 9.0, 0.0),  // no such slot
       "EOF"});
  EXPECT_EQ(status, kPreciseFileComplete);

  const PreciseSample* g01 = store_.first(SatIndexOf(kG01));
  ASSERT_NE(g01, nullptr);
  EXPECT_TRUE(g01->time == kDay);
  EXPECT_DOUBLE_EQ(g01->x, 18392619.117);
  EXPECT_DOUBLE_EQ(g01->y, 7490690.408);
  EXPECT_DOUBLE_EQ(g01->z, -17846346.485);
  EXPECT_EQ(g01->clock, static_cast<float>(12.5e-6));
  ASSERT_NE(g01->next, nullptr);
  EXPECT_TRUE(g01->next->time == (TimeMs{kDay.seconds + 930, 500}));
  EXPECT_EQ(g01->next->x, 4000.0);
  EXPECT_EQ(store_.count(SatIndexOf(kG01)), 2u);

  EXPECT_EQ(store_.count(SatIndexOf(MakeSatId(SatSystem::kGps, 33))), 1u);
  EXPECT_EQ(store_.count(SatIndexOf(MakeSatId(SatSystem::kGps, 2))), 0u);
  EXPECT_EQ(store_.count(SatIndexOf(MakeSatId(SatSystem::kGlonass, 24))), 1u);
  uint32_t total = 0;
  for (unsigned i = 0; i < kSatIndexCount; ++i)
    total += store_.count(i);
  EXPECT_EQ(total, 4u);
}

TEST_F(Sp3ReaderTest, SecondSampleOfTheSameSecondIsDropped) {
  EXPECT_EQ(Read(2, 1,
                 {EpochLine(1, 0, 0.0), PositionLine('G', 1, 1.0, 1.0, 1.0, 0.0),
                  EpochLine(1, 0, 0.25), PositionLine('G', 1, 2.0, 2.0, 2.0, 0.0)}),
            kPreciseFileComplete);
  EXPECT_EQ(store_.count(SatIndexOf(kG01)), 1u);
  EXPECT_EQ(store_.first(SatIndexOf(kG01))->x, 1000.0);
}

TEST_F(Sp3ReaderTest, EpochWithMissingPositionLinesDoesNotSwallowTheNextEpoch) {
  EXPECT_EQ(
      Read(2, 2,
           {EpochLine(0, 0, 0.0), PositionLine('G', 1, 1.0, 1.0, 1.0, 0.0), EpochLine(0, 15, 0.0),
            PositionLine('G', 1, 2.0, 2.0, 2.0, 0.0), PositionLine('G', 2, 3.0, 3.0, 3.0, 0.0)}),
      kPreciseFileComplete);
  const PreciseSample* g01 = store_.first(SatIndexOf(kG01));
  ASSERT_NE(g01, nullptr);
  ASSERT_NE(g01->next, nullptr);
  EXPECT_EQ(g01->next->time.seconds, kDay.seconds + 900);
  EXPECT_EQ(g01->next->x, 2000.0);
  EXPECT_EQ(store_.first(SatIndexOf(MakeSatId(SatSystem::kGps, 2)))->time.seconds,
            kDay.seconds + 900);
}

TEST_F(Sp3ReaderTest, Statuses) {
  // Ends within the positions of an epoch, and before an announced epoch: samples stay.
  EXPECT_EQ(Read(2, 2, {EpochLine(0, 0, 0.0), PositionLine('G', 1, 1.0, 1.0, 1.0, 0.0)}),
            kPreciseFileEnded);
  EXPECT_EQ(store_.count(SatIndexOf(kG01)), 1u);
  EXPECT_EQ(Read(3, 1, {EpochLine(0, 0, 0.0), PositionLine('G', 1, 1.0, 1.0, 1.0, 0.0)}),
            kPreciseFileEnded);
  // An unexpected line where an epoch line belongs.
  EXPECT_EQ(Read(2, 1, {EpochLine(0, 0, 0.0), PositionLine('G', 1, 1.0, 1.0, 1.0, 0.0), "EOF"}),
            kPreciseFileMalformed);
  EXPECT_EQ(Read(1, 1, {PositionLine('G', 1, 1.0, 1.0, 1.0, 0.0)}), kPreciseFileMalformed);

  const std::string first = HeaderLine('c', 2010, 1) + "\n";
  EXPECT_EQ(ReadText("#dP" + first.substr(3)), kPreciseFileMalformed);
  EXPECT_EQ(ReadText(first + "# 1590\n+   1\n"), kPreciseFileMalformed);
  EXPECT_EQ(ReadText(first + "## 1590\n-   1\n"), kPreciseFileMalformed);
  EXPECT_EQ(ReadText(first + "## 1590\n"), kPreciseFileEnded);
}

std::string DataFile(const char* name) {
  return std::string(VOX_SHARED_DIR) + "/data/gnss/" + name;
}

// Every sample of a real orbit file is compared with its text by the real-data tests.
TEST(Sp3RealFiles, HeaderPaddedTo80ColumnsIsNotTaken) {
  TBufFile file;
  ASSERT_TRUE(file.OpenRead(DataFile("esa15253.sp3")));
  EXPECT_FALSE(IsPreciseOrbitFile(file));
}

}  // namespace
}  // namespace vox
