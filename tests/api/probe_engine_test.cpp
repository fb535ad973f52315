// The probe engine (tests/engines/probe_engine.cpp) run by hand on a parsed job: it walks
// every stream through the exported functions and writes what it read, which is compared
// here against the job. The engine's vox_* calls bind to this executable's copy of the
// library (the test exports its symbols), so they see the task set up below.
#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>
#include <string>
#include <vector>

#include "run/engine_threads.h"
#include "run/job_parse.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"

namespace vox {
namespace {

class ProbeEngineTest : public ::testing::Test {
 protected:
  void TearDown() override {
    TheRun().current_task.store(nullptr);
    TheRun().break_flag.store(0);
  }

  std::string Job(const std::string& engine_keys) {
    return test::JobText("Probe", scratch_.File("probe.res"),
                         "Type=1\nEnginePath=" VOX_TEST_ENGINE_DIR
                         "/test_probe.eng\n"
                         "NumFiles=2\nNumPoints=3\nNumOccups=3\nNumVectors=2\nNumFans=1\n"
                         "NumAntennas=1\nNumReceivers=1\nOmitSV=R7\nEnableReoccupations=1\n"
                         "ProbeOut=" +
                             out_ + "\n" + engine_keys +
                             "[FILE:1]\nName=a.raw\n[FILE:2]\nName=sub/b.raw\n"
                             "[POINT:1]\nName=Known\nType=0\nPosX=4000000\nPosZ=5000000\n"
                             "PosRms=0.01\n"
                             "[POINT:2]\nName=Declared\nType=1\nPosX=1\n"
                             "[ANTENNA:1]\nName=Ant\n"
                             "[RECEIVER:1]\nName=Rx\nVendor=Acme\nSN=42\n"
                             "[OCCUP:1]\nName=Occ1\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\n"
                             "[OCCUP:2]\nName=Occ2\nFile=2\nPoint=3\n"
                             "[OCCUP:3]\nName=Occ3\nFile=1\nPoint=3\n"
                             "[VECTOR:1]\nPoints=1,3\n[VECTOR:2]\nPoints=2,2\n"
                             "[FAN:1]\nPoint=1\nRover=2\nGGAPath=" +
                             scratch_.File("fan.gga") + "\n");
  }

  // Parses the job into the task, makes it current and runs the engine's group call.
  std::vector<std::string> Run(const std::string& engine_keys) {
    if (!ParseJobIntoTask(task_, Job(engine_keys), scratch_.File("probe.job"), 1)) {
      ADD_FAILURE() << "job not parsed";
      return {};
    }
    task_.result_file.Open();
    TheRun().current_task.store(&task_);
    TEngine* engine = task_.engines->processing();
    if (engine == nullptr || !engine->loaded()) {
      ADD_FAILURE() << "probe engine not loaded";
      return {};
    }
    task_.current_engine = engine;
    vox_ThreadContext context = MakeThreadContext(task_, task_.engine_flags(), 1);
    engine->ProcessGroup(&context);
    task_.current_engine = nullptr;
    task_.result_file.Close();
    return test::FileLines(out_);
  }

  bool Has(const std::vector<std::string>& lines, const std::string& line) {
    return std::find(lines.begin(), lines.end(), line) != lines.end();
  }

