#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cfenv>
#include <cmath>
#include <stdexcept>

#include "platform/platform.h"

namespace vox::platform {
namespace {

volatile int* volatile g_null = nullptr;
volatile int g_zero = 0;
volatile double g_zero_double = 0.0;
volatile int g_sink = 0;
volatile long g_depth_limit = 1L << 40;

void WriteThroughNull() {
  *g_null = 1;
}
void DivideByZero() {
  g_sink = 10 / g_zero;
}

__attribute__((noinline)) long Recurse(long depth) {
  volatile char frame[512];
  frame[0] = static_cast<char>(depth);
  if (depth >= g_depth_limit) return frame[0];
  return Recurse(depth + 1) + frame[0];
}

TEST(RunGuarded, ReturnsNormallyAndReportsExceptions) {
  bool ran = false;
  EXPECT_EQ(RunGuarded([&] { ran = true; }).outcome, GuardOutcome::kReturned);
  EXPECT_TRUE(ran);

  GuardReport thrown = RunGuarded([] { throw std::runtime_error("engine gave up"); });
  EXPECT_EQ(thrown.outcome, GuardOutcome::kException);
  EXPECT_NE(thrown.description.find("engine gave up"), std::string::npos);
  EXPECT_EQ(RunGuarded([] { throw 5; }).outcome, GuardOutcome::kException);
}

TEST(RunGuarded, NullWriteAndIntegerDivisionByZeroAreReportedAndTheProcessLivesOn) {
  for (int round = 0; round < 3; ++round) {
    GuardReport access = RunGuarded(WriteThroughNull);
    EXPECT_EQ(access.outcome, GuardOutcome::kFault);
    EXPECT_EQ(access.signal, SIGSEGV);
    EXPECT_FALSE(access.description.empty());

    GuardReport division = RunGuarded(DivideByZero);
    EXPECT_EQ(division.outcome, GuardOutcome::kFault);
    EXPECT_EQ(division.signal, SIGFPE);
  }
  EXPECT_EQ(RunGuarded([] {}).outcome, GuardOutcome::kReturned);
}

TEST(RunGuarded, InnerGuardCatchesItsFaultAndTheOuterOneGoesOn) {
  GuardReport inner;
  bool after = false;
  GuardReport outer = RunGuarded([&] {
    inner = RunGuarded(WriteThroughNull);
    after = true;
  });
  EXPECT_EQ(inner.outcome, GuardOutcome::kFault);
  EXPECT_TRUE(after);
  EXPECT_EQ(outer.outcome, GuardOutcome::kReturned);
  // The outer guard is gone again: its frame must not catch a later fault.
  EXPECT_EQ(RunGuarded(WriteThroughNull).outcome, GuardOutcome::kFault);
}

TEST(FloatingPointMode, EngineModeTrapsDivisionByZeroAndTheModeSurvivesTheCatch) {
  SetEngineFloatingPointMode();
  GuardReport report = RunGuarded([] { g_sink = static_cast<int>(1.0 / g_zero_double); });
  EXPECT_EQ(report.outcome, GuardOutcome::kFault);
  EXPECT_EQ(report.signal, SIGFPE);
  EXPECT_NE(report.description.find("division by zero"), std::string::npos) << report.description;
  int trapping = fegetexcept();
  EXPECT_EQ(trapping, FE_INVALID | FE_DIVBYZERO | FE_OVERFLOW);

  // Underflow and inexact results stay quiet under the engine mode.
  volatile double tiny = 1e-300;
  volatile double third = 1.0 / 3.0;
  EXPECT_EQ(RunGuarded([&] { g_sink = static_cast<int>(tiny * tiny + third); }).outcome,
            GuardOutcome::kReturned);

  RestoreDefaultFloatingPointMode();
  EXPECT_EQ(fegetexcept(), 0);
  volatile double quotient = 0;
  EXPECT_EQ(RunGuarded([&] { quotient = 1.0 / g_zero_double; }).outcome, GuardOutcome::kReturned);
  EXPECT_TRUE(std::isinf(quotient));
}

uint32_t OverflowTheStack(void* argument) {
  *static_cast<GuardReport*>(argument) = RunGuarded([] { g_sink = static_cast<int>(Recurse(0)); });
  return 1;
}

TEST(RunGuarded, CatchesAStackOverflowOnASmallStackThread) {
  GuardReport report;
  auto thread = StartThread(OverflowTheStack, &report, 0x10000);
  ASSERT_NE(thread, nullptr);
  ASSERT_TRUE(thread->Wait(UINT32_MAX));
  EXPECT_EQ(thread->ExitStatus(), 1u);
  EXPECT_EQ(report.outcome, GuardOutcome::kFault);
  EXPECT_EQ(report.signal, SIGSEGV);
}

std::atomic<int> g_caught{0};

uint32_t FaultRepeatedly(void*) {
  for (int i = 0; i < 200; ++i) {
    if (RunGuarded(WriteThroughNull).outcome == GuardOutcome::kFault) ++g_caught;
  }
  return 0;
}

TEST(RunGuarded, ThreadsFaultingAtOnceEachGetTheirOwnReport) {
  g_caught = 0;
  std::unique_ptr<Thread> threads[4];
  for (auto& thread : threads)
    thread = StartThread(FaultRepeatedly, nullptr, 0x10000);
  for (auto& thread : threads) {
    ASSERT_NE(thread, nullptr);
    EXPECT_TRUE(thread->Wait(UINT32_MAX));
  }
  EXPECT_EQ(g_caught, 800);
}

// Runs body in a child process; returns its wait status.
template <typename Body>
int InChild(Body body) {
  fflush(nullptr);
  pid_t child = fork();
  if (child == 0) {
    rlimit no_core{0, 0};  // the deaths are expected; leave no core files behind
    setrlimit(RLIMIT_CORE, &no_core);
    body();
    _exit(0);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return status;
}

TEST(RunGuarded, AFaultOutsideTheGuardStillKillsTheProcess) {
  int status = InChild([] {
    if (RunGuarded(WriteThroughNull).outcome != GuardOutcome::kFault) _exit(3);
    WriteThroughNull();
  });
  ASSERT_TRUE(WIFSIGNALED(status)) << status;
  EXPECT_EQ(WTERMSIG(status), SIGSEGV);

  status = InChild([] {
    RunGuarded([] {});
    DivideByZero();
  });
  ASSERT_TRUE(WIFSIGNALED(status)) << status;
  EXPECT_EQ(WTERMSIG(status), SIGFPE);
}

void ExitFromEarlierHandler(int, siginfo_t*, void*) {
  _exit(42);
}

// The guard's handlers are installed once per process, so the earlier handler has to be in
// place before the first guarded call: the threadsafe style runs this in a fresh process.
TEST(RunGuardedDeathTest, AFaultOutsideTheGuardGoesToTheHandlerInstalledBefore) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(
      {
        struct sigaction earlier {};
        earlier.sa_sigaction = ExitFromEarlierHandler;
        earlier.sa_flags = SA_SIGINFO;
        sigemptyset(&earlier.sa_mask);
        sigaction(SIGSEGV, &earlier, nullptr);
        if (RunGuarded(WriteThroughNull).outcome != GuardOutcome::kFault) _exit(3);
        WriteThroughNull();
      },
      testing::ExitedWithCode(42), "");
}

}  // namespace
}  // namespace vox::platform
