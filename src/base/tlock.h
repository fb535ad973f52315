// TLock: the library's recursive lock with a diagnostic name ("solution", "leap_seconds").
//
// Uncontended acquires and releases cost one atomic operation each; only a thread that
// finds the lock taken sleeps on the semaphore, and a release wakes a sleeper only when one
// is (or is about to be) waiting. The owner may acquire again; the lock is free once it has
// released as often as it acquired.
//
// Who may call what: any thread may Acquire; only the owning thread may Release. Close (also
// run by the destructor) is for the lock's owner object alone, when no thread holds or waits
// for the lock; the lock must not be used after it. The counter and the owner id are shared
// between threads (atomics); the depth is touched only by the owner.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "platform/platform.h"

namespace vox {

class TLock {
 public:
  explicit TLock(const char* name);
  ~TLock();
  TLock(const TLock&) = delete;
  TLock& operator=(const TLock&) = delete;

  void Acquire();
  void Release();
  void Close();

  const char* name() const { return name_; }
  // The thread that holds the lock, 0 if none (for checks and diagnostics).
  uint32_t owner() const { return owner_.load(std::memory_order_relaxed); }

 private:
  // Taken by a thread that has to wait, given by the release that hands the lock over.
  std::unique_ptr<platform::Semaphore> semaphore_;
  const char* name_;
  // -1 when free; otherwise the number of acquires in progress or held, minus one.
  std::atomic<int32_t> contention_{-1};
  uint32_t depth_ = 0;
  std::atomic<uint32_t> owner_{0};
};

// Holds a TLock for the lifetime of the guard.
class TLockGuard {
 public:
  explicit TLockGuard(TLock& lock) : lock_(lock) { lock_.Acquire(); }
  ~TLockGuard() { lock_.Release(); }
  TLockGuard(const TLockGuard&) = delete;
  TLockGuard& operator=(const TLockGuard&) = delete;

 private:
  TLock& lock_;
};

}  // namespace vox
