// The engine steps on a parsed job, with the scheduling engine (tests/engines/
// schedule_engine.cpp) as raw filter and as group engine: the order and grouping of what
// reaches the result file, the worker limit, breaks, engines that throw or fault, and which
// group call a job gets.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "engine/engine.h"
#include "run/engine_steps.h"
#include "run/job_parse.h"
#include "run/raw_filter.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"

namespace vox {
namespace {

#define ENGINE_DIR VOX_TEST_ENGINE_DIR "/"

// One result record, reduced to what these tests compare: "msg <text>" or "occ <number>".
std::vector<std::string> Summary(const std::string& result_path) {
  std::vector<std::string> out;
  for (const test::ResultRecord& r : test::ReadResultRecords(result_path)) {
    if (r.kind == 29) out.push_back("msg " + test::MessageText(r));
    if (r.kind == 34) {
      const uint32_t id = r.payload[0] | r.payload[1] << 8 | r.payload[2] << 16;
      out.push_back("occ " + std::to_string(id));
    }
  }
  return out;
}

class EngineStepsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    setenv("VOX_TEST_RECORD", record_.c_str(), 1);
    for (const char* name : kSettings)
      unsetenv(name);
  }
  void TearDown() override {
    for (const char* name : kSettings)
      unsetenv(name);
    unsetenv("VOX_TEST_RECORD");
    TheRun().current_task.store(nullptr);
    TheRun().break_flag.store(0);
  }

  // A job of n occupations, each on a point of its own, run with the given keys.
  std::string Job(int occupations, const std::string& keys) {
    std::string text = test::JobText("Sched", result_,
                                     "RawfiltPath=" ENGINE_DIR
                                     "test_schedule.eng\n"
                                     "NumPoints=" +
                                         std::to_string(occupations) + "\nNumOccups=" +
                                         std::to_string(occupations) + "\n" + keys);
    for (int n = 1; n <= occupations; ++n) {
      const std::string k = std::to_string(n);
      text += "[POINT:" + k + "]\nName=P" + k + "\n[OCCUP:" + k + "]\nPoint=" + k + "\n";
    }
    return text;
  }

  // Parses the job, opens its result file and makes the task current.
  bool Prepare(const std::string& text) {
    if (!ParseJobIntoTask(task_, text, scratch_.File("sched.job"), 1)) return false;
    if (!task_.result_file.Open()) return false;
    TheRun().current_task.store(&task_);
    return true;
  }

  std::vector<std::string> Finish() {
    task_.result_file.Close();
    return Summary(result_);
  }

  std::vector<std::string> Calls() { return test::FileLines(record_); }

  // The calls whose line starts with prefix.
  std::vector<std::string> CallsOf(const std::string& prefix) {
    std::vector<std::string> out;
    for (const std::string& l : Calls())
      if (l.rfind(prefix, 0) == 0) out.push_back(l);
    return out;
  }

  static constexpr const char* kSettings[] = {"SCHED_SLOW_MS",      "SCHED_THROW_OCC",
                                              "SCHED_FAULT_OCC",    "SCHED_STACK_KB",
                                              "SCHED_GROUP_RESULT", "SCHED_GROUP_FAIL"};
  test::ScratchDir scratch_;
  test::TempDirEnv temp_{scratch_, false};
  std::string result_ = scratch_.File("sched.res");
  std::string record_ = scratch_.File("calls.txt");
  TTask task_;
};

// The records each occupation leaves: its two messages and its occupation record.
std::vector<std::string> OccupationBlock(int n) {
  const std::string k = std::to_string(n);
  return {"msg begin " + k, "msg end " + k, "occ " + k};
}

