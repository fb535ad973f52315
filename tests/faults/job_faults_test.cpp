// Whole jobs through libvox.so whose engine, disk or host misbehaves: an engine that throws,
// faults, or never returns until it is told to break; a result file that hits a full disk
// half-way; a host that sends control commands from several threads while the job runs and
// after it has ended. The job must always end, with the exit code that tells what happened,
// and leave a result file that is whole up to its last complete record.
//
// These jobs need the pipeline to run the raw filter and the processing engine. Until it
// does, the fault engine is never entered and the tests that depend on it are skipped.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include <atomic>
#include <chrono>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include "support/host_recorder.h"
#include "support/scratch.h"
#include "vox/vox_host.h"

namespace {

namespace fs = std::filesystem;
using namespace std::chrono_literals;

vox::test::HostRecorder& g_recorder = vox::test::HostRecorder::Instance();

constexpr const char* kEngine = VOX_TEST_ENGINE_DIR "/test_fault.eng";

class JobFaultTest : public ::testing::Test {
 protected:
  void SetUp() override { g_recorder.Clear(); }

  // A static job on the fault engine (also its raw filter) with the given [JOB] lines.
  std::string WriteJob(const std::string& engine_lines) {
    return vox::test::WriteFile(
        scratch_.File("fault.job"),
        vox::test::JobText("Fault", result_,
                           std::string("Type=1\nEnginePath=") + kEngine + "\nRawfiltPath=" +
                               kEngine + "\nFaultRecord=" + record_ + "\n" + engine_lines));
  }

  uint32_t WaitForEnd(vox_ControlHandle h, std::chrono::seconds limit = 30s) {
    return g_recorder.WaitForEnd(h, limit);
  }

  bool EngineEntered() const { return fs::exists(record_); }

  // The records of the result file; the walk stops at the first broken frame, which the
  // test reports.
  std::vector<vox::test::ResultRecord> WholeRecords() const {
    const auto records = vox::test::ReadResultRecords(result_);
    size_t framed = 0;
    for (const auto& r : records)
      framed += r.payload.size() + 5;
    EXPECT_EQ(framed, fs::file_size(result_)) << "the result file ends inside a record";
    return records;
  }

  bool HasMessage(const std::vector<vox::test::ResultRecord>& records, const std::string& text) {
    for (const auto& r : records)
      if (vox::test::MessageText(r) == text) return true;
    return false;
  }

