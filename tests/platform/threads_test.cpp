#include <gtest/gtest.h>
#include <pthread.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "platform/platform.h"

namespace vox::platform {
namespace {

struct Gate {
  Semaphore open{false};
  std::atomic<uint32_t> id{0};
  size_t stack_bytes = 0;
};

uint32_t WaitAtGate(void* argument) {
  auto* gate = static_cast<Gate*>(argument);
  gate->id = CurrentThreadId();
  pthread_attr_t attributes;
  if (pthread_getattr_np(pthread_self(), &attributes) == 0) {
    pthread_attr_getstacksize(&attributes, &gate->stack_bytes);
    pthread_attr_destroy(&attributes);
  }
  gate->open.Acquire();
  return 7;
}

TEST(Thread, RunsWithItsStackReportsItsIdAndExitStatusOnlyAfterTheEnd) {
  Gate gate;
  auto thread = StartThread(WaitAtGate, &gate, 0x10000);
  ASSERT_NE(thread, nullptr);
  // The id is known as soon as the thread has been started.
  EXPECT_NE(thread->id(), 0u);
  EXPECT_NE(thread->id(), CurrentThreadId());

  EXPECT_FALSE(thread->Wait(20));
  EXPECT_FALSE(thread->HasEnded());
  EXPECT_EQ(thread->ExitStatus(), 259u);

  gate.open.Release();
  EXPECT_TRUE(thread->Wait(UINT32_MAX));
  EXPECT_TRUE(thread->HasEnded());
  EXPECT_EQ(thread->ExitStatus(), 7u);
  EXPECT_EQ(thread->id(), gate.id.load());
  EXPECT_GE(gate.stack_bytes, 0x10000u);
  EXPECT_LT(gate.stack_bytes, 0x40000u);
}

TEST(WaitAnyThread, TimesOutWhileAllRunAndNamesTheOneThatEnded) {
  Gate first, second;
  auto a = StartThread(WaitAtGate, &first, 0x10000);
  auto b = StartThread(WaitAtGate, &second, 0x10000);
  ASSERT_TRUE(a && b);
  Thread* threads[] = {a.get(), nullptr, b.get()};

  auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(WaitAnyThread(threads, 3, 50), -1);
  EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(45));

  second.open.Release();
  EXPECT_EQ(WaitAnyThread(threads, 3, 5000), 2);
  first.open.Release();
  EXPECT_TRUE(a->Wait(UINT32_MAX));
  EXPECT_TRUE(b->Wait(UINT32_MAX));
}

TEST(Semaphore, IsBinaryAndWakesAWaiterOnAnotherThread) {
  Semaphore semaphore(true);
  EXPECT_TRUE(semaphore.TryAcquire(0));
  EXPECT_FALSE(semaphore.TryAcquire(10));

  // Two releases before an acquire leave one token, not two.
  semaphore.Release();
  semaphore.Release();
  EXPECT_TRUE(semaphore.TryAcquire(0));
  EXPECT_FALSE(semaphore.TryAcquire(0));

  std::atomic<bool> through{false};
  std::thread waiter([&] {
    semaphore.Acquire();
    through = true;
  });
  std::this_thread::sleep_for(std::chrono::milliseconds(20));
  EXPECT_FALSE(through);
  semaphore.Release();
  waiter.join();
  EXPECT_TRUE(through);
}

std::atomic<int> g_released_sum{0};
std::atomic<int> g_release_calls{0};

void CountRelease(void* value) {
  g_released_sum += *static_cast<int*>(value);
  ++g_release_calls;
}

struct SlotUse {
  ThreadLocalSlot* slot;
  int value;
  void* seen_before = nullptr;
  void* seen_after = nullptr;
};

uint32_t UseSlot(void* argument) {
  auto* use = static_cast<SlotUse*>(argument);
  use->seen_before = use->slot->Get();
  use->slot->Set(&use->value);
  use->seen_after = use->slot->Get();
  return 0;
}

TEST(ThreadLocalSlot, KeepsOneValuePerThreadAndReleasesItWhenTheThreadEnds) {
  g_released_sum = 0;
  g_release_calls = 0;
  ThreadLocalSlot slot(CountRelease);
  int mine = 1000;
  slot.Set(&mine);

  SlotUse a{&slot, 3}, b{&slot, 40};
  auto ta = StartThread(UseSlot, &a, 0x10000);
  auto tb = StartThread(UseSlot, &b, 0x10000);
  ASSERT_TRUE(ta && tb);
  EXPECT_TRUE(ta->Wait(UINT32_MAX));
  EXPECT_TRUE(tb->Wait(UINT32_MAX));

  EXPECT_EQ(a.seen_before, nullptr);
  EXPECT_EQ(a.seen_after, &a.value);
  // Released once each, at the end of the threads that set it; ours stays.
  EXPECT_EQ(g_release_calls, 2);
  EXPECT_EQ(g_released_sum, 43);
  EXPECT_EQ(slot.Get(), &mine);
  slot.Set(nullptr);
}

}  // namespace
}  // namespace vox::platform
