#include "job/job_parser.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <random>
#include <vector>

#include "job/job_paths.h"
#include "job/leap_seconds.h"
#include "job/trace_capture.h"

namespace vox {
namespace {

// Records what the parser asks of the engines. Loading fails for the paths in `missing` and
// for a path that names a folder (what an empty engine name completes to).
class FakeBinder : public EngineBinder {
 public:
  struct Fill {
    EngineRole role;
    std::string section;
    std::map<std::string, std::string> values;
  };

  bool LoadEngine(EngineRole role, const std::string& path) override {
    loads.push_back({role, path});
    return !path.empty() && path.back() != '/' && path != missing;
  }
  std::unique_ptr<ParamBlock> CreateJobBlock(EngineRole role) override {
    if (block_size == 0) return nullptr;
    auto block = ParamBlock::Create(block_size);
    block->data()[4] = role == EngineRole::kStatic ? 0x5 : 0x1;
    return block;
  }
  bool FillParameters(EngineRole role, const JobSection& section, ParamBlock& block) override {
    Fill fill{role, section.section_name(), {}};
    for (const char* name : {"Elevation", "StartPoint"}) {
      const std::string value = EngineParameterValue(section, name);
      if (!value.empty()) fill.values[name] = value;
    }
    block.data()[5] = static_cast<uint8_t>(fills.size() + 1);
    fills.push_back(fill);
    return true;
  }

  std::vector<std::pair<EngineRole, std::string>> loads;
  std::vector<Fill> fills;
  std::string missing;
  uint16_t block_size = 16;
};

constexpr const char* kModule = "/opt/vox/lib/libvox.so";

class JobParserTest : public ::testing::Test {
 protected:
  void SetUp() override { ResetLeapTableForTesting(); }
  void TearDown() override { ResetLeapTableForTesting(); }

  bool Parse(const std::string& text, uint32_t cpus = 4) {
    return ParseInto(text, binder, model, cpus);
  }
  // A parse of its own, for cases that compare jobs.
  bool ParseInto(const std::string& text, FakeBinder& b, JobModel& m, uint32_t cpus = 4) {
    JobParseInput input;
    input.job_folder = folder;
    input.module_path = kModule;
    input.cpu_count = cpus;
    return ParseJob(text, input, b, m);
  }

