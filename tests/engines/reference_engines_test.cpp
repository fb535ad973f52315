// The reference engines on simulated surveys with fixed seeds: the raw filter, the static and
// the kinematic engine are run as the pipeline runs them (parsed job, scanned files, engine
// floating-point mode, the library's callbacks) and their results are read back from the
// result file and compared with the simulator's truth. The engines bind to this executable's
// copy of the library, which exports its symbols.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "engine/engine.h"
#include "platform/platform.h"
#include "result_reader.h"
#include "run/data_preparation.h"
#include "run/engine_threads.h"
#include "run/job_parse.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"
#include "survey.h"
#include "vox/vox_engine.h"

namespace vox {
namespace {

using voxeng::Vec3;
using voxeng::operator-;
using voxeng::operator+;

struct Results {
  std::vector<tools::VectorRec> vectors;
  std::vector<tools::FanRec> fans;
  std::vector<tools::RayRec> rays;
  std::vector<std::string> messages;
  size_t plot_epochs = 0;
  bool complete = false;  // read to its end record without a fault

  bool HasMessage(const std::string& part) const {
    return std::any_of(messages.begin(), messages.end(),
                       [&](const std::string& m) { return m.find(part) != std::string::npos; });
  }
};

Results Read(const std::string& path) {
  Results r;
  const tools::ReadResult file = tools::ReadResultFile(path);
  r.complete = !file.fault && !file.records.empty() &&
               std::holds_alternative<tools::EndRec>(file.records.back().body);
  for (const auto& rec : file.records) {
    if (const auto* v = std::get_if<tools::VectorRec>(&rec.body)) r.vectors.push_back(*v);
    if (const auto* f = std::get_if<tools::FanRec>(&rec.body)) r.fans.push_back(*f);
    if (const auto* ray = std::get_if<tools::RayRec>(&rec.body)) r.rays.push_back(*ray);
    if (const auto* m = std::get_if<tools::MessageRec>(&rec.body)) r.messages.push_back(m->text);
    if (std::holds_alternative<tools::PlotEpochRec>(rec.body)) ++r.plot_epochs;
  }
  return r;
}

double Length(const double (&v)[3]) {
  return std::sqrt(v[0] * v[0] + v[1] * v[1] + v[2] * v[2]);
}

// Removes the GPS ephemeris records (tags 13 and 45) from a little-endian raw file.
void StripEphemerides(const std::string& path) {
  const std::string bytes = test::ReadFile(path);
  std::string out;
  size_t at = 0;
  while (at + 3 <= bytes.size()) {
    const uint8_t tag = static_cast<uint8_t>(bytes[at]);
    const size_t length = static_cast<uint8_t>(bytes[at + 1]) |
                          (static_cast<size_t>(static_cast<uint8_t>(bytes[at + 2])) << 8);
    if (length < 3 || at + length > bytes.size()) break;
    if (tag != 13 && tag != 45) out.append(bytes, at, length);
    at += length;
    if (tag == 0) break;
  }
  out.append(bytes, at, std::string::npos);
  test::WriteFile(path, out);
}

class ReferenceEngines : public ::testing::Test {
 protected:
  void TearDown() override {
    TheRun().current_task.store(nullptr);
    TheRun().break_flag.store(0);
  }

  void Simulate(double duration, double interval, int job_type, uint64_t seed = 7) {
    voxsim::SurveyOptions o;
    o.start = voxsim::GpsSecondsOf(2024, 3, 15, 9, 0, 0);
    o.duration = duration;
    o.interval = interval;
    o.seed = seed;
    o.job_type = job_type;
    o.folder = folder_;
    survey_ = voxsim::MakeSurvey(o);
    ASSERT_EQ(voxsim::WriteSurvey(survey_), "");
    job_ = test::ReadFile(folder_ + "/survey.job");
  }

  // Puts the line "key=value" at the start of a section, e.g. After("[OCCUP:1]", "GGAPath=x").
  void After(const std::string& header, const std::string& line) {
    const size_t at = job_.find(header + "\n");
    ASSERT_NE(at, std::string::npos) << header;
    job_.insert(at + header.size() + 1, line + "\n");
  }
  void Replace(const std::string& from, const std::string& to) {
    const size_t at = job_.find(from);
    ASSERT_NE(at, std::string::npos) << from;
    job_.replace(at, from.size(), to);
  }