TEST_F(EngineStepsTest, OnTheJobThreadRecordsArriveInOccupationOrder) {
  ASSERT_TRUE(Prepare(Job(4, "NumCPUs=1\n")));
  EXPECT_TRUE(RunRawFilterStep(task_));
  std::vector<std::string> expected = {"msg RawFilter"};
  for (int n = 1; n <= 4; ++n)
    for (const std::string& r : OccupationBlock(n))
      expected.push_back(r);
  expected.push_back("msg RawFilter - OK");
  expected.push_back("msg ");
  EXPECT_EQ(Finish(), expected);
  // Per-occupation calls get flags 0 and the occupation's identifier.
  EXPECT_EQ(CallsOf("occ ").front(), "occ proc id=02000001 flags=00000000 running=1");
  EXPECT_EQ(task_.current_engine.load(), nullptr);
}

TEST_F(EngineStepsTest, FourWorkersTakeTenOccupationsAtMostFourAtATime) {
  setenv("SCHED_SLOW_MS", "40", 1);
  ASSERT_TRUE(Prepare(Job(10, "NumCPUs=4\n")));
  EXPECT_TRUE(RunRawFilterStep(task_));
  const std::vector<std::string> records = Finish();

  int most = 0;
  for (const std::string& l : CallsOf("occ ")) {
    EXPECT_NE(l.find("flags=00000040"), std::string::npos) << l;  // a thread writer's context
    most = std::max(most, std::atoi(l.substr(l.find("running=") + 8).c_str()));
  }
  EXPECT_EQ(CallsOf("occ ").size(), 10u);
  EXPECT_LE(most, 4);
  EXPECT_GE(most, 2);
  // Every worker's records come as one block, whatever order the workers finished in.
  for (int n = 1; n <= 10; ++n) {
    const std::vector<std::string> block = OccupationBlock(n);
    EXPECT_NE(std::search(records.begin(), records.end(), block.begin(), block.end()),
              records.end())
        << "occupation " << n;
  }
  EXPECT_EQ(records.front(), "msg RawFilter");
  EXPECT_EQ(records.size(), 1 + 30 + 2u);
  EXPECT_TRUE(task_.thread_writers.empty());
  EXPECT_TRUE(temp_.TempFiles("VOX").empty());  // every thread file merged and deleted
}

// The largest pool: 32 workers writing and merging their thread files at once (this is the
// case the thread sanitizer build exercises hardest).
TEST_F(EngineStepsTest, ThirtyTwoWorkersTakeSixtyFourOccupationsAndMergeEveryBlockWhole) {
  setenv("SCHED_SLOW_MS", "5", 1);
  ASSERT_TRUE(Prepare(Job(64, "NumCPUs=32\n")));
  EXPECT_TRUE(RunRawFilterStep(task_));
  const std::vector<std::string> records = Finish();

  int most = 0;
  for (const std::string& l : CallsOf("occ "))
    most = std::max(most, std::atoi(l.substr(l.find("running=") + 8).c_str()));
  EXPECT_EQ(CallsOf("occ ").size(), 64u);
  EXPECT_LE(most, 32);
  EXPECT_GE(most, 2);
  for (int n = 1; n <= 64; ++n) {
    const std::vector<std::string> block = OccupationBlock(n);
    EXPECT_NE(std::search(records.begin(), records.end(), block.begin(), block.end()),
              records.end())
        << "occupation " << n;
  }
  EXPECT_EQ(records.size(), 1 + 64 * 3 + 2u);
  EXPECT_TRUE(task_.thread_writers.empty());
  EXPECT_TRUE(temp_.TempFiles("VOX").empty());
}

TEST_F(EngineStepsTest, ABreakBeforeTheFirstOccupationProcessesNone) {
  for (const char* cpus : {"NumCPUs=1\n", "NumCPUs=4\n"}) {
    SCOPED_TRACE(cpus);
    TTask task;
    ASSERT_TRUE(ParseJobIntoTask(task, Job(3, cpus), scratch_.File("sched.job"), 1));
    ASSERT_TRUE(task.result_file.Open());
    TheRun().current_task.store(&task);
    TheRun().break_flag.store(1);
    EXPECT_TRUE(RunRawFilterStep(task));
    task.result_file.Close();
    EXPECT_EQ(Summary(result_),
              (std::vector<std::string>{"msg RawFilter", "msg RawFilter - OK", "msg "}));
    EXPECT_TRUE(CallsOf("occ ").empty());
    TheRun().break_flag.store(0);
  }
}