  std::string folder = "/jobs/";
  FakeBinder binder;
  JobModel model;
};

TEST_F(JobParserTest, MissingJobSectionFails) {
  EXPECT_FALSE(Parse("[FILE:1]\nName=a.raw\n"));
  EXPECT_TRUE(binder.loads.empty());
}

TEST_F(JobParserTest, TypeMapsToJobKindAndUnknownTypesRunTheRawFilterOnly) {
  const std::pair<const char*, uint32_t> cases[] = {
      {"Type=1\n", 1}, {"Type=2\n", 3}, {"Type=3\n", 2}, {"Type=4\n", 0}, {"", 0}};
  for (const auto& [line, kind] : cases) {
    JobModel m;
    FakeBinder b;
    ASSERT_TRUE(ParseInto(std::string("[JOB]\nEnginePath=x.eng\n") + line, b, m));
    EXPECT_EQ(m.job_kind, kind) << line;
    EXPECT_EQ(m.raw_filter_only, kind == 0) << line;
    EXPECT_EQ(b.loads.empty(), kind == 0) << line;
  }
  ASSERT_TRUE(
      Parse("[JOB]\nType=1\nRunRawFilterOnly=1\nNumVectors=1\nNumPoints=2\n"
            "[VECTOR:1]\nPoints=1,2\n"));
  EXPECT_EQ(model.job_kind, 1u);
  EXPECT_TRUE(binder.loads.empty());
  EXPECT_TRUE(binder.fills.empty());
  EXPECT_EQ(model.vectors.head()->property, nullptr);
  EXPECT_EQ(model.raw_filter_path, "/opt/vox/lib/kra_rawfilter.dll");
}

TEST_F(JobParserTest, DefaultEngineNamesAreTakenInTheLibraryFolder) {
  const std::tuple<const char*, const char*> cases[] = {
      {"Type=1\n", "kra_static.eng"},
      {"Type=2\n", "kra_kinematic.eng"},
      {"Type=1\nMultisite=1\n", "kra_mstatic.eng"},
      {"Type=3\nMultisite=1\n", "kra_mkinematic.eng"},
  };
  for (const auto& [lines, engine] : cases) {
    JobModel m;
    FakeBinder b;
    ASSERT_TRUE(ParseInto(std::string("[JOB]\n") + lines, b, m));
    ASSERT_FALSE(b.loads.empty());
    EXPECT_EQ(b.loads[0].second, std::string("/opt/vox/lib/") + engine);
  }
  ASSERT_TRUE(Parse("[JOB]\nType=2\nEnginePath=engines\\kra_static.eng\nRawfiltPath=rf.so\n"));
  EXPECT_EQ(binder.loads[0].second, "engines\\kra_static.eng");
  EXPECT_EQ(model.raw_filter_path, "/opt/vox/lib/rf.so");
}

TEST_F(JobParserTest, EngineThatCannotBeLoadedFailsTheParse) {
  testing::TraceCapture trace;
  binder.missing = "/opt/vox/lib/kra_static.eng";
  EXPECT_FALSE(Parse("[JOB]\nType=1\n"));
  EXPECT_NE(trace.Text().find("Engine '/opt/vox/lib/kra_static.eng' not found\n"),
            std::string::npos);
}

TEST_F(JobParserTest, NumCpusIsClampedAndDefaultsToTheCallersCount) {
  ASSERT_TRUE(Parse("[JOB]\nNumCPUs=0\n"));
  EXPECT_EQ(model.thread_count, 1u);
  JobModel many, absent;
  ASSERT_TRUE(ParseInto("[JOB]\nNumCPUs=64\n", binder, many));
  EXPECT_EQ(many.thread_count, 32u);
  ASSERT_TRUE(ParseInto("[JOB]\n", binder, absent, 6));
  EXPECT_EQ(absent.thread_count, 6u);
}

// A count far beyond any survey (a typo, a damaged file) is limited, with a trace line, so
// that the parse neither stalls over billions of section searches nor exhausts memory.
TEST_F(JobParserTest, AbsurdItemCountsAreLimited) {
  testing::TraceCapture trace;
  ASSERT_TRUE(Parse("[JOB]\nNumPoints=2000000000\nNumFans=1999999999\nNumFiles=65535\n"));
  EXPECT_EQ(model.points.Count(), 65535u);
  EXPECT_EQ(model.points.FindById(kPointTag + 65535)->name, "POINT:65535");
  EXPECT_NE(trace.Text().find("NumPoints=2000000000 limited to 65535\n"), std::string::npos);
  EXPECT_NE(trace.Text().find("NumFans=1999999999 limited to 65535\n"), std::string::npos);
  EXPECT_EQ(trace.Text().find("NumFiles="), std::string::npos);
}

TEST_F(JobParserTest, ControlFlagsAndScalars) {
  ASSERT_TRUE(Parse("[JOB]\nProcessControlFlags=7\nMaxExtraBases=-3\nResultVersion=101\n"));
  EXPECT_EQ(model.engine_flags, 6u);
  EXPECT_EQ(model.max_extra_bases, -3);
  EXPECT_EQ(model.result_version, 101);
  JobModel defaults;
  ASSERT_TRUE(ParseInto("[JOB]\n", binder, defaults));
  EXPECT_EQ(defaults.engine_flags, 4u);
  EXPECT_EQ(defaults.max_extra_bases, 2);
  EXPECT_EQ(defaults.result_version, 100);
}

// A scratch folder for result paths that must exist on disk.
class ScratchFolder {
 public:
  ScratchFolder()
      : path_(std::filesystem::temp_directory_path() /
              ("vox_job_parser_" + std::to_string(std::random_device{}()))) {
    std::filesystem::create_directories(path_);
  }
  ~ScratchFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
  }
  std::string folder() const { return path_.string() + "/"; }
  void Touch(const std::string& name) const { std::ofstream(path_ / name) << "x"; }

