// The control channel's commands and handles, without a job thread.
#include <gtest/gtest.h>

#include <vector>

#include "base/gps_time.h"
#include "run/control_channel.h"
#include "run/run_state.h"
#include "run/task.h"

namespace vox {
namespace {

struct Event {
  uint32_t code, value;
  bool operator==(const Event&) const = default;
};
std::vector<Event> g_events;
void Record(void*, uint32_t code, uint32_t value) {
  g_events.push_back({code, value});
}

struct CallbackPair {
  HostCallbackFn fn;
  void* context;
};

// Runs first: nothing in this process has run a job yet.
TEST(ControlChannelTest, BeforeAnyJobExitCodeIsStillActiveAndElapsedZero) {
  const uint64_t w = OpenControlWindow();
  EXPECT_EQ(SendControlCommand(w, kCommandExitCode, 0), 259u);
  EXPECT_EQ(SendControlCommand(w, kCommandElapsed, 0), 0u);
  CloseControlWindow(w);
}

TEST(ControlChannelTest, PauseBreakAndUnknownCommands) {
  const uint64_t w = OpenControlWindow();
  EXPECT_EQ(SendControlCommand(w, 9, 0), 0u);
  EXPECT_EQ(SendControlCommand(w, 0xFFFFFFFF, 0), 0u);

  EXPECT_EQ(SendControlCommand(w, kCommandPause, 0), 1u);
  EXPECT_EQ(TheRun().pause_flag.load(), 1u);
  EXPECT_EQ(SendControlCommand(w, kCommandResume, 0), 2u);
  EXPECT_EQ(TheRun().pause_flag.load(), 0u);

  TheRun().break_flag.store(0);
  EXPECT_EQ(SendControlCommand(w, kCommandBreak, 0), 0u);
  EXPECT_EQ(TheRun().break_flag.load(), 1u);
  TheRun().break_flag.store(0);
  CloseControlWindow(w);
}

TEST(ControlChannelTest, PauseInForceIsDroppedWhenTheWindowCloses) {
  const uint64_t w = OpenControlWindow();
  SendControlCommand(w, kCommandPause, 0);
  CloseControlWindow(w);
  EXPECT_EQ(TheRun().pause_flag.load(), 0u);
}

TEST(ControlChannelTest, StaleHandlesFindNothing) {
  const uint64_t old = OpenControlWindow();
  CloseControlWindow(old);
  const uint64_t current = OpenControlWindow();
  TheRun().break_flag.store(0);
  for (uint32_t command = 0; command <= 9; ++command)
    EXPECT_EQ(SendControlCommand(old, command, 0), 0u) << command;
  EXPECT_EQ(TheRun().break_flag.load(), 0u);  // the break on the old handle reached nothing
  EXPECT_EQ(SendControlCommand(0, kCommandPing, 0), 0u);
  EXPECT_EQ(SendControlCommand(current + 1000, kCommandPing, 0), 0u);
  char title[32] = "x";
  EXPECT_EQ(GetControlWindowTitle(old, title, sizeof title), 0u);
  EXPECT_STREQ(title, "");
  CloseControlWindow(old);  // closing a stale handle leaves the current window open
  EXPECT_EQ(SendControlCommand(current, kCommandPing, 0), 4u);
  CloseControlWindow(current);
}

TEST(ControlChannelTest, ElapsedIsNowMinusStartWhileATaskExistsElseTheJobsLength) {
  const uint64_t w = OpenControlWindow();
  const GpsWeekTime now = LocalGpsWeekTime();
  StoreJobStart(AddSeconds(now, -90.4));
  StoreJobEnd(AddSeconds(now, -30.0));
  EXPECT_EQ(SendControlCommand(w, kCommandElapsed, 0), 60u);  // truncated seconds
  TTask task;
  TheRun().current_task.store(&task);
  const uint32_t running = SendControlCommand(w, kCommandElapsed, 0);
  TheRun().current_task.store(nullptr);
  EXPECT_GE(running, 90u);
  EXPECT_LE(running, 92u);
  CloseControlWindow(w);
}

TEST(ControlChannelTest, CallbackRegisteredAfterTheEndIsCalledAtOnceAndFirstStaysInForce) {
  const uint64_t w = OpenControlWindow();
  TheRun().exit_code.store(5);
  CallbackPair first{Record, nullptr};
  g_events.clear();
  EXPECT_EQ(SendControlCommand(w, kCommandCallback, reinterpret_cast<uintptr_t>(&first)), 8u);
  EXPECT_EQ(g_events, (std::vector<Event>{{7, 5}}));

  CallbackPair null_pair{nullptr, nullptr};
  EXPECT_EQ(SendControlCommand(w, kCommandCallback, reinterpret_cast<uintptr_t>(&null_pair)), 8u);
  EXPECT_EQ(SendControlCommand(w, kCommandCallback, 0), 8u);
  g_events.clear();
  NotifyHost(kCallbackProgress, 12);  // the first registration is still the one called
  EXPECT_EQ(g_events, (std::vector<Event>{{3, 12}}));

  // While a job runs, registration calls nothing at once.
  TheRun().exit_code.store(kExitStillActive);
  g_events.clear();
  SendControlCommand(w, kCommandCallback, reinterpret_cast<uintptr_t>(&first));
  EXPECT_TRUE(g_events.empty());

  // The latest handle still takes a registration after its window closed.
  CloseControlWindow(w);
  TheRun().exit_code.store(0);
  EXPECT_EQ(SendControlCommand(w, kCommandCallback, reinterpret_cast<uintptr_t>(&first)), 8u);
  EXPECT_EQ(g_events, (std::vector<Event>{{7, 0}}));
  EXPECT_EQ(SendControlCommand(w, kCommandExitCode, 0), 0u);
}

}  // namespace
}  // namespace vox
