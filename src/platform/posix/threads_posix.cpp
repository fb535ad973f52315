// POSIX implementation of platform.h: threads, the binary semaphore and thread-local slots.
//
// Every thread started here shares one process-wide mutex and condition variable that
// signal "some thread has ended". That lets WaitAnyThread wait for any of several threads
// with one timed wait, which per-thread condition variables could not do; the few threads
// the library runs at once (at most 33) make the shared wake-ups cheap.
#include <pthread.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <climits>
#include <condition_variable>
#include <mutex>

#include "platform/platform.h"

namespace vox::platform {
namespace {

constexpr uint32_t kStillActive = 259;
constexpr uint32_t kNoLimit = UINT32_MAX;

// Never destroyed: a thread still running at process exit may signal its end after the
// static destructors have run.
std::mutex& EndMutex() {
  static auto* mutex = new std::mutex;
  return *mutex;
}
std::condition_variable& EndSignal() {
  static auto* signal = new std::condition_variable;
  return *signal;
}

// Shared by the Thread object and the running thread; the last of the two frees it.
struct ThreadState {
  ThreadProc proc = nullptr;
  void* argument = nullptr;
  // Guarded by EndMutex().
  uint32_t id = 0;
  bool id_known = false;
  bool ended = false;
  uint32_t status = kStillActive;
};

void* ThreadMain(void* raw) {
  auto* holder = static_cast<std::shared_ptr<ThreadState>*>(raw);
  std::shared_ptr<ThreadState> state = std::move(*holder);
  delete holder;
  {
    std::lock_guard lock(EndMutex());
    state->id = CurrentThreadId();
    state->id_known = true;
  }
  EndSignal().notify_all();
  uint32_t status = state->proc(state->argument);
  {
    std::lock_guard lock(EndMutex());
    state->status = status;
    state->ended = true;
  }
  EndSignal().notify_all();
  return nullptr;
}

// Waits on EndSignal() until done() holds or timeout_ms has passed; the lock must be held.
template <typename Done>
bool WaitUntil(std::unique_lock<std::mutex>& lock, uint32_t timeout_ms, Done done) {
  if (timeout_ms == kNoLimit) {
    EndSignal().wait(lock, done);
    return true;
  }
  return EndSignal().wait_for(lock, std::chrono::milliseconds(timeout_ms), done);
}

class PosixThread final : public Thread {
 public:
  PosixThread(pthread_t handle, std::shared_ptr<ThreadState> state)
      : handle_(handle), state_(std::move(state)) {}
  ~PosixThread() override {
    if (!joined_) pthread_detach(handle_);
  }

  uint32_t id() const override {
    std::lock_guard lock(EndMutex());
    return state_->id;
  }

  bool Wait(uint32_t timeout_ms) override {
    {
      std::unique_lock lock(EndMutex());
      if (!WaitUntil(lock, timeout_ms, [this] { return state_->ended; })) return false;
    }
    // The proc has returned; joining also waits for the thread-local destructors, so that
    // whatever the thread released at its end is released when Wait reports the end.
    if (!joined_) {
      pthread_join(handle_, nullptr);
      joined_ = true;
    }
    return true;
  }

  bool HasEnded() const override {
    std::lock_guard lock(EndMutex());
    return state_->ended;
  }

  uint32_t ExitStatus() const override {
    std::lock_guard lock(EndMutex());
    return state_->ended ? state_->status : kStillActive;
  }

  bool EndedLocked() const { return state_->ended; }

