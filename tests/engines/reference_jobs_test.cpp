// Whole jobs through the shared library with the reference engines found under their default
// names beside it: the job files name no engine at all. They need the pipeline to schedule
// the raw filter and the engine; until it does, the tests say so and skip.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <sstream>
#include <string>
#include <thread>
#include <variant>

#include "demo_report.h"
#include "result_reader.h"
#include "support/scratch.h"
#include "survey.h"
#include "vox/vox_host.h"

namespace vox::test {
namespace {

using voxeng::Vec3;
using voxeng::operator-;
using voxeng::operator+;

// The process keeps the first callback it is given, so one callback serves every test.
struct HostState {
  std::atomic<uint32_t> exit_code{VOX_EXIT_STILL_ACTIVE};
  std::atomic<vox_ControlHandle> handle{nullptr};
  std::atomic<uint32_t> break_at{0};  // progress at which to send a break; 0: never
  std::atomic<bool> break_sent{false};
};
HostState g_host;

void VOX_CALL OnHostEvent(void*, uint32_t code, uint32_t value) {
  if (code == VOX_CALLBACK_EXIT_CODE) g_host.exit_code.store(value);
  if (code == VOX_CALLBACK_PROGRESS && g_host.break_at.load() != 0 &&
      value >= g_host.break_at.load() && !g_host.break_sent.exchange(true)) {
    if (vox_ControlHandle h = g_host.handle.load()) SendEngineControl(h, VOX_CMD_BREAK, 0);
  }
}

struct Outcome {
  uint32_t exit_code = VOX_EXIT_STILL_ACTIVE;
  tools::ReadResult file;
  std::string logs;
  template <class T>
  std::vector<T> All() const {
    std::vector<T> out;
    for (const auto& r : file.records)
      if (const T* x = std::get_if<T>(&r.body)) out.push_back(*x);
    return out;
  }
  bool Complete() const {
    return !file.fault && !file.records.empty() &&
           std::holds_alternative<tools::EndRec>(file.records.back().body);
  }
  // The pipeline ran the raw filter found by its default name (it logs the load).
  bool EnginesScheduled() const { return logs.find("kra_rawfilter.dll") != std::string::npos; }
};

class ReferenceJobs : public ::testing::Test {
 protected:
  void Simulate(double duration, double interval, int job_type) {
    voxsim::SurveyOptions o;
    o.start = voxsim::GpsSecondsOf(2024, 3, 15, 9, 0, 0);
    o.duration = duration;
    o.interval = interval;
    o.seed = 11;
    o.job_type = job_type;
    o.folder = folder_;
    survey_ = voxsim::MakeSurvey(o);
    ASSERT_EQ(voxsim::WriteSurvey(survey_), "");
  }

  // Runs the job, breaking at the given progress (0: never), and waits for its end.
  Outcome RunJob(uint32_t break_at = 0) {
    g_host.exit_code.store(VOX_EXIT_STILL_ACTIVE);
    g_host.break_sent.store(false);
    g_host.break_at.store(break_at);
    g_host.handle.store(nullptr);
    const std::string job = folder_ + "/survey.job";
    vox_ControlHandle h = RunProcess(job.c_str());
    Outcome out;
    if (h == nullptr) return out;
    g_host.handle.store(h);
    vox_HostCallbackPair pair{OnHostEvent, nullptr};
    SendEngineControl(h, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&pair));
    for (int i = 0; i < 1200 && g_host.exit_code.load() == VOX_EXIT_STILL_ACTIVE; ++i)
      std::this_thread::sleep_for(std::chrono::milliseconds(50));
    g_host.handle.store(nullptr);
    out.exit_code = g_host.exit_code.load();
    out.file = tools::ReadResultFile(folder_ + "/result.bin");
    for (const auto& log : temp_.EngineLogTexts())
      out.logs += log;
    return out;
  }