  // Runs the raw filter over the occupations, then (unless null) the engine's group call, on
  // this thread in the engines' floating-point mode; returns what the result file holds.
  Results Run(const char* engine_path, uint32_t cpus, bool break_at_start = false) {
    After("[JOB]", std::string("EnginePath=") + (engine_path ? engine_path : KRA_STATIC));
    const std::string job_path = test::WriteFile(folder_ + "/survey.job", job_);
    if (!ParseJobIntoTask(task_, job_, job_path, cpus)) {
      for (const auto& log : temp_.EngineLogTexts())
        ADD_FAILURE() << log;
      ADD_FAILURE() << "job not parsed";
      return {};
    }
    TheRun().current_task.store(&task_);
    task_.result_file.Open();
    PrepareData(task_);
    if (break_at_start) TheRun().break_flag.store(1);
    platform::SetEngineFloatingPointMode();
    auto raw_filter = TEngine::Load(KRA_RAWFILTER);
    EXPECT_TRUE(raw_filter->loaded());
    task_.current_engine.store(raw_filter.get());
    for (uint32_t n = 1; n <= 3; ++n) {
      vox_ThreadContext context = MakeThreadContext(task_, 0, 0x02000000u + n);
      raw_filter->ProcessOccupation(&context);
    }
    task_.current_engine.store(nullptr);
    if (engine_path != nullptr) {
      TEngine* engine = task_.engines->processing();
      EXPECT_TRUE(engine && engine->loaded());
      task_.current_engine.store(engine);
      vox_ThreadContext context = MakeThreadContext(task_, task_.engine_flags(), 1);
      group_result_ = cpus > 1 ? engine->ProcessGroupMT(&context) : engine->ProcessGroup(&context);
      task_.current_engine.store(nullptr);
    }
    platform::RestoreDefaultFloatingPointMode();
    task_.result_file.Close();
    return Read(folder_ + "/result.bin");
  }

  std::optional<vox_NavCoordData> Nav(uint32_t occupation) {
    vox_NavCoordData nav;
    if (!vox_GetNavCoord(occupation, &nav)) return std::nullopt;
    return nav;
  }