 private:
  pthread_t handle_;
  std::shared_ptr<ThreadState> state_;
  bool joined_ = false;
};

size_t AcceptableStackSize(size_t requested) {
  long page = sysconf(_SC_PAGESIZE);
  if (page <= 0) page = 4096;
  size_t minimum = PTHREAD_STACK_MIN;
  size_t size = requested < minimum ? minimum : requested;
  size_t page_bytes = static_cast<size_t>(page);
  return (size + page_bytes - 1) / page_bytes * page_bytes;
}

}  // namespace

std::unique_ptr<Thread> StartThread(ThreadProc proc, void* argument, size_t stack_bytes) {
  auto state = std::make_shared<ThreadState>();
  state->proc = proc;
  state->argument = argument;

  pthread_attr_t attributes;
  if (pthread_attr_init(&attributes) != 0) return nullptr;
  pthread_attr_setstacksize(&attributes, AcceptableStackSize(stack_bytes));
  auto* holder = new std::shared_ptr<ThreadState>(state);
  pthread_t handle;
  int error = pthread_create(&handle, &attributes, ThreadMain, holder);
  pthread_attr_destroy(&attributes);
  if (error != 0) {
    delete holder;
    errno = error;
    return nullptr;
  }
  // Callers record the id at once (the job thread id), so wait until the thread knows it.
  {
    std::unique_lock lock(EndMutex());
    EndSignal().wait(lock, [&] { return state->id_known; });
  }
  return std::make_unique<PosixThread>(handle, std::move(state));
}

uint32_t CurrentThreadId() {
  // The kernel's thread id: unique among live threads and never 0, as TLock needs. Not
  // cached, so that a forked child sees its own id.
  return static_cast<uint32_t>(syscall(SYS_gettid));
}

int WaitAnyThread(Thread* const* threads, size_t count, uint32_t timeout_ms) {
  int found = -1;
  auto any_ended = [&] {
    for (size_t i = 0; i < count; ++i) {
      auto* thread = static_cast<PosixThread*>(threads[i]);
      if (thread != nullptr && thread->EndedLocked()) {
        found = static_cast<int>(i);
        return true;
      }
    }
    return false;
  };
  std::unique_lock lock(EndMutex());
  return WaitUntil(lock, timeout_ms, any_ended) ? found : -1;
}

// ---------------------------------------------------------------- Semaphore

struct Semaphore::State {
  std::mutex mutex;
  std::condition_variable signal;
  bool available = false;
};

Semaphore::Semaphore(bool initially_available) : state_(std::make_unique<State>()) {
  state_->available = initially_available;
}

Semaphore::~Semaphore() = default;

void Semaphore::Acquire() {
  std::unique_lock lock(state_->mutex);
  state_->signal.wait(lock, [this] { return state_->available; });
  state_->available = false;
}

bool Semaphore::TryAcquire(uint32_t timeout_ms) {
  std::unique_lock lock(state_->mutex);
  auto ready = [this] { return state_->available; };
  if (timeout_ms == kNoLimit) {
    state_->signal.wait(lock, ready);
  } else if (!state_->signal.wait_for(lock, std::chrono::milliseconds(timeout_ms), ready)) {
    return false;
  }
  state_->available = false;
  return true;
}

void Semaphore::Release() {
  {
    std::lock_guard lock(state_->mutex);
    state_->available = true;  // binary: a second release before an acquire is absorbed
  }
  state_->signal.notify_one();
}

// ---------------------------------------------------------------- ThreadLocalSlot

ThreadLocalSlot::ThreadLocalSlot(void (*release)(void* value)) : key_(0) {
  pthread_key_t key;
  if (pthread_key_create(&key, release) == 0) key_ = static_cast<uintptr_t>(key) + 1;
}

ThreadLocalSlot::~ThreadLocalSlot() {
  if (key_ != 0) pthread_key_delete(static_cast<pthread_key_t>(key_ - 1));
}

void* ThreadLocalSlot::Get() const {
  return key_ != 0 ? pthread_getspecific(static_cast<pthread_key_t>(key_ - 1)) : nullptr;
}

void ThreadLocalSlot::Set(void* value) {
  if (key_ != 0) pthread_setspecific(static_cast<pthread_key_t>(key_ - 1), value);
}

}  // namespace vox::platform
