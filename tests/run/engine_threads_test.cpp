// Thread writers, the two engine callbacks and the progress arithmetic, on a task made
// current by hand.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "platform/platform.h"
#include "run/engine_threads.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"

namespace vox {
namespace {

std::vector<uint32_t>* g_progress_events = nullptr;

void RecordEvent(void*, uint32_t code, uint32_t value) {
  if (code == kCallbackProgress && g_progress_events != nullptr)
    g_progress_events->push_back(value);
}

class EngineThreadsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    RegisterHostCallback(RecordEvent, nullptr);  // first registration in this process wins
    g_progress_events = &events_;
    TheRun().progress.store(0);
    task_.result_file.set_path(scratch_.File("job.res"));
    ASSERT_TRUE(task_.result_file.Open());
    TheRun().current_task.store(&task_);
  }
  void TearDown() override {
    // InitNewThread unmasked floating-point traps on this thread, as on an engine thread.
    platform::RestoreDefaultFloatingPointMode();
    TheRun().current_task.store(nullptr);
    g_progress_events = nullptr;
  }

  vox_ThreadContext NewThread() {
    vox_ThreadContext c = MakeThreadContext(task_, 4, 1);
    EXPECT_EQ(InitNewThread(task_, &c), 1u);
    return c;
  }

  test::ScratchDir scratch_;
  test::TempDirEnv temp_{scratch_, false};
  TTask task_;
  std::vector<uint32_t> events_;
};

TEST_F(EngineThreadsTest, ReleasedThreadCountsAsHundredWhateverItLastReported) {
  task_.total_units = 10;
  vox_ThreadContext reported = NewThread();
  vox_ThreadContext silent = NewThread();
  ProgressProc(reported.writer, 40);
  EXPECT_EQ(task_.worker_progress_sum, 40u);

  DeleteThread(task_, &reported);
  EXPECT_EQ(task_.worker_progress_sum, 100u);
  DeleteThread(task_, &silent);
  EXPECT_EQ(task_.worker_progress_sum, 200u);
}

TEST_F(EngineThreadsTest, ThreadWritersReportTheirSumOverTheUnits) {
  task_.total_units = 2;
  vox_ThreadContext a = NewThread();
  vox_ThreadContext b = NewThread();
  ProgressProc(a.writer, 50);
  ProgressProc(b.writer, 70);
  EXPECT_EQ(TheRun().progress.load(), 60u);  // (50 + 70) / 2
  // A thread that reports less than before lowers the sum but never the progress.
  ProgressProc(a.writer, 10);
  EXPECT_EQ(task_.worker_progress_sum, 80u);
  EXPECT_EQ(TheRun().progress.load(), 60u);
  EXPECT_EQ(events_, (std::vector<uint32_t>{25, 60}));
  DeleteThread(task_, &a);
  DeleteThread(task_, &b);
}

TEST_F(EngineThreadsTest, ProgressStaysBelowHundredFromAnyWriter) {
  task_.total_units = 1;
  vox_ThreadContext a = NewThread();
  vox_ThreadContext b = NewThread();
  ProgressProc(a.writer, 100);
  ProgressProc(b.writer, 100);  // sum 200 over 1 unit
  EXPECT_EQ(TheRun().progress.load(), 99u);
  DeleteThread(task_, &a);
  DeleteThread(task_, &b);
}

TEST_F(EngineThreadsTest, TaskWriterProgressCountsDoneUnitsAndCapsAt99) {
  EXPECT_EQ(TaskWriterProgress(1, 4, 50), 37);  // (100 + 50) / 4
  EXPECT_EQ(TaskWriterProgress(3, 3, 100), 99);
  EXPECT_EQ(TaskWriterProgress(0, 0, 50), -1);
  EXPECT_EQ(TaskWriterProgress(1, 4, -1), -1);

  task_.total_units = 0;
  ProgressProc(&task_.result_file, 50);
  EXPECT_EQ(TheRun().progress.load(), 0u);
  task_.total_units = 2;
  task_.done_units = 1;
  ProgressProc(&task_.result_file, 50);
  EXPECT_EQ(TheRun().progress.load(), 75u);
  ProgressProc(&task_.result_file, 0);  // 50: lower, dropped and not sent
  EXPECT_EQ(TheRun().progress.load(), 75u);
  EXPECT_EQ(events_, (std::vector<uint32_t>{75}));
}

TEST_F(EngineThreadsTest, NegativePercentChangesNothingButStillAnswers) {
  task_.total_units = 1;
  vox_ThreadContext a = NewThread();
  ProgressProc(a.writer, 30);
  EXPECT_EQ(ProgressProc(a.writer, -5), 0x80000004u);
  EXPECT_EQ(task_.worker_progress_sum, 30u);
  EXPECT_EQ(static_cast<TResultFile*>(a.writer)->progress, 30u);
  DeleteThread(task_, &a);
}

TEST_F(EngineThreadsTest, CallbacksReturnTheEngineFlagsWithBit31) {
  task_.job.engine_flags = 6;
  EXPECT_EQ(ProgressProc(&task_.result_file, 0), 0x80000006u);
  EXPECT_EQ(MessageProc(&task_.result_file, 1, "x"), 0x80000006u);
  EXPECT_EQ(MessageProc(nullptr, 1, "x"), 0u);
}