  vox::test::ScratchDir scratch_;
  vox::test::TempDirEnv temp_{scratch_, false};
  std::string result_ = scratch_.File("fault.res");
  std::string record_ = scratch_.File("entered.txt");
};

#define SKIP_UNLESS_ENGINE_RAN()                                                         \
  if (!EngineEntered())                                                                  \
  GTEST_SKIP() << "the pipeline does not call the raw filter and the processing engine " \
                  "yet (engine scheduling is not wired)"

TEST_F(JobFaultTest, AnEngineThatThrowsCostsItsOwnResultsOnly) {
  const uint32_t code = WaitForEnd(RunProcess(WriteJob("FaultMode=throw\n").c_str()));
  SKIP_UNLESS_ENGINE_RAN();
  EXPECT_EQ(code, VOX_EXIT_DONE);
  const auto records = WholeRecords();
  ASSERT_FALSE(records.empty());
  EXPECT_EQ(records.back().kind, 0) << "the result file is closed properly";
  EXPECT_TRUE(HasMessage(records, "fault engine: start"));
}

TEST_F(JobFaultTest, AnEngineThatFaultsCostsItsOwnResultsOnly) {
  const uint32_t code = WaitForEnd(RunProcess(WriteJob("FaultMode=crash\n").c_str()));
  SKIP_UNLESS_ENGINE_RAN();
  EXPECT_EQ(code, VOX_EXIT_DONE);
  const auto records = WholeRecords();
  ASSERT_FALSE(records.empty());
  EXPECT_EQ(records.back().kind, 0);
  EXPECT_TRUE(HasMessage(records, "fault engine: start"));
}

TEST_F(JobFaultTest, AnEngineThatNeverReturnsEndsAtABreakWith10) {
  vox_ControlHandle h = RunProcess(WriteJob("FaultMode=hang\n").c_str());
  ASSERT_NE(h, nullptr);
  const auto deadline = std::chrono::steady_clock::now() + 20s;
  while (!EngineEntered() && SendEngineControl(h, VOX_CMD_EXIT_CODE, 0) == 259 &&
         std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(5ms);
  if (!EngineEntered()) {
    WaitForEnd(h);
    SKIP_UNLESS_ENGINE_RAN();
  }
  EXPECT_EQ(SendEngineControl(h, VOX_CMD_EXIT_CODE, 0), 259u);
  SendEngineControl(h, VOX_CMD_BREAK, 0);
  EXPECT_EQ(WaitForEnd(h, 10s), VOX_EXIT_BREAK);
  const auto records = WholeRecords();
  ASSERT_FALSE(records.empty());
  EXPECT_EQ(records.back().kind, 0);
  EXPECT_TRUE(HasMessage(records, "fault engine: broken"));
}

// Commands from several host threads at once, while the engine runs and after the job has
// ended: while the job runs every command answers and progress never falls; once the job has
// ended its handle is closed, and every command on it answers 0 from then on.
TEST_F(JobFaultTest, CommandsFromManyHostThreadsDuringAndAfterTheJob) {
  vox_ControlHandle h = RunProcess(WriteJob("FaultMode=hang\n").c_str());
  ASSERT_NE(h, nullptr);
  std::atomic<bool> stop{false};
  std::atomic<int> failures{0}, answered_after_close{0};
  std::vector<std::thread> hosts;
  for (int t = 0; t < 6; ++t) {
    hosts.emplace_back([&, t] {
      uint32_t last_progress = 0;
      bool closed = false;
      while (!stop.load()) {
        const uint32_t ping = SendEngineControl(h, VOX_CMD_PING, 0);
        if (ping == 0) closed = true;
        if (closed) {
          if (ping != 0) ++failures;  // a closed handle never answers again
          if (SendEngineControl(h, VOX_CMD_PROGRESS, 0) != 0) ++answered_after_close;
          if (SendEngineControl(h, VOX_CMD_EXIT_CODE, 0) != 0) ++answered_after_close;
          SendEngineControl(h, VOX_CMD_BREAK, 0);
        } else {
          if (ping != 4) ++failures;
          const uint32_t progress = SendEngineControl(h, VOX_CMD_PROGRESS, 0);
          // A 0 here is the handle closing between the two commands.
          if (progress != 0 && (progress < last_progress || progress > 99)) ++failures;
          if (progress != 0) last_progress = progress;
          SendEngineControl(h, VOX_CMD_ELAPSED, 0);
          SendEngineControl(h, VOX_CMD_THREAD_ID, 0);
          if (t % 2 == 0) {
            SendEngineControl(h, VOX_CMD_PAUSE, 0);
            SendEngineControl(h, VOX_CMD_RESUME, 0);
          }
        }
        char title[64];
        GetEngineControlTitle(h, title, sizeof title);
        std::this_thread::sleep_for(1ms);
      }
    });
  }
  const auto deadline = std::chrono::steady_clock::now() + 20s;
  while (!EngineEntered() && SendEngineControl(h, VOX_CMD_EXIT_CODE, 0) == 259 &&
         std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(5ms);
  std::this_thread::sleep_for(50ms);
  const bool entered = EngineEntered();
  if (entered) SendEngineControl(h, VOX_CMD_BREAK, 0);
  const uint32_t code = WaitForEnd(h);
  std::this_thread::sleep_for(50ms);  // the host threads keep sending after the end
  stop.store(true);
  for (std::thread& t : hosts)
    t.join();
  EXPECT_EQ(failures.load(), 0);
  EXPECT_EQ(answered_after_close.load(), 0);
  EXPECT_EQ(code, entered ? VOX_EXIT_BREAK : VOX_EXIT_DONE);
  EXPECT_EQ(SendEngineControl(h, VOX_CMD_PING, 0), 0u);
}

// The disk fills while the engine writes: the job reports that its result file could not be
// closed (11) and the file keeps its complete records. Runs in a child process of its own,
// whose file-size limit plays the full disk; the child works in a folder of the parent's
// (named through the environment, which the child inherits), so the parent can look at the
// result file afterwards.
TEST_F(JobFaultTest, ADiskThatFillsDuringTheRunEndsWith11AndAWholeFile) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const std::string mine = scratch_.File("child");
  fs::create_directories(mine);
  setenv("VOX_FAULT_CHILD_DIR", mine.c_str(), 0);  // the child keeps its parent's value
  const std::string shared = std::getenv("VOX_FAULT_CHILD_DIR");
  result_ = shared + "/full.res";
  record_ = shared + "/entered.txt";
  const std::string job = WriteJob("FaultMode=write\nFaultWrites=4000\n");

  auto run_on_a_full_disk = [&] {
    signal(SIGXFSZ, SIG_IGN);
    const rlimit limit{40000, 40000};
    setrlimit(RLIMIT_FSIZE, &limit);
    const uint32_t code = WaitForEnd(RunProcess(job.c_str()));
    std::exit(EngineEntered() ? static_cast<int>(code) : 100);
  };
  int status = -1;
  EXPECT_EXIT(
      run_on_a_full_disk(),
      [&status](int s) {
        status = s;
        return true;
      },
      "");
  unsetenv("VOX_FAULT_CHILD_DIR");
  SKIP_UNLESS_ENGINE_RAN();
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), static_cast<int>(VOX_EXIT_CLOSE));
  EXPECT_LE(fs::file_size(result_), 40000u);
  const auto records = WholeRecords();
  ASSERT_FALSE(records.empty());
  EXPECT_EQ(records.front().kind, 1);
  EXPECT_NE(records.back().kind, 0) << "an incomplete file has no end record";
}

}  // namespace
