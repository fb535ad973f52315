#include "base/tlock.h"

namespace vox {

// The semaphore starts taken: the first acquirer becomes owner through the counter alone,
// so a token in the semaphore would let the first waiter in beside it.
TLock::TLock(const char* name)
    : semaphore_(std::make_unique<platform::Semaphore>(false)), name_(name) {}

TLock::~TLock() {
  Close();
}

void TLock::Acquire() {
  uint32_t self = platform::CurrentThreadId();
  if (contention_.fetch_add(1, std::memory_order_acquire) + 1 != 0) {
    if (owner_.load(std::memory_order_relaxed) == self) {
      ++depth_;  // the counter stays raised until the matching release
      return;
    }
    semaphore_->Acquire();
  }
  owner_.store(self, std::memory_order_relaxed);
  depth_ = 1;
}

void TLock::Release() {
  if (--depth_ > 0) {
    contention_.fetch_sub(1, std::memory_order_release);
    return;
  }
  owner_.store(0, std::memory_order_relaxed);
  if (contention_.fetch_sub(1, std::memory_order_acq_rel) >= 1) semaphore_->Release();
}

void TLock::Close() {
  semaphore_.reset();
}

}  // namespace vox