  test::ScratchDir scratch_;
  test::TempDirEnv temp_{scratch_, false};
  std::string folder_ = scratch_.File("survey");
  voxsim::Survey survey_;
  std::string job_;
  TTask task_;
  uint32_t group_result_ = 0;
};

TEST_F(ReferenceEngines, RawFilterFindsEveryStationWithinMetresAndWritesItsOutputs) {
  Simulate(900, 5, 1);
  After("[OCCUP:1]", "GGAPath=base.gga");
  const Results r = Run(nullptr, 1);
  // Navigation coordinates are the marks: the antenna heights are taken off.
  for (const auto& [occupation, mark] :
       {std::pair{1u, survey_.base.mark}, std::pair{2u, survey_.rover.mark}}) {
    const auto nav = Nav(occupation);
    ASSERT_TRUE(nav) << occupation;
    EXPECT_LT(voxeng::Norm(Vec3{nav->x, nav->y, nav->z} - mark), 3.0) << occupation;
    for (float s : {nav->sx, nav->sy, nav->sz}) {
      EXPECT_GT(s, 0.0f);
      EXPECT_LT(s, 3.0f);
    }
    EXPECT_LE(std::fabs(nav->rxy), 1.0f);
  }
  // The moving receiver gets a mean too, with a spread that says it moved.
  const auto track = Nav(3);
  ASSERT_TRUE(track);
  EXPECT_GT(track->sx + track->sy + track->sz, 10.0f);

  // One fix per epoch in the occupation that asked for NMEA, and none for the others.
  const auto gga = test::FileLines(folder_ + "/base.gga");
  ASSERT_EQ(gga.size(), survey_.EpochCount() + 1);
  EXPECT_EQ(gga[0].rfind("$GPZDA", 0), 0u);
  EXPECT_EQ(gga[1].rfind("$GPGGA", 0), 0u);
  EXPECT_NE(gga[1].find(",1,"), std::string::npos);  // quality 1: a navigation fix
  EXPECT_FALSE(std::filesystem::exists(folder_ + "/rover.gga"));
  // Residual curves for every occupation's epochs, and a summary per occupation.
  EXPECT_EQ(r.plot_epochs, 3 * survey_.EpochCount());
  EXPECT_TRUE(r.HasMessage("occupation 1 (BASE): 181 of 181 epochs solved"));
  EXPECT_TRUE(r.complete);
}

TEST_F(ReferenceEngines, StaticBaselineIsFixedToCentimetres) {
  Simulate(1800, 10, 1);
  const Results r = Run(KRA_STATIC, 1);
  EXPECT_EQ(group_result_, 1u);
  ASSERT_EQ(r.vectors.size(), 1u);
  const tools::VectorRec& v = r.vectors[0];
  EXPECT_EQ(v.number, 1u);
  EXPECT_EQ(v.flags & 0x80000000u, 0x80000000u);  // solved
  EXPECT_EQ(v.flags & 3u, 1u) << "not fixed: ratio " << v.value_100;
  const Vec3 truth = survey_.rover.mark - survey_.base.mark;
  const Vec3 got{v.baseline[0], v.baseline[1], v.baseline[2]};
  EXPECT_LT(voxeng::Norm(got - truth), 0.02);
  // The base is the known mark; the rms is that of a fixed baseline, stored with the record.
  EXPECT_LT(voxeng::Norm(Vec3{v.base[0], v.base[1], v.base[2]} - survey_.base.mark), 1e-3);
  EXPECT_GT(v.value_96, 0.0f);
  EXPECT_LT(v.value_96, 0.02f);
  EXPECT_GE(v.value_100, 3.0f);  // ratio of the integer fix
  EXPECT_TRUE(r.HasMessage("vector 1 (BASE - ROVER): fixed solution"));
  // The sites' wet delays differ in the simulation; the fixed solution estimated it.
  EXPECT_TRUE(r.HasMessage("relative zenith delay"));
}

TEST_F(ReferenceEngines, StaticVectorsOnThreadsAgreeWhicheverEndIsKnown) {
  Simulate(1800, 10, 1);
  Replace("NumVectors=1", "NumVectors=3");
  // Vector 3 takes every third epoch of its own; its unreadable mask keeps the default.
  job_ += "[VECTOR:2]\nPoints=2,1\n[VECTOR:3]\nPoints=1,2\nInterval=30\nElevationMask=high\n";
  const Results r = Run(KRA_STATIC, 2);
  EXPECT_EQ(group_result_, 1u);
  ASSERT_EQ(r.vectors.size(), 3u);
  const Vec3 truth = survey_.rover.mark - survey_.base.mark;
  for (const auto& v : r.vectors) {
    SCOPED_TRACE(v.number);
    ASSERT_EQ(v.flags & 0x80000000u, 0x80000000u);
    // Vector 2 runs from ROVER to BASE: solved from the known end, marked reversed.
    EXPECT_EQ((v.flags & 0x800u) != 0, v.number == 2);
    const Vec3 got{v.baseline[0], v.baseline[1], v.baseline[2]};
    EXPECT_LT(voxeng::Norm(got - truth), 0.02);
    EXPECT_EQ(v.values_80[1], v.number == 3 ? 61u : 181u);  // common epochs used
  }
  // Every worker thread's block reached the job's file.
  EXPECT_TRUE(task_.thread_writers.empty());
  EXPECT_TRUE(r.complete);
}

TEST_F(ReferenceEngines, KinematicRaysFollowTheTrack) {
  Simulate(900, 5, 2);
  const Results r = Run(KRA_KINEMATIC, 1);
  EXPECT_EQ(group_result_, 1u);
  ASSERT_EQ(r.fans.size(), 1u);
  const double* base = r.fans[0].position;
  EXPECT_LT(voxeng::Norm(Vec3{base[0], base[1], base[2]} - survey_.base.mark), 1e-3);
  ASSERT_EQ(r.rays.size(), survey_.EpochCount());
  double worst = 0, sum2 = 0;
  size_t fixed = 0;
  for (const auto& ray : r.rays) {
    const Vec3 position =
        Vec3{base[0], base[1], base[2]} + Vec3{ray.offset[0], ray.offset[1], ray.offset[2]};
    const double error = voxeng::Norm(position - survey_.KinematicAt(ray.time.gps_seconds()));
    worst = std::max(worst, error);
    sum2 += error * error;
    fixed += (ray.flags & 3u) == 1u;
    EXPECT_GT(ray.hdop, 0.0f);
    EXPECT_GE(ray.satellites, 4u);
  }
  EXPECT_LT(worst, 1.0);
  EXPECT_EQ(fixed, r.rays.size()) << "rms " << std::sqrt(sum2 / r.rays.size());
  EXPECT_LT(std::sqrt(sum2 / r.rays.size()), 0.05);
  // One GGA line per ray, with the fixed quality.
  const auto gga = test::FileLines(folder_ + "/fan.gga");
  ASSERT_EQ(gga.size(), r.rays.size() + 1);
  EXPECT_NE(gga[1].find(",4,"), std::string::npos);
}

TEST_F(ReferenceEngines, EmptyAndDisjointOccupationsGetReasonsNotSolutions) {
  Simulate(600, 10, 1);
  // The rover's occupation lies after its data: no epochs. The track's occupation ends before
  // the base's begins, so a vector between them cannot be formed.
  Replace(
      "[OCCUP:2]\nName=ROVER\nFile=2\nPoint=2\nAntenna=1\nReceiver=2\nOffsetL1_U=1.650\n"
      "Start=16140:32400000\nEnd=16140:33000000",
      "[OCCUP:2]\nName=ROVER\nFile=2\nPoint=2\nAntenna=1\nReceiver=2\nOffsetL1_U=1.650\n"
      "Start=16141:32400000\nEnd=16141:33000000");
  Replace("NumPoints=2", "NumPoints=3");
  Replace("NumVectors=1", "NumVectors=2");
  Replace(
      "[OCCUP:3]\nName=TRACK\nFile=3\nAntenna=2\nReceiver=3\nStart=16140:32400000\n"
      "End=16140:33000000",
      "[OCCUP:3]\nName=TRACK\nFile=3\nPoint=3\nAntenna=2\nReceiver=3\n"
      "Start=16140:32400000\nEnd=16140:32600000");
  Replace(
      "[OCCUP:1]\nName=BASE\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\nOffsetL1_U=1.500\n"
      "Start=16140:32400000",
      "[OCCUP:1]\nName=BASE\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\nOffsetL1_U=1.500\n"
      "Start=16140:32700000");
  job_ += "[POINT:3]\nName=TRACKPT\n[VECTOR:2]\nPoints=1,3\n";
  const Results r = Run(KRA_STATIC, 1);
  EXPECT_EQ(group_result_, 1u);
  EXPECT_TRUE(r.HasMessage("occupation 2 (ROVER): no epochs; no navigation position"));
  EXPECT_FALSE(Nav(2));
  EXPECT_TRUE(
      r.HasMessage("vector 1 (BASE - ROVER): no solution: no occupation with data on "
                   "point ROVER"));
  EXPECT_TRUE(
      r.HasMessage("vector 2 (BASE - TRACKPT): no solution: the occupations of its "
                   "points do not overlap in time"));
  // Both vectors still get a record, unsolved.
  ASSERT_EQ(r.vectors.size(), 2u);
  for (const auto& v : r.vectors) {
    EXPECT_EQ(v.flags & 0x80000000u, 0u);
    EXPECT_EQ(Length(v.baseline), 0.0);
  }
  EXPECT_TRUE(r.complete);
}

TEST_F(ReferenceEngines, NoEphemerisMeansMessagesForEveryStep) {
  Simulate(300, 10, 2);
  for (const char* file : {"/base.raw", "/rover.raw", "/kinematic.raw"})
    StripEphemerides(folder_ + file);
  Results r = Run(KRA_KINEMATIC, 1);
  EXPECT_EQ(group_result_, 1u);
  EXPECT_TRUE(r.HasMessage("occupation 1 (BASE): no GPS broadcast ephemeris"));
  EXPECT_FALSE(Nav(1));
  EXPECT_TRUE(
      r.HasMessage("fan 1 (BASE - kinematic.raw): no solution: no GPS broadcast ephemeris"));
  EXPECT_TRUE(r.rays.empty());
  ASSERT_EQ(r.fans.size(), 1u);
  EXPECT_EQ(r.fans[0].flags, 0u);
  EXPECT_TRUE(r.complete);
}

TEST_F(ReferenceEngines, AStopRequestEndsEveryEngineEarlyAndCleanly) {
  Simulate(600, 5, 1);
  const Results r = Run(KRA_STATIC, 2, /*break_at_start=*/true);
  // The first progress report asks the engine to stop: no position, no baseline, a reason,
  // and a result file that still ends properly.
  EXPECT_FALSE(Nav(1));
  EXPECT_TRUE(r.HasMessage("stopped on request"));
  for (const auto& v : r.vectors)
    EXPECT_EQ(v.flags & 0x80000000u, 0u);
  EXPECT_TRUE(task_.thread_writers.empty());
  EXPECT_TRUE(r.complete);
}

}  // namespace
}  // namespace vox
