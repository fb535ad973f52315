// A real survey through the whole system: the RINEX files of stations 0759 and 3040 (one hour,
// 30 s, about 3.3 km apart) converted with voxraw from-rinex, a static job with 0759 as the
// known point (its RINEX header position) and 3040 unknown, run by voxrun with the reference
// raw filter and static engine. The results must agree with the stations' header positions.
#include <gtest/gtest.h>
#include <sys/wait.h>

#include <array>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <memory>
#include <variant>

#include "realdata.h"
#include "result_reader.h"
#include "support/scratch.h"

namespace vox::test {
namespace {

using Xyz = std::array<double, 3>;

// From the RINEX headers (APPROX POSITION XYZ).
constexpr Xyz k0759 = {-3976219.5082, 3382372.5671, 3652512.9849};
constexpr Xyz k3040 = {-3978242.4348, 3382841.1715, 3649902.7667};

std::string JobFile(const std::string& base_raw, const std::string& rover_raw) {
  char point[160];
  std::snprintf(point, sizeof point, "PosX=%.4f\nPosY=%.4f\nPosZ=%.4f\n", k0759[0], k0759[1],
                k0759[2]);
  return "[JOB]\nName=Real data 0759-3040\nType=1\nResultPath=result.bin\nNumFiles=2\n"
         "NumPoints=2\nNumOccups=2\nNumVectors=1\nNumAntennas=1\nNumReceivers=1\n"
         "[FILE:1]\nName=" +
         base_raw + "\n[FILE:2]\nName=" + rover_raw +
         "\n"
         "[POINT:1]\nName=0759\n" +
         point +
         "Type=0\n"
         "[POINT:2]\nName=3040\n"
         "[ANTENNA:1]\nName=TRM29659.00\n"
         "[RECEIVER:1]\nVendor=TRIMBLE\nName=5700\n"
         "[OCCUP:1]\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\n"
         "[OCCUP:2]\nFile=2\nPoint=2\nAntenna=1\nReceiver=1\n"
         "[VECTOR:1]\nPoints=1,2\n";
}

struct SurveyRun {
  ScratchDir scratch;
  std::string convert_errors;
  int exit_code = -1;
  std::string voxrun_output;
  tools::ReadResult result;
};

// Converts both stations (the rover's file in the other byte order: the job mixes both) and
// runs the job, with the extra lines in its [JOB] section, through voxrun.
std::unique_ptr<SurveyRun> RunSurvey(const std::string& job_lines) {
  auto run = std::make_unique<SurveyRun>();
  const std::string dir = run->scratch.path().string();
  const ToolRun a = RunVoxraw({"from-rinex", GnssDir() + "/07590920.05o",
                               GnssDir() + "/07590920.05n", "-o", dir + "/0759.raw"},
                              dir);
  const ToolRun b =
      RunVoxraw({"from-rinex", GnssDir() + "/30400920.05o", GnssDir() + "/30400920.05n", "-o",
                 dir + "/3040.raw", "--big-endian"},
                dir);
  run->convert_errors = a.err + b.err;
  if (a.exit_code != 0 || b.exit_code != 0) return run;
  WriteFile(dir + "/job.ini", JobFile("0759.raw", "3040.raw") + job_lines);
  const std::string command = std::string("'") + VOXRUN_PATH + "' --quiet '" + dir +
                              "/job.ini' >'" + dir + "/voxrun.out' 2>&1";
  const int status = std::system(command.c_str());
  run->exit_code = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  run->voxrun_output = ReadFile(dir + "/voxrun.out");
  run->result = tools::ReadResultFile(dir + "/result.bin");
  return run;
}

void ExpectRan(const SurveyRun& run) {
  ASSERT_TRUE(run.convert_errors.empty()) << run.convert_errors;
  ASSERT_EQ(run.exit_code, 0) << run.voxrun_output;
  ASSERT_FALSE(run.result.fault) << run.result.fault->what;
}

template <typename T>
std::vector<T> Records(const tools::ReadResult& result) {
  std::vector<T> out;
  for (const tools::Record& r : result.records)
    if (const T* body = std::get_if<T>(&r.body)) out.push_back(*body);
  return out;
}

double BaselineOffset(const tools::VectorRec& v) {
  const Xyz expected = {k3040[0] - k0759[0], k3040[1] - k0759[1], k3040[2] - k0759[2]};
  return Distance({v.baseline[0], v.baseline[1], v.baseline[2]}, expected);
}

#ifdef VOX_REFERENCE_ENGINES
#define REQUIRE_REFERENCE_ENGINES() REQUIRE_GNSS_DATA()
#else
#define REQUIRE_REFERENCE_ENGINES() \
  GTEST_SKIP()                      \
      << "the reference engines (kra_rawfilter.dll, kra_static.eng) are not part of this build"
#endif

// The job is run once for all tests of the suite.
class SurveyJob : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    if (!GnssDir().empty()) run_ = RunSurvey("");
  }
  static void TearDownTestSuite() { run_.reset(); }