 private:
  std::filesystem::path path_;
};

TEST_F(JobParserTest, ExistingResultIsNeverOverwrittenWhenAsked) {
  ScratchFolder scratch;
  folder = scratch.folder();
  scratch.Touch("r.bin");
  testing::TraceCapture trace;
  ASSERT_TRUE(Parse("[JOB]\nName=Job\nResultPath=r.bin ; result\nAutoIncrementResultPath=1\n"));
  EXPECT_EQ(model.result_path, folder + "r_0.bin");
  EXPECT_EQ(model.job_name, "Job(0)");
  EXPECT_EQ(trace.Text(), "ResultPath=" + folder + "r_0.bin\n");

  scratch.Touch("r_0.bin");
  JobModel next;
  ASSERT_TRUE(
      ParseInto("[JOB]\nName=Job\nResultPath=r.bin\nAutoIncrementResultPath=1\n", binder, next));
  EXPECT_EQ(next.result_path, folder + "r_1.bin");
  EXPECT_EQ(next.job_name, "Job(1)");

  JobModel plain;
  ASSERT_TRUE(ParseInto("[JOB]\nName=Job\nResultPath=r.bin\n", binder, plain));
  EXPECT_EQ(plain.result_path, folder + "r.bin");
  EXPECT_EQ(plain.job_name, "Job");
}

TEST(JobPaths, AutoIncrementNumbersOnlyTheFileName) {
  ScratchFolder scratch;
  scratch.Touch("result");
  std::string path = scratch.folder() + "result";
  std::string name = "J";
  AutoIncrementResultPath(path, name);
  EXPECT_EQ(path, scratch.folder() + "result_0");
  EXPECT_EQ(name, "J(0)");
}

TEST(JobPaths, CompletionFollowsBothSeparators) {
  EXPECT_EQ(JobFolderOf("C:\\jobs\\a.job"), "C:\\jobs\\");
  EXPECT_EQ(JobFolderOf("/jobs/sub\\a.job"), "/jobs/sub\\");
  EXPECT_EQ(JobFolderOf("a.job"), "./");
  EXPECT_EQ(ResolveJobPath("", "/jobs/"), "");
  EXPECT_EQ(ResolveJobPath("r.bin", "/jobs/"), "/jobs/r.bin");
  EXPECT_EQ(ResolveJobPath("/abs/r.bin", "/jobs/"), "/abs/r.bin");
  EXPECT_EQ(ResolveJobPath("\\\\srv\\r.bin", "/jobs/"), "\\\\srv\\r.bin");
  EXPECT_EQ(ResolveJobPath("\\data\\r.bin", "D:\\jobs\\"), "D:\\data\\r.bin");
  EXPECT_EQ(ResolveJobPath("\\data\\r.bin", "/jobs/"), "/jobs/\\data\\r.bin");
  EXPECT_EQ(ResolveJobPath("E:\\r.bin", "/jobs/"), "E:\\r.bin");
  EXPECT_EQ(ResolveJobPath("E:r.bin", "/jobs/"), "/jobs/E:r.bin");
  EXPECT_EQ(ResolveModulePath("kra_static.eng", "/lib/libvox.so"), "/lib/kra_static.eng");
  EXPECT_EQ(ResolveModulePath("kra_static.eng", "libvox.so"), "./kra_static.eng");
  EXPECT_EQ(ResolveModulePath("kra_static.eng", ""), "./kra_static.eng");
  EXPECT_EQ(ResolveModulePath("e\\k.eng", "/lib/libvox.so"), "e\\k.eng");
}

TEST_F(JobParserTest, TheTwoPointExampleJob) {
  ASSERT_TRUE(Parse(
      "[JOB]\nName=Bridge control\nType=1\nResultPath=result.bin\nNumFiles=2\nNumPoints=2\n"
      "NumOccups=2\nNumVectors=1\nNumAntennas=1\nNumReceivers=1\n[FILE:1]\nName=base.raw\n"
      "[FILE:2]\nName=rover.raw\n[POINT:1]\nName=BASE\nPosX=2849000.125\nPosY=2196000.250\n"
      "PosZ=5249000.375\nType=0\n[POINT:2]\nName=ROVER\n[ANTENNA:1]\nName=A1\n[RECEIVER:1]\n"
      "Name=R1\n[OCCUP:1]\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\nOffsetL1_U=1.5\n[OCCUP:2]\n"
      "File=2\nPoint=2\nAntenna=1\nReceiver=1\n[VECTOR:1]\nPoints=1,2\n"));
  EXPECT_EQ(binder.loads[0].second, "/opt/vox/lib/kra_static.eng");
  EXPECT_EQ(model.result_path, "/jobs/result.bin");
  ASSERT_EQ(model.files.Count(), 2u);
  EXPECT_EQ(model.files.head()->id, 0x04000001u);
  EXPECT_EQ(model.files.head()->file_name, "base.raw");
  EXPECT_EQ(model.files.head()->path, "/jobs/base.raw");
  EXPECT_EQ(model.points.head()->type, 0);
  EXPECT_EQ(model.points.head()->z, 5249000.375);
  EXPECT_EQ(model.FindAntenna(1)->id, 0x80000001u);
  EXPECT_EQ(model.FindReceiver(1)->name, "R1");
  const TOccupItem* first = model.FindOccup(1);
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(first->l1_up, 1.5);
  EXPECT_EQ(first->name, "OCCUP:1");
  EXPECT_TRUE(first->begin == (TimeMs{0, 0}));
  EXPECT_TRUE(first->end == kOpenEnd);
  EXPECT_EQ(first->file, model.FindFile(0x04000001));
  EXPECT_EQ(model.FindFile(1)->occupations.Count(), 1u);
  const TVectorItem* vector = model.FindVector(1);
  ASSERT_NE(vector, nullptr);
  EXPECT_EQ(vector->id, 0x08000001u);
  EXPECT_EQ(vector->occupations.Count(), 2u);
  EXPECT_EQ(model.FindOccup(3), nullptr);
  EXPECT_EQ(model.FindPoint(3), nullptr);
}

TEST_F(JobParserTest, PointsWithoutSectionsAreStillMade) {
  ASSERT_TRUE(
      Parse("[JOB]\nNumPoints=3\nNumFiles=2\n[POINT:1]\nType=1\nPosRms=0.5\n"
            "[FILE:1]\nName=\n[FILE:2]\nName=b.raw\nTemp=1\n"));
  ASSERT_EQ(model.points.Count(), 3u);
  EXPECT_EQ(model.FindPoint(1)->type, 2);
  EXPECT_EQ(model.FindPoint(1)->name, "POINT:1");
  EXPECT_EQ(model.FindPoint(3)->name, "POINT:3");
  EXPECT_EQ(model.FindPoint(3)->type, -1);
  ASSERT_EQ(model.files.Count(), 1u);  // an empty name makes no file
  EXPECT_TRUE(model.FindFile(2)->temporary);
  EXPECT_FALSE(model.FindFile(2)->smooth);
}

constexpr const char* kReoccupiedJob =
    "NumPoints=3\nNumOccups=3\nNumFiles=1\n[FILE:1]\nName=a.raw\n[POINT:2]\nName=P2\n"
    "PosX=10\nType=0\n[OCCUP:1]\nPoint=2\nFile=1\n[OCCUP:2]\nPoint=2\nFile=1\n[OCCUP:3]\nPoint=1\n";

TEST_F(JobParserTest, ReoccupiedPointsGetCopiesUnlessReoccupationsAreOn) {
  ASSERT_TRUE(Parse(std::string("[JOB]\n") + kReoccupiedJob));
  ASSERT_EQ(model.points.Count(), 4u);
  const TPointItem* copy = model.FindOccup(2)->point;
  EXPECT_EQ(copy->id, 0x01000004u);
  EXPECT_EQ(copy->base_id, 0x01000004u);
  EXPECT_EQ(copy->name, "P2");
  EXPECT_EQ(copy->x, 10.0);
  EXPECT_EQ(copy->type, 0);
  EXPECT_EQ(copy->occupations.Count(), 1u);
  EXPECT_EQ(model.FindPoint(2)->occupations.Count(), 1u);
  EXPECT_EQ(model.FindOccup(3)->point, model.FindPoint(1));
  EXPECT_EQ(model.FindFile(1)->occupations.Count(), 2u);

  JobModel shared;
  ASSERT_TRUE(
      ParseInto(std::string("[JOB]\nEnableReoccupations=1\n") + kReoccupiedJob, binder, shared));
  EXPECT_EQ(shared.points.Count(), 3u);
  EXPECT_EQ(shared.FindOccup(2)->point, shared.FindPoint(2));
  EXPECT_EQ(shared.FindPoint(2)->occupations.Count(), 2u);
}

TEST_F(JobParserTest, OccupationsAreClampedToTheJobWindow) {
  testing::TraceCapture trace;
  ASSERT_TRUE(
      Parse("[JOB]\nStart=10:0\nEnd=20:0\nNumOccups=5\n"
            "[OCCUP:1]\nStart=5:0\nEnd=12:500\nHumidity=55\n[OCCUP:2]\nStart=21:0\n"
            "[OCCUP:3]\nEnd=9:0\n[OCCUP:4]\nStart=20:0\nFile=7\nPoint=9\n"));
  EXPECT_EQ(model.window.start.seconds, 864000u);
  const TOccupItem* first = model.FindOccup(1);
  ASSERT_NE(first, nullptr);
  EXPECT_TRUE(first->begin == (TimeMs{864000, 0}));
  EXPECT_TRUE(first->end == (TimeMs{1036800, 500}));
  EXPECT_EQ(first->humidity, 55.0f);
  EXPECT_EQ(model.FindOccup(2), nullptr);
  EXPECT_EQ(model.FindOccup(3), nullptr);
  const TOccupItem* edge = model.FindOccup(4);  // starts where the window ends: kept
  ASSERT_NE(edge, nullptr);
  EXPECT_EQ(edge->file, nullptr);
  EXPECT_EQ(edge->point, nullptr);
  EXPECT_EQ(edge->humidity, -1.0f);
  EXPECT_EQ(trace.Text(), "ResultPath=\nNot found section: [OCCUP:5]\n");
}

constexpr const char* kLinkJob =
    "[JOB]\nType=1\nNumPoints=3\nNumFiles=2\nNumOccups=3\nNumVectors=5\nNumFans=5\n"
    "[FILE:1]\nName=a.raw\n[FILE:2]\nName=b.raw\n"
    "[OCCUP:1]\nPoint=1\nFile=1\n[OCCUP:2]\nPoint=2\nFile=2\n[OCCUP:3]\nFile=2\n"
    "[VECTOR:1]\nPoints=1,4\n[VECTOR:2]\nPoints=1,2\nOccup=2,9,3\nStartPoint=5\n"
    "[VECTOR:3]\nPoints=3\n[VECTOR:5]\nPoints=x\n"
    "[FAN:1]\nPoint=4\nRover=1\n[FAN:2]\nPoint=1\nRover=3\n[FAN:3]\nPoint=1\nRover=2\n"
    "GGAPath=fan.gga\n[FAN:4]\nPoint=3\nRover=2\nOccup=2,3,1\n";

TEST_F(JobParserTest, VectorAndFanIndexesAreCheckedAndTraced) {
  testing::TraceCapture trace;
  ASSERT_TRUE(Parse(kLinkJob));
  EXPECT_EQ(trace.Text(),
            "ResultPath=\n"
            "Invalid point index: 4 in section: [VECTOR:1]\n"
            "Invalid occup index: 9 in section: [VECTOR:2]\n"
            "Invalid occup index: 3 in section: [VECTOR:2]\n"
            "Not found section: [VECTOR:4]\n"
            "Invalid point index: 0 in section: [VECTOR:5]\n"
            "Invalid point index: 4 in section: [FAN:1]\n"
            "Invalid rover index: 3 in section: [FAN:2]\n"
            "Invalid occup index: 1 in section: [FAN:4]\n"
            "Not found section: [FAN:5]\n");
  ASSERT_EQ(model.vectors.Count(), 2u);
  const TVectorItem* v2 = model.FindVector(2);
  ASSERT_EQ(v2->occupations.Count(), 1u);
  EXPECT_EQ(v2->occupations.head()->occupation, model.FindOccup(2));
  const TVectorItem* v3 = model.FindVector(3);  // "3" alone: both ends are point 3
  EXPECT_EQ(v3->first_point, model.FindPoint(3));
  EXPECT_EQ(v3->second_point, model.FindPoint(3));
  EXPECT_TRUE(v3->occupations.empty());

  const TFanItem* f3 = model.FindFan(3);  // empty Occup: on the point or in the rover file
  ASSERT_NE(f3, nullptr);
  EXPECT_EQ(f3->occupations.Count(), 3u);
  EXPECT_EQ(f3->nmea_path, "/jobs/fan.gga");
  const TFanItem* f4 = model.FindFan(4);  // occupation 2 moves the fan to its point
  ASSERT_NE(f4, nullptr);
  EXPECT_EQ(f4->base_point, model.FindPoint(2));
  EXPECT_EQ(f4->occupations.Count(), 2u);
}

TEST_F(JobParserTest, VectorsAndFansGetTheirOwnParameterBlocks) {
  ASSERT_TRUE(Parse(std::string(kLinkJob) + "[JOB2]\n"));
  // [JOB] first, then VECTOR:2 and VECTOR:3, then fans 3 and 4, all on the job's engine.
  ASSERT_EQ(binder.fills.size(), 5u);
  EXPECT_EQ(binder.fills[0].section, "JOB");
  EXPECT_EQ(binder.fills[1].section, "VECTOR:2");
  EXPECT_EQ(binder.fills[1].values["StartPoint"], "16777221");
  EXPECT_EQ(binder.fills[3].section, "FAN:3");
  const TVectorItem* v2 = model.FindVector(2);
  ASSERT_NE(v2->property, nullptr);
  EXPECT_NE(v2->property.get(), model.engine_params.get());
  EXPECT_EQ(v2->property->data()[5], 2);         // filled from its own section
  EXPECT_EQ(model.engine_params->data()[5], 1);  // the job's block is untouched
  EXPECT_EQ(v2->property->allocated(), 16);
}

TEST_F(JobParserTest, StartPointReachesTheEngineAsAPointIdentifier) {
  ASSERT_TRUE(Parse("[JOB]\nType=1\nStartPoint=5\nElevation=15 ; degrees\n"));
  ASSERT_EQ(binder.fills.size(), 1u);
  EXPECT_EQ(binder.fills[0].values["StartPoint"], "16777221");
  EXPECT_EQ(binder.fills[0].values["Elevation"], "15");
  FakeBinder zero;
  JobModel m;
  ASSERT_TRUE(ParseInto("[JOB]\nType=1\nStartPoint=0\n", zero, m));
  EXPECT_EQ(zero.fills[0].values["StartPoint"], "0");
}

TEST_F(JobParserTest, EngineWithoutBlockGetsNoParameters) {
  binder.block_size = 0;
  ASSERT_TRUE(Parse("[JOB]\nType=1\nNumPoints=2\nNumVectors=1\n[VECTOR:1]\nPoints=1,2\n"));
  EXPECT_TRUE(binder.fills.empty());
  EXPECT_EQ(model.engine_params, nullptr);
  EXPECT_EQ(model.vectors.head()->property, nullptr);
}

TEST_F(JobParserTest, MultiSiteKinematicJobLoadsAStaticEngine) {
  const std::string job =
      "[JOB]\nType=2\nMultisite=1\nNumPoints=2\nNumVectors=1\nNumFans=1\n"
      "NumFiles=1\n[FILE:1]\nName=a.raw\n[VECTOR:1]\nPoints=1,2\n"
      "[FAN:1]\nPoint=1\nRover=1\n";
  ASSERT_TRUE(Parse(job));
  ASSERT_EQ(binder.loads.size(), 2u);
  EXPECT_EQ(binder.loads[1].first, EngineRole::kStatic);
  EXPECT_EQ(binder.loads[1].second, "/opt/vox/lib/kra_mstatic.eng");
  ASSERT_NE(model.static_params, nullptr);
  // Without [STATIC] the static engine keeps its defaults; the vector uses its block, the
  // fan the job engine's.
  ASSERT_EQ(binder.fills.size(), 3u);
  EXPECT_EQ(binder.fills[1].role, EngineRole::kStatic);
  EXPECT_EQ(binder.fills[1].section, "VECTOR:1");
  EXPECT_EQ(model.FindVector(1)->property->data()[4], 0x5);
  EXPECT_EQ(binder.fills[2].role, EngineRole::kProcessing);
  EXPECT_EQ(model.FindFan(1)->property->data()[4], 0x1);

  testing::TraceCapture trace;
  FakeBinder with_static;
  JobModel m;
  EXPECT_FALSE(ParseInto(job + "[STATIC]\nElevation=10\n", with_static, m));
  EXPECT_EQ(trace.Text(), "ResultPath=\nEngine '/opt/vox/lib/' not found\n");
}

TEST_F(JobParserTest, StaticSectionNamesTheStaticEngineAndItsParameters) {
  ASSERT_TRUE(
      Parse("[JOB]\nType=3\nMultisite=1\nOmitSV=G3\n[STATIC]\nEnginePath=st.eng\n"
            "Elevation=12\n"));
  EXPECT_EQ(binder.loads[1].second, "/opt/vox/lib/st.eng");
  ASSERT_EQ(binder.fills.size(), 2u);
  EXPECT_EQ(binder.fills[1].section, "STATIC");
  EXPECT_EQ(binder.fills[1].values["Elevation"], "12");
  EXPECT_EQ(model.omit_count, 1u);  // [JOB] is read again after [STATIC]
}

TEST_F(JobParserTest, AntennaPatternsNeedNineteenValues) {
  std::string values18, values20;
  for (int i = 0; i < 18; ++i)
    values18 += std::to_string(i) + ".5,";
  values18.pop_back();
  values20 = values18 + ",18.5,99";
  testing::TraceCapture trace;
  ASSERT_TRUE(
      Parse("[JOB]\nNumAntennas=2\n[ANTENNA:1]\nOffsetL2_U=0.25\nDirPat_GPS_L1=" + values18 +
            "\nDirPat_GPS_L2=" + values20 + "\nDirPat_BDS_B3=" + values20 + "\n"));
  const TAntennItem* a = model.FindAntenna(1);
  EXPECT_EQ(a->pattern_mask, (1u << 1) | (1u << 9));
  EXPECT_EQ(a->patterns[1][18], 18.5f);
  EXPECT_EQ(a->patterns[0][0], 0.0f);
  EXPECT_EQ(a->l2_up, 0.25);
  EXPECT_EQ(a->name, "ANTENNA:1");
  EXPECT_EQ(model.FindAntenna(2)->name, "ANTENNA:2");
  EXPECT_EQ(trace.Text(),
            "ResultPath=\nPCV correction is accepted: DirPat_GPS_L2\n"
            "PCV correction is accepted: DirPat_BDS_B3\n");
}

TEST_F(JobParserTest, OmitListTakesValidSatellitesOnly) {
  testing::TraceCapture trace;
  ASSERT_TRUE(Parse("[JOB]\nOmitSV=G5, R7,J2,X1,S19,  E 30\n"));
  ASSERT_EQ(model.omit_count, 4u);
  EXPECT_EQ(model.omit_list[0], 0x0005);
  EXPECT_EQ(model.omit_list[1], 0x0107);
  EXPECT_EQ(model.omit_list[2], 34);
  EXPECT_EQ(model.omit_list[3], 0x031E);
  EXPECT_EQ(trace.Text(),
            "ResultPath=\nInvalid sv index: 1 in section: [JOB]\n"
            "Invalid sv index: 19 in section: [JOB]\n");
}

TEST_F(JobParserTest, OmitListHoldsAtMost149Satellites) {
  std::string list = "G1";
  for (int i = 1; i < 150; ++i)
    list += ",G1";
  ASSERT_TRUE(Parse("[JOB]\nOmitSV=" + list + "\n"));
  EXPECT_EQ(model.omit_count, 149u);
}

TEST_F(JobParserTest, LeapSectionOfTheJobIsReadLast) {
  ASSERT_TRUE(Parse("[JOB]\n[LEAP_SEC]\nNum=1\n0=1980.0,2100.0\n"));
  ASSERT_EQ(LeapTableRows().size(), 1u);
  EXPECT_EQ(LeapTableRows()[0].end, 0xFFFFFFFFu);
}

}  // namespace
}  // namespace vox
