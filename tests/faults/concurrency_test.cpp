// Shared state under many threads at once: the process-wide leap-second table read and
// extended from many threads, and the engine callbacks (progress and messages) called from
// many engine threads with writers of their own beside the task's writer. Run under the
// thread sanitizer in CI; here they check that the values stay consistent.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "job/leap_seconds.h"
#include "platform/platform.h"
#include "run/engine_threads.h"
#include "run/run_state.h"
#include "run/task.h"
#include "support/scratch.h"
#include "vox/vox_sdk_leap.h"

namespace vox {
namespace {

constexpr uint32_t kDay = 86400;

// Seconds since the GPS origin of a day of the given year (roughly; the half year is what
// counts).
uint32_t SecondsIn(int year, bool second_half) {
  return static_cast<uint32_t>(((year - 1980) * 365.25 + (second_half ? 220 : 40)) * kDay);
}

TEST(LeapSecondsFromManyThreads, ReadersAndWritersKeepTheTableConsistent) {
  ResetLeapTableForTesting();
  const TimeMs known{13204 * kDay, 0};         // March 2016: 17 leap seconds
  ASSERT_EQ(vox_GetLeapSeconds(&known), 17u);  // loads the built-in table

  // Writers report half years after the built-in table (racing for the same ones, and past
  // the table's capacity); readers query the built-in range and the changes across it.
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&, t] {
      for (int i = 0; i < 200; ++i) {
        if (t % 2 == 0) {
          const TimeMs later{SecondsIn(2018 + (i / 2) % 20, i % 2 == 1), 0};
          const uint32_t set = vox_SetLeapSeconds(&later, 18 + t);
          if (set != 0xFFFFFFFFu && vox_GetLeapSeconds(&later) != set) ++wrong;
        } else {
          if (vox_GetLeapSeconds(&known) != 17u) ++wrong;
          const TimeMs origin{0, 0};
          if (vox_GetLeapChanges(&origin, &known) != 17u) ++wrong;
        }
      }
    });
  }
  for (std::thread& t : threads)
    t.join();
  EXPECT_EQ(wrong.load(), 0);
  // No half year was added twice, and the table kept to its capacity.
  const std::vector<LeapRow> rows = LeapTableRows();
  EXPECT_LE(rows.size(), 32u);
  for (size_t i = 0; i < rows.size(); ++i)
    for (size_t j = i + 1; j < rows.size(); ++j)
      EXPECT_TRUE(rows[i].end <= rows[j].begin || rows[j].end <= rows[i].begin)
          << "rows " << i << " and " << j << " overlap";
  ResetLeapTableForTesting();
}

std::mutex g_events_mutex;
std::vector<uint32_t>* g_progress = nullptr;

void RecordProgress(void*, uint32_t code, uint32_t value) {
  std::lock_guard lock(g_events_mutex);
  if (code == kCallbackProgress && g_progress != nullptr) g_progress->push_back(value);
}

TEST(CallbacksFromManyThreads, ProgressOnlyRisesAndEveryMessageIsWholeInTheResultFile) {
  test::ScratchDir scratch;
  test::TempDirEnv temp(scratch, false);
  std::vector<uint32_t> progress;
  RegisterHostCallback(RecordProgress, nullptr);
  {
    std::lock_guard lock(g_events_mutex);
    g_progress = &progress;
  }
  TheRun().progress.store(0);
  TTask task;
  task.result_file.set_path(scratch.File("job.res"));
  ASSERT_TRUE(task.result_file.Open());
  TheRun().current_task.store(&task);

  constexpr int kThreads = 16, kCalls = 200;
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&task, t] {
      vox_ThreadContext context = MakeThreadContext(task, 4, 1);
      InitNewThread(task, &context);
      for (int i = 0; i < kCalls; ++i) {
        context.progress(context.writer, i * 100 / kCalls);
        const std::string text = "thread " + std::to_string(t) + " message " + std::to_string(i);
        context.message(context.writer, 1, text.c_str());
      }
      DeleteThread(task, &context);
      platform::RestoreDefaultFloatingPointMode();
    });
  }
  // The job thread's own writer reports beside them.
  vox_ThreadContext main = MakeThreadContext(task, 4, 1);
  for (int i = 0; i < kCalls; ++i)
    main.progress(main.writer, i % 100);
  for (std::thread& t : threads)
    t.join();
  ASSERT_TRUE(task.result_file.Close());
  TheRun().current_task.store(nullptr);
  {
    std::lock_guard lock(g_events_mutex);
    g_progress = nullptr;
  }

  EXPECT_TRUE(std::is_sorted(progress.begin(), progress.end()));
  EXPECT_TRUE(progress.empty() || progress.back() <= 99u);
  // Every thread's messages arrive whole and in its own order.
  std::vector<int> next(kThreads, 0);
  int messages = 0;
  for (const auto& r : test::ReadResultRecords(scratch.File("job.res"))) {
    const std::string text = test::MessageText(r);
    int t = -1, i = -1;
    if (std::sscanf(text.c_str(), "thread %d message %d", &t, &i) != 2) continue;
    ASSERT_TRUE(t >= 0 && t < kThreads);
    EXPECT_EQ(i, next[t]) << "thread " << t;
    next[t] = i + 1;
    ++messages;
  }
  EXPECT_EQ(messages, kThreads * kCalls);
}

}  // namespace
}  // namespace vox