  test::ScratchDir scratch_;
  test::TempDirEnv temp_{scratch_, false};
  std::string out_ = scratch_.File("probe.txt");
  TTask task_;
};

TEST_F(ProbeEngineTest, WalksEveryStreamAndSeesTheJob) {
  const auto lines = Run("ProbeThreads=2\n");
  ASSERT_FALSE(lines.empty());
  std::string all;
  for (const auto& l : lines)
    all += l + "\n";
  SCOPED_TRACE(all);  // what the engine read, for any failure below
  EXPECT_EQ(lines.front(), "start id=1 flags=00000004");
  EXPECT_TRUE(Has(lines, "solution kind=1 name=Probe extra=2 type=1 one=1"));
  // Name, signals and epochs were filled; no meteorological values by default.
  EXPECT_TRUE(Has(lines,
                  "occupation id=02000001 point=01000001 file=04000001 receiver=80000001 "
                  "epochs=0 interval=0 mask=00000A8C name=Occ1"));
  EXPECT_TRUE(Has(lines,
                  "occupation id=02000003 point=01000003 file=04000001 receiver=00000000 "
                  "epochs=0 interval=0 mask=00000A8C name=Occ3"));
  EXPECT_TRUE(Has(lines, "occupation_plain id=02000002 result=1 name=Occ2"));
  EXPECT_TRUE(Has(lines, "states id=02000002 R6=1 R7=2 E11=1"));
  EXPECT_TRUE(Has(lines, "antenna id=80000001 slots=0 mask=00000000"));
  EXPECT_TRUE(Has(lines, "receiver id=80000001 vendor=Acme name=Rx serial=42"));
  EXPECT_TRUE(Has(lines, "track id=04000002 name=b.raw"));
  EXPECT_TRUE(Has(lines,
                  "site id=01000001 result=1 type=1 count=1 x=4000000.0000 y=0.0000 "
                  "z=5000000.0000 rms=0.0100 name=Known"));
  EXPECT_TRUE(Has(lines,
                  "site id=01000002 result=1 type=2 count=0 x=1.0000 y=0.0000 z=0.0000 "
                  "rms=0.0000 name=Declared"));
  EXPECT_TRUE(Has(lines,
                  "site id=01000003 result=0 type=0 count=2 x=0.0000 y=0.0000 z=0.0000 "
                  "rms=0.0000 name=POINT:3"));
  // Vector 2 has no occupations and is not served.
  EXPECT_TRUE(Has(lines,
                  "vector id=08000001 points=01000001,01000003 names=Known,POINT:3 again=1 "
                  "occups=02000001,02000002,02000003 size=412 same=1"));
  EXPECT_EQ(std::count_if(lines.begin(), lines.end(),
                          [](const std::string& l) { return l.rfind("vector ", 0) == 0; }),
            1);
  EXPECT_TRUE(Has(lines,
                  "fan id=10000001 base=01000001 rover=04000002 base_name=Known rover_name=b.raw "
                  "occups=02000001,02000002 property=1 rays=1 read_refused=1"));
  EXPECT_TRUE(Has(lines, "navcoord id=02000002 set=1 get=1 x=2.0"));
  // The mean of occupations 2 and 3 on point 3; point 1 keeps its known position.
  EXPECT_TRUE(Has(lines,
                  "site_after id=01000003 result=1 type=3 count=2 x=2.5000 y=0.0000 "
                  "z=0.0000 rms=1.2247 name=POINT:3"));
  EXPECT_TRUE(Has(lines,
                  "site_after id=01000001 result=1 type=1 count=1 x=4000000.0000 y=0.0000 "
                  "z=5000000.0000 rms=0.0100 name=Known"));
  EXPECT_EQ(std::count(lines.begin(), lines.end(),
                       "thread init=1 own_writer=1 flags=00000040 first_point=01000001 "
                       "delete=0"),
            2);
  EXPECT_TRUE(Has(lines, "steps done flags=80000004"));
  EXPECT_EQ(lines.back(), "end");

  // The threads' messages reached the result file through their own writers.
  size_t thread_messages = 0;
  for (const auto& record : test::ReadResultRecords(scratch_.File("probe.res")))
    if (test::MessageText(record).rfind("probe thread", 0) == 0) ++thread_messages;
  EXPECT_EQ(thread_messages, 2u);
  EXPECT_TRUE(task_.thread_writers.empty());
}

TEST_F(ProbeEngineTest, HonoursABreakRequestAtItsNextProgressReport) {
  TheRun().break_flag.store(1);
  const auto lines = Run("ProbeSlowMs=1\nProbeHonourBreak=1\n");
  EXPECT_TRUE(Has(lines, "break honoured at step 1"));
  EXPECT_EQ(lines.back(), "end");
}

TEST_F(ProbeEngineTest, CanBeToldToFault) {
  ASSERT_TRUE(ParseJobIntoTask(task_, Job("ProbeFail=fault\n"), scratch_.File("p.job"), 1));
  TheRun().current_task.store(&task_);
  vox_ThreadContext context = MakeThreadContext(task_, 4, 1);
  EXPECT_DEATH(task_.engines->processing()->ProcessGroup(&context), "");
}

TEST_F(ProbeEngineTest, CanBeToldToThrow) {
  ASSERT_TRUE(ParseJobIntoTask(task_, Job("ProbeFail=throw\n"), scratch_.File("p.job"), 1));
  TheRun().current_task.store(&task_);
  vox_ThreadContext context = MakeThreadContext(task_, 4, 1);
  EXPECT_ANY_THROW(task_.engines->processing()->ProcessGroup(&context));
}

}  // namespace
}  // namespace vox
