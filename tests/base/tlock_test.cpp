#include "base/tlock.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

namespace vox {
namespace {

using std::chrono::milliseconds;

// Starts a thread that takes the lock once and notes when it is through.
std::thread Contender(TLock& lock, std::atomic<bool>& through) {
  return std::thread([&lock, &through] {
    lock.Acquire();
    through = true;
    lock.Release();
  });
}

TEST(TLock, OwnerMayAcquireAgainAndTheLockIsFreeAfterAsManyReleases) {
  TLock lock("solution");
  EXPECT_STREQ(lock.name(), "solution");
  {
    TLockGuard outer(lock);
    TLockGuard inner(lock);
    EXPECT_EQ(lock.owner(), platform::CurrentThreadId());
  }
  EXPECT_EQ(lock.owner(), 0u);

  // Free and with no stray wake-up left behind: another thread gets in at once, and later
  // contention still excludes.
  std::atomic<bool> through{false};
  Contender(lock, through).join();
  EXPECT_TRUE(through);
  lock.Acquire();
  through = false;
  std::thread blocked = Contender(lock, through);
  std::this_thread::sleep_for(milliseconds(50));
  EXPECT_FALSE(through);
  lock.Release();
  blocked.join();
  EXPECT_TRUE(through);
}

TEST(TLock, AWaiterIsWokenByTheOwnersLastReleaseOnly) {
  TLock lock("leap_seconds");
  lock.Acquire();
  lock.Acquire();
  std::atomic<bool> through{false};
  std::thread waiter = Contender(lock, through);
  std::this_thread::sleep_for(milliseconds(50));
  EXPECT_FALSE(through);

  lock.Release();
  std::this_thread::sleep_for(milliseconds(50));
  EXPECT_FALSE(through);

  lock.Release();
  waiter.join();
  EXPECT_TRUE(through);
  EXPECT_EQ(lock.owner(), 0u);
}

TEST(TLock, ExcludesOtherThreadsUnderContention) {
  TLock lock("solution");
  std::atomic<int> inside{0};
  std::atomic<int> overlaps{0};
  long total = 0;  // guarded by lock
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      for (int i = 0; i < 5000; ++i) {
        TLockGuard guard(lock);
        if (inside.fetch_add(1) != 0) ++overlaps;
        if ((i + t) % 7 == 0) {
          TLockGuard again(lock);  // nested use by the owner, as the result writers do
          ++total;
        } else {
          ++total;
        }
        inside.fetch_sub(1);
      }
    });
  }
  for (auto& thread : threads)
    thread.join();
  EXPECT_EQ(overlaps, 0);
  EXPECT_EQ(total, 20000);
  EXPECT_EQ(lock.owner(), 0u);
}

}  // namespace
}  // namespace vox