  void SetUp() override {
    REQUIRE_REFERENCE_ENGINES();
    ASSERT_NO_FATAL_FAILURE(ExpectRan(*run_));
  }

  static std::unique_ptr<SurveyRun> run_;
};

std::unique_ptr<SurveyRun> SurveyJob::run_;

TEST_F(SurveyJob, MeanSinglePointPositionOfEachStationLiesWithinTenMetresOfItsHeader) {
  const auto occupations = Records<tools::OccupationRec>(run_->result);
  ASSERT_EQ(occupations.size(), 2u);
  for (const tools::OccupationRec& o : occupations) {
    const Xyz& header = o.occupation == 1 ? k0759 : k3040;
    const Xyz nav = {o.nav[0], o.nav[1], o.nav[2]};
    const double off = Distance(nav, header);
    std::printf("occupation %u (%s): %u epochs, navigation position %.2f m from the header\n",
                o.occupation, o.point_name.c_str(), o.epochs, off);
    EXPECT_EQ(o.epochs, 120u);
    EXPECT_LT(off, 10.0) << o.point_name;
  }
}

// The two receivers tag their epochs by their own drifting clocks: 0759 from 1 to 5 ms after
// the half minute, 3040 down to 4 ms before it, so only a tenth of the tags agree exactly.
// Every epoch must still pair with the other station's, and an hour of them fixes the
// integers clearly: an offset mishandled in the geometry (the satellites move about 0.8 m of
// range per millisecond) would leave metres in the double differences and no fix.
TEST_F(SurveyJob, StaticBaselineFromEpochsTaggedMillisecondsApartFixesAndAgreesWithTheHeaders) {
  const auto vectors = Records<tools::VectorRec>(run_->result);
  ASSERT_EQ(vectors.size(), 1u);
  const tools::VectorRec& v = vectors[0];
  const double off = BaselineOffset(v);
  const unsigned kind = v.flags & 3u;  // 1 fixed phase, 2 float phase, 3 code only
  const char* names[] = {"unsolved", "fixed carrier phase", "float carrier phase", "code"};
  const unsigned common = v.values_80[1];  // the epochs the two receivers have in common
  std::printf(
      "baseline 0759 -> 3040: %s solution from %u of 120 epochs, %.3f m from the header "
      "difference\n",
      names[kind], common, off);
  RecordProperty("baseline_offset_m", std::to_string(off));
  RecordProperty("common_epochs", std::to_string(common));
  EXPECT_EQ(common, 120u) << "common epochs";
  EXPECT_EQ(kind, 1u) << "not a fixed carrier-phase solution";
  EXPECT_GT(v.value_100, 10.0f) << "ratio of the integer fix";
  EXPECT_LT(off, 0.5);
}

// Thinned to a minute, the same drifting tags must keep the epoch nearest every whole
// minute (exact multiples would keep only the few tagged on the second).
TEST(SurveyJobThinned, EpochsTaggedOffTheMinuteStillThinToOneAMinute) {
  REQUIRE_REFERENCE_ENGINES();
  const auto run = RunSurvey("Interval=60\n");
  ASSERT_NO_FATAL_FAILURE(ExpectRan(*run));
  const auto vectors = Records<tools::VectorRec>(run->result);
  ASSERT_EQ(vectors.size(), 1u);
  const tools::VectorRec& v = vectors[0];
  const double off = BaselineOffset(v);
  std::printf("baseline 0759 -> 3040 at 60 s: %u of 60 epochs, %.3f m from the header difference\n",
              v.values_80[1], off);
  EXPECT_EQ(v.values_80[1], 60u) << "common epochs";
  EXPECT_EQ(v.flags & 3u, 1u) << "not a fixed carrier-phase solution";
  EXPECT_LT(off, 0.5);
}

}  // namespace
}  // namespace vox::test