TEST_F(EngineThreadsTest, NewThreadGetsItsOwnWriterFlagAndCallbacks) {
  task_.result_file.nesting_depth = 2;
  task_.result_file.result_version = 101;
  vox_ThreadContext c = MakeThreadContext(task_, 0, 7);
  c.progress = nullptr;
  c.message = nullptr;
  ASSERT_EQ(InitNewThread(task_, &c), 1u);
  auto* writer = static_cast<TResultFile*>(c.writer);
  ASSERT_NE(writer, &task_.result_file);
  EXPECT_EQ(c.flags, 64u);
  EXPECT_EQ(c.id, 7u);
  EXPECT_EQ(c.progress, &ProgressProc);
  EXPECT_EQ(c.message, &MessageProc);
  EXPECT_EQ(writer->nesting_depth, 2);
  EXPECT_EQ(writer->result_version, 101u);
  EXPECT_EQ(temp_.TempFiles("VOX").size(), 1u);
  EXPECT_EQ(DeleteThread(task_, &c), 0u);
  EXPECT_EQ(c.writer, nullptr);
}

TEST_F(EngineThreadsTest, ThreadFilesAreMergedOneBlockPerThreadInReleaseOrder) {
  vox_ThreadContext a = NewThread();
  vox_ThreadContext b = NewThread();
  MessageProc(a.writer, 1, "a1");
  MessageProc(b.writer, 1, "b1");
  MessageProc(a.writer, 1, "a2");
  MessageProc(b.writer, 1, "b2");
  EXPECT_EQ(temp_.TempFiles("VOX").size(), 2u);

  DeleteThread(task_, &b);
  DeleteThread(task_, &a);
  EXPECT_TRUE(temp_.TempFiles("VOX").empty());
  ASSERT_TRUE(task_.result_file.Close());

  std::vector<std::string> texts;
  int headers = 0, ends = 0;
  for (const auto& r : test::ReadResultRecords(scratch_.File("job.res"))) {
    if (r.kind == 29) texts.push_back(test::MessageText(r));
    headers += r.kind == 1;
    ends += r.kind == 0;
  }
  EXPECT_EQ(texts, (std::vector<std::string>{"b1", "b2", "a1", "a2"}));
  EXPECT_EQ(headers, 1);
  EXPECT_EQ(ends, 1);
}

TEST_F(EngineThreadsTest, ThreadsReleasedAtOnceKeepTheirBlocksWholeBesideLockedRecords) {
  constexpr int kThreads = 4;
  constexpr int kMessages = 300;
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([this, t] {
      vox_ThreadContext c = MakeThreadContext(task_, 0, 1);
      InitNewThread(task_, &c);
      const std::string text = "thread " + std::to_string(t);
      for (int i = 0; i < kMessages; ++i)
        MessageProc(c.writer, 1, text.c_str());
      DeleteThread(task_, &c);
    });
  }
  // Records that other threads write to the task's file under the solution lock meanwhile.
  for (int i = 0; i < 200; ++i) {
    TLockGuard lock(task_.solution_lock);
    task_.result_file.WriteMessage("locked", 1);
  }
  for (auto& thread : threads)
    thread.join();
  ASSERT_TRUE(task_.result_file.Close());

  const auto records = test::ReadResultRecords(scratch_.File("job.res"));
  ASSERT_FALSE(records.empty());
  EXPECT_EQ(records.back().kind, 0);  // the framing held to the end
  std::vector<std::string> blocks;    // runs of one thread's messages
  for (const auto& r : records) {
    const std::string text = test::MessageText(r);
    if (text.rfind("thread ", 0) != 0) continue;
    if (blocks.empty() || blocks.back() != text) blocks.push_back(text);
  }
  EXPECT_EQ(blocks.size(), static_cast<size_t>(kThreads));
  EXPECT_EQ(records.size(), 1u + kThreads * kMessages + 200 + 1);
}

TEST_F(EngineThreadsTest, ReleasingTwiceOrReleasingTheTaskWriterIsHarmless) {
  vox_ThreadContext a = NewThread();
  vox_ThreadContext copy = a;
  DeleteThread(task_, &a);
  EXPECT_EQ(DeleteThread(task_, &a), 0u);     // writer already taken out
  EXPECT_EQ(DeleteThread(task_, &copy), 0u);  // stale copy of a released writer
  vox_ThreadContext plain = MakeThreadContext(task_, 4, 1);
  EXPECT_EQ(DeleteThread(task_, &plain), 0u);
  EXPECT_TRUE(task_.result_file.is_open());
  EXPECT_EQ(ProgressProc(copy.writer, 50), 0x80000004u);  // unknown writer: ignored
  EXPECT_EQ(task_.worker_progress_sum, 100u);
}

TEST(TaskTest, UnreleasedThreadWritersLeaveNoFilesBehind) {
  test::ScratchDir scratch;
  test::TempDirEnv temp(scratch, false);
  {
    auto task = std::make_unique<TTask>();
    vox_ThreadContext c = MakeThreadContext(*task, 4, 1);
    InitNewThread(*task, &c);
    EXPECT_EQ(temp.TempFiles("VOX").size(), 1u);
  }
  platform::RestoreDefaultFloatingPointMode();
  EXPECT_TRUE(temp.TempFiles("VOX").empty());
}

}  // namespace
}  // namespace vox
