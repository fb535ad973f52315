// Whole jobs through the public host API of libvox.so, as a host runs them.
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <mutex>
#include <thread>
#include <vector>

#include "support/host_recorder.h"
#include "support/scratch.h"
#include "vox/vox_host.h"

extern "C" uint32_t PingFromC(vox_ControlHandle handle);

namespace {

vox::test::HostRecorder& g_recorder = vox::test::HostRecorder::Instance();
vox_HostCallbackPair& g_pair = g_recorder.pair;

class RunApiTest : public ::testing::Test {
 protected:
  void SetUp() override { g_recorder.Clear(); }

  // Registers the recorder on h (it stays registered for good after the first time) and
  // waits for the job's exit code.
  uint32_t WaitForEnd(vox_ControlHandle h) {
    return g_recorder.WaitForEnd(h, std::chrono::seconds(20));
  }

  uint32_t RunJob(const std::string& path) { return WaitForEnd(RunProcess(path.c_str())); }

  vox::test::ScratchDir scratch_;
  vox::test::TempDirEnv temp_{scratch_, true};
};

TEST_F(RunApiTest, JobWithOnlyAJobSectionWritesAResultFileAndEndsWith0) {
  const std::string result = scratch_.File("only.res");
  const std::string job =
      vox::test::WriteFile(scratch_.File("only.job"), vox::test::JobText("Only", "only.res"));
  EXPECT_EQ(RunJob(job), 0u);

  const auto records = vox::test::ReadResultRecords(result);
  ASSERT_GE(records.size(), 3u);
  EXPECT_EQ(records.front().kind, 1);
  EXPECT_EQ(records.front().payload.size(), 10u);
  EXPECT_EQ(records.back().kind, 0);
  std::vector<std::string> messages;
  for (const auto& r : records)
    if (r.kind == 29) messages.push_back(vox::test::MessageText(r));
  EXPECT_EQ(messages, (std::vector<std::string>{"RawFilter", "RawFilter - OK", ""}));

  char name[16], path[512];
  EXPECT_EQ(GetEngineJobName(name, sizeof name), 4u);
  EXPECT_STREQ(name, "Only");
  GetEngineResultPath(path, sizeof path);
  EXPECT_EQ(std::filesystem::path(path), std::filesystem::path(result));
  EXPECT_EQ(temp_.EngineLogs().size(), 1u);
}

TEST_F(RunApiTest, WaitingRunReturns1WhateverTheExitCode) {
  EXPECT_EQ(RunProcessAndWait(scratch_.File("absent.job").c_str()), 1u);
  const std::wstring wide = std::filesystem::path(scratch_.File("absent.job")).wstring();
  EXPECT_EQ(RunProcessAndWaitW(wide.c_str()), 1u);
}

TEST_F(RunApiTest, WideAndVariablePathsRunTheSameJob) {
  const std::string job =
      vox::test::WriteFile(scratch_.File("w.job"), vox::test::JobText("W", "$(DIR)/w.res"));
  const std::wstring wide = std::filesystem::path(job).wstring();
  EXPECT_EQ(WaitForEnd(RunProcessW(wide.c_str())), 0u);  // $(DIR) reads as nothing: "/w.res"
  SetUp();
  const std::string dir = "DIR=" + scratch_.path().string();
  const char* vars[] = {"DIR=/nowhere", dir.c_str()};
  EXPECT_EQ(WaitForEnd(RunProcessWithVariables(job.c_str(), vars, 2)), 0u);
  EXPECT_TRUE(std::filesystem::exists(scratch_.File("w.res")));
}

TEST_F(RunApiTest, FailuresEndWithTheirExitCodes) {
  // 5: no job file; 5: a "$(" left open.
  EXPECT_EQ(RunJob(scratch_.File("missing.job")), 5u);
  SetUp();
  EXPECT_EQ(
      RunJob(vox::test::WriteFile(scratch_.File("open.job"), vox::test::JobText("O", "$(X.res"))),
      5u);
  // 6: no [JOB] section; nothing is created.
  SetUp();
  EXPECT_EQ(RunJob(vox::test::WriteFile(scratch_.File("nojob.job"),
                                        "[POINT1]\nName=A\nResultPath=nojob.res\n")),
            6u);
  EXPECT_FALSE(std::filesystem::exists(scratch_.File("nojob.res")));
  // 6: an engine that cannot be loaded; the result file is not created either.
  SetUp();
  EXPECT_EQ(RunJob(vox::test::WriteFile(
                scratch_.File("noengine.job"),
                vox::test::JobText("E", "noengine.res", "Type=1\nEnginePath=./absent.eng\n"))),
            6u);
  EXPECT_FALSE(std::filesystem::exists(scratch_.File("noengine.res")));
  EXPECT_NE(temp_.EngineLogTexts().back().find("Can not parse input file\n"), std::string::npos);
  // 7: the result file's folder does not exist.
  SetUp();
  EXPECT_EQ(RunJob(vox::test::WriteFile(scratch_.File("nofolder.job"),
                                        vox::test::JobText("N", "no/such/folder/x.res"))),
            7u);
  const auto logs = temp_.EngineLogTexts();
  ASSERT_FALSE(logs.empty());
  EXPECT_NE(logs.back().find("Can not open result file: "), std::string::npos) << logs.back();
}

TEST_F(RunApiTest, UnusableRawFileFailsPreparationWith8AfterScanningEveryFile) {
  const std::string job = vox::test::WriteFile(
      scratch_.File("prep.job"), vox::test::JobText("Prep", "prep.res", "NumFiles=2\n") +
                                     "[FILE:1]\nName=missing.raw\n" +
                                     "[FILE:2]\nName=" VOX_SHARED_DIR "/data/gnss/igs15904.sp3\n");
  EXPECT_EQ(RunJob(job), 8u);
  std::vector<std::string> messages;
  for (const auto& r : vox::test::ReadResultRecords(scratch_.File("prep.res")))
    if (r.kind == 29) messages.push_back(vox::test::MessageText(r));
  EXPECT_EQ(messages, (std::vector<std::string>{"Can not prepare data"}));
  const std::string log = temp_.EngineLogTexts().back();
  EXPECT_NE(log.find("Precise Ephemeris:\nG01 - "), std::string::npos);  // the orbit file too
  EXPECT_NE(log.find("Can not prepare data\n"), std::string::npos);
}

TEST_F(RunApiTest, TextRunNeverReports5AndTakesCrLfText) {
  const std::filesystem::path previous = std::filesystem::current_path();
  std::filesystem::current_path(scratch_.path());
  const uint32_t code = WaitForEnd(RunMultiSiteTask("[JOB]\r\nName=T\r\nResultPath=t.res\r\n"));
  std::filesystem::current_path(previous);
  EXPECT_EQ(code, 0u);
  char name[8];
  GetEngineJobName(name, sizeof name);
  EXPECT_STREQ(name, "T");
  EXPECT_TRUE(std::filesystem::exists(scratch_.File("t.res")));
}

// A job file that is a FIFO keeps the job thread waiting in its read until the test writes
// the job text: a job that is "running" for as long as the test needs.
class BlockedJob {
 public:
  explicit BlockedJob(const std::string& path) : path_(path) {
    EXPECT_EQ(mkfifo(path.c_str(), 0600), 0);
  }
  void Release(const std::string& text) { vox::test::WriteFile(path_, text); }
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

TEST_F(RunApiTest, SecondRunWhileOneRunsIsRefusedWithItsOwnLog) {
  BlockedJob blocked(scratch_.File("blocked.job"));
  vox_ControlHandle first = RunProcess(blocked.path().c_str());
  ASSERT_NE(first, nullptr);
  ASSERT_EQ(temp_.EngineLogs().size(), 1u);
  const std::string first_log = temp_.EngineLogs().front();

  const std::string other =
      vox::test::WriteFile(scratch_.File("other.job"), vox::test::JobText("X", "other.res"));
  EXPECT_EQ(RunProcess(other.c_str()), nullptr);
  EXPECT_EQ(RunProcessAndWait(other.c_str()), 0u);
  EXPECT_EQ(RunMultiSiteTask("[JOB]\nName=Y\n"), nullptr);
  const auto logs = temp_.EngineLogs();
  ASSERT_EQ(logs.size(), 4u);
  for (const auto& log : logs) {
    if (log == first_log) continue;
    EXPECT_EQ(vox::test::ReadFile(log), "Program is busy\n");
  }
  EXPECT_EQ(SendEngineControl(first, VOX_CMD_EXIT_CODE, 0), 259u);

  blocked.Release(vox::test::JobText("Blocked", "blocked.res"));
  EXPECT_EQ(WaitForEnd(first), 0u);
  EXPECT_FALSE(std::filesystem::exists(scratch_.File("other.res")));
  EXPECT_EQ(vox::test::ReadResultRecords(scratch_.File("blocked.res")).back().kind, 0);
  EXPECT_EQ(vox::test::ReadFile(first_log).find("Program is busy"), std::string::npos);
}

TEST_F(RunApiTest, BreakDuringARunEndsWith10) {
  BlockedJob blocked(scratch_.File("break.job"));
  vox_ControlHandle h = RunProcess(blocked.path().c_str());
  EXPECT_EQ(SendEngineControl(h, VOX_CMD_BREAK, 0), 0u);
  blocked.Release(vox::test::JobText("Break", "break.res"));
  EXPECT_EQ(WaitForEnd(h), 10u);
  EXPECT_EQ(vox::test::ReadResultRecords(scratch_.File("break.res")).back().kind, 0);
}

TEST_F(RunApiTest, HandleOfAnEndedJobIsHarmless) {
  BlockedJob blocked(scratch_.File("stale.job"));
  vox_ControlHandle old = RunProcess(blocked.path().c_str());
  EXPECT_EQ(PingFromC(old), 4u);
  EXPECT_NE(SendEngineControl(old, VOX_CMD_THREAD_ID, 0), 0u);
  char title[64];
  EXPECT_EQ(GetEngineControlTitle(old, title, sizeof title), 19u);
  EXPECT_STREQ(title, "EngineControlWindow");
  blocked.Release(vox::test::JobText("Stale", "stale.res"));
  EXPECT_EQ(WaitForEnd(old), 0u);

  BlockedJob next(scratch_.File("next.job"));
  SetUp();
  vox_ControlHandle current = RunProcess(next.path().c_str());
  ASSERT_NE(current, old);
  for (uint32_t command = 0; command <= 7; ++command)
    EXPECT_EQ(SendEngineControl(old, command, 0), 0u) << command;
  EXPECT_EQ(PingFromC(old), 0u);
  EXPECT_EQ(GetEngineControlTitle(old, title, sizeof title), 0u);
  next.Release(vox::test::JobText("Next", "next.res"));
  EXPECT_EQ(WaitForEnd(current), 0u);  // the break sent on the old handle reached nothing
}

TEST_F(RunApiTest, CallbackRegisteredAfterTheEndIsCalledAtOnceWith7) {
  // A job whose file cannot be read leaves its handle open, so the end can be watched
  // through command 7 before anything is registered.
  vox_ControlHandle h = RunProcess(scratch_.File("gone.job").c_str());
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  while (SendEngineControl(h, VOX_CMD_EXIT_CODE, 0) == VOX_EXIT_STILL_ACTIVE &&
         std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  EXPECT_EQ(SendEngineControl(h, VOX_CMD_EXIT_CODE, 0), 5u);
  SetUp();
  EXPECT_EQ(SendEngineControl(h, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&g_pair)), 8u);
  std::lock_guard lock(g_recorder.mutex);
  EXPECT_EQ(g_recorder.exit_codes, (std::vector<uint32_t>{5}));  // already, on this thread
}

TEST_F(RunApiTest, ResultFileThatCannotBeCompletedEndsWith11) {
  // A file size limit lets the result file open but makes its closing write fail: run
  // voxrun under one, in a child process.
  const std::string job =
      vox::test::WriteFile(scratch_.File("full.job"), vox::test::JobText("Full", "full.res"));
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    rlimit limit{40, 40};
    setrlimit(RLIMIT_FSIZE, &limit);
    signal(SIGXFSZ, SIG_IGN);
    execl(VOX_VOXRUN, "voxrun", "--quiet", job.c_str(), static_cast<char*>(nullptr));
    _exit(127);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), 11);
  EXPECT_LE(std::filesystem::file_size(scratch_.File("full.res")), 40u);
}

}  // namespace