TEST_F(EngineStepsTest, ABreakDuringTheRunStopsDispatchAndReachesTheRawFilter) {
  setenv("SCHED_SLOW_MS", "30", 1);
  ASSERT_TRUE(Prepare(Job(10, "NumCPUs=2\n")));
  std::thread breaker([] {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    TheRun().break_flag.store(1);
  });
  EXPECT_TRUE(RunRawFilterStep(task_));
  breaker.join();
  Finish();
  EXPECT_LT(CallsOf("occ ").size(), 10u);
  EXPECT_FALSE(CallsOf("break proc").empty());  // a worker's progress callback ran the check
}

TEST_F(EngineStepsTest, AnOccupationWhoseCallThrowsOrFaultsLosesOnlyItsRecord) {
  for (const char* cpus : {"NumCPUs=1\n", "NumCPUs=4\n"}) {
    SCOPED_TRACE(cpus);
    setenv("SCHED_THROW_OCC", "3", 1);
    setenv("SCHED_FAULT_OCC", "6", 1);
    TTask task;
    ASSERT_TRUE(ParseJobIntoTask(task, Job(8, cpus), scratch_.File("sched.job"), 1));
    ASSERT_TRUE(task.result_file.Open());
    TheRun().current_task.store(&task);
    EXPECT_TRUE(RunRawFilterStep(task));
    EXPECT_TRUE(task.thread_writers.empty());  // the failed workers were collected too
    task.result_file.Close();
    const std::vector<std::string> records = Summary(result_);
    for (int n = 1; n <= 8; ++n) {
      const bool lost = n == 3 || n == 6;
      const bool has_record =
          std::count(records.begin(), records.end(), "occ " + std::to_string(n)) == 1;
      EXPECT_EQ(has_record, !lost) << "occupation " << n;
    }
    // What the failed calls wrote before failing is kept.
    EXPECT_EQ(std::count(records.begin(), records.end(), "msg begin 6"), 1);
    EXPECT_EQ(records.back(), "msg ");
  }
}

TEST_F(EngineStepsTest, WorkerStacksHoldTheGuardAnEngineFrameOf40KiBAndTheCallbacks) {
  setenv("SCHED_STACK_KB", "40", 1);
  ASSERT_TRUE(Prepare(Job(4, "NumCPUs=4\n")));
  EXPECT_TRUE(RunRawFilterStep(task_));
  const std::vector<std::string> records = Finish();
  EXPECT_EQ(std::count_if(records.begin(), records.end(),
                          [](const std::string& r) { return r.rfind("occ ", 0) == 0; }),
            4);
  // The library's own frames below the engine (thread start, guard, counted call) stay
  // small: at least 48 KiB of the 64 are left to the engine.
  for (const std::string& l : CallsOf("stack proc"))
    EXPECT_GE(std::atol(l.substr(l.find("free=") + 5).c_str()), 48 * 1024) << l;
}

// Starts every second worker it is asked for; the others "cannot be created".
std::unique_ptr<platform::Thread> StartEverySecond(platform::ThreadProc proc, void* argument,
                                                   size_t stack_bytes) {
  static int calls = 0;
  if (++calls % 2 == 0) return nullptr;
  return platform::StartThread(proc, argument, stack_bytes);
}

std::unique_ptr<platform::Thread> StartNone(platform::ThreadProc, void*, size_t) {
  return nullptr;
}