  ScratchDir scratch_;
  TempDirEnv temp_{scratch_, true};
  std::string folder_ = scratch_.File("survey");
  voxsim::Survey survey_;
};

#define SKIP_UNTIL_SCHEDULED(outcome)                                                   \
  if (!(outcome).EnginesScheduled())                                                    \
  GTEST_SKIP() << "the pipeline does not schedule the raw filter and engines yet; the " \
                  "job ran without them (exit code "                                    \
               << (outcome).exit_code << ")"

TEST_F(ReferenceJobs, StaticJobFindsTheEnginesByDefaultName) {
  Simulate(1800, 10, 1);
  const Outcome out = RunJob();
  SKIP_UNTIL_SCHEDULED(out);
  EXPECT_EQ(out.exit_code, 0u) << out.logs;
  EXPECT_TRUE(out.Complete());
  // Every occupation's record carries the raw filter's navigation coordinates.
  const auto occupations = out.All<tools::OccupationRec>();
  ASSERT_EQ(occupations.size(), 3u);
  const Vec3 base_nav{occupations[0].nav[0], occupations[0].nav[1], occupations[0].nav[2]};
  EXPECT_LT(voxeng::Norm(base_nav - survey_.base.mark), 3.0);
  const auto vectors = out.All<tools::VectorRec>();
  ASSERT_EQ(vectors.size(), 1u);
  const Vec3 got{vectors[0].baseline[0], vectors[0].baseline[1], vectors[0].baseline[2]};
  EXPECT_LT(voxeng::Norm(got - (survey_.rover.mark - survey_.base.mark)), 0.02);

  // The demo's report names the solution and measures it against the truth file.
  voxdemo::Truth truth;
  ASSERT_TRUE(voxdemo::ReadTruth(folder_ + "/truth.txt", truth));
  std::ostringstream report;
  EXPECT_TRUE(voxdemo::Report(out.file, truth, {folder_ + "/none.gga"}, report));
  EXPECT_NE(report.str().find("vector 1: fixed"), std::string::npos) << report.str();
  EXPECT_NE(report.str().find("truth BASE -> ROVER: difference 0.0"), std::string::npos);
  EXPECT_NE(report.str().find("occupation 1 (BASE): navigation position"), std::string::npos);
  EXPECT_NE(report.str().find("none.gga: not written"), std::string::npos);
}

TEST_F(ReferenceJobs, KinematicJobWritesRaysAndTheirNmea) {
  Simulate(600, 5, 2);
  const Outcome out = RunJob();
  SKIP_UNTIL_SCHEDULED(out);
  EXPECT_EQ(out.exit_code, 0u) << out.logs;
  const auto fans = out.All<tools::FanRec>();
  ASSERT_EQ(fans.size(), 1u);
  const auto rays = out.All<tools::RayRec>();
  ASSERT_EQ(rays.size(), survey_.EpochCount());
  const Vec3 base{fans[0].position[0], fans[0].position[1], fans[0].position[2]};
  for (const auto& ray : rays) {
    const Vec3 p = base + Vec3{ray.offset[0], ray.offset[1], ray.offset[2]};
    EXPECT_LT(voxeng::Norm(p - survey_.KinematicAt(ray.time.gps_seconds())), 1.0);
  }
  EXPECT_EQ(ReadFile(folder_ + "/fan.gga").find("$GPZDA"), 0u);
}

TEST_F(ReferenceJobs, BreakInTheMiddleEndsWithCodeTenAndAWholeResultFile) {
  Simulate(1800, 5, 2);
  const Outcome out = RunJob(/*break_at=*/5);
  SKIP_UNTIL_SCHEDULED(out);
  EXPECT_TRUE(g_host.break_sent.load());
  EXPECT_EQ(out.exit_code, static_cast<uint32_t>(VOX_EXIT_BREAK)) << out.logs;
  EXPECT_TRUE(out.Complete()) << (out.file.fault ? out.file.fault->what : "");
  // voxdump reads it to its end record too (exit code 0: no fault).
  const std::string command =
      std::string(VOXDUMP) + " " + folder_ + "/result.bin > " + folder_ + "/dump.txt";
  EXPECT_EQ(std::system(command.c_str()), 0);
}

}  // namespace
}  // namespace vox::test