TEST_F(EngineStepsTest, AWorkerThatCannotBeStartedCostsItsOccupationAndDoesNotHangTheRun) {
  ASSERT_TRUE(Prepare(Job(6, "NumCPUs=2\n")));
  std::unique_ptr<TEngine> raw_filter;
  LoadEngineInto(raw_filter, ENGINE_DIR "test_schedule.eng");
  ASSERT_TRUE(raw_filter->loaded());
  EXPECT_TRUE(RunRawFilterMulti(task_, *raw_filter, StartEverySecond));
  EXPECT_TRUE(RunRawFilterMulti(task_, *raw_filter, StartNone));
  EXPECT_TRUE(task_.thread_writers.empty());
  EXPECT_TRUE(temp_.TempFiles("VOX").empty());
  const std::vector<std::string> records = Finish();
  EXPECT_EQ(std::count_if(records.begin(), records.end(),
                          [](const std::string& r) { return r.rfind("occ ", 0) == 0; }),
            3);
  EXPECT_EQ(CallsOf("occ ").size(), 3u);
}

// ---------------------------------------------------------------- the engine step

std::string EngineKeys(const std::string& type, const std::string& cpus, bool multi_site) {
  std::string keys =
      "Type=" + type + "\nNumCPUs=" + cpus + "\nEnginePath=" ENGINE_DIR "test_schedule.eng\n";
  if (multi_site) keys += "Multisite=1\n";
  return keys;
}

TEST_F(EngineStepsTest, OnlySingleSiteJobsWithSeveralThreadsGetTheThreadedGroupCall) {
  struct Case {
    const char* type;
    const char* cpus;
    bool multi_site;
    const char* call;
  };
  for (const Case& c : {Case{"1", "4", false, "groupMT proc id=1 flags=00000004"},
                        Case{"1", "1", false, "group proc id=1 flags=00000004"},
                        Case{"1", "32", true, "group proc id=1 flags=00000004"}}) {
    SCOPED_TRACE(std::string(c.cpus) + (c.multi_site ? " multi-site" : ""));
    std::remove(record_.c_str());
    TTask task;
    ASSERT_TRUE(ParseJobIntoTask(task, Job(1, EngineKeys(c.type, c.cpus, c.multi_site)),
                                 scratch_.File("sched.job"), 1));
    ASSERT_TRUE(task.result_file.Open());
    TheRun().current_task.store(&task);
    EXPECT_TRUE(RunEngineStep(task));
    EXPECT_EQ(CallsOf("group"), std::vector<std::string>{c.call});
    EXPECT_EQ(task.current_engine.load(), nullptr);
    task.result_file.Close();
  }
}

TEST_F(EngineStepsTest, MultiSiteKinematicJobsRunTheStaticEngineFirstAndStopOnItsFailure) {
  const std::string keys =
      EngineKeys("2", "4", true) + "[STATIC]\nEnginePath=" ENGINE_DIR "test_schedule_static.eng\n";
  for (const char* result : {"1", "0", "3"}) {
    SCOPED_TRACE(result);
    std::remove(record_.c_str());
    setenv("SCHED_GROUP_RESULT", result, 1);
    TTask task;
    ASSERT_TRUE(ParseJobIntoTask(task, Job(1, keys), scratch_.File("sched.job"), 1));
    ASSERT_TRUE(task.result_file.Open());
    TheRun().current_task.store(&task);
    const bool ok = std::string(result) == "1";
    EXPECT_EQ(RunEngineStep(task), ok);
    std::vector<std::string> expected = {"group static id=1 flags=00000004"};
    if (ok) expected.push_back("group proc id=1 flags=00000004");
    EXPECT_EQ(CallsOf("group"), expected);
    task.result_file.Close();
  }
}

TEST_F(EngineStepsTest, AGroupCallThatThrowsOrFaultsFailsTheStepAndNotTheProcess) {
  for (const char* fail : {"1", "2"}) {
    SCOPED_TRACE(fail);
    setenv("SCHED_GROUP_FAIL", fail, 1);
    TTask task;
    ASSERT_TRUE(
        ParseJobIntoTask(task, Job(1, EngineKeys("1", "1", false)), scratch_.File("sched.job"), 1));
    ASSERT_TRUE(task.result_file.Open());
    TheRun().current_task.store(&task);
    EXPECT_FALSE(RunEngineStep(task));
    EXPECT_EQ(task.current_engine.load(), nullptr);
    EXPECT_TRUE(task.result_file.Close());
  }
}

}  // namespace
}  // namespace vox
