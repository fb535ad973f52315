// Win32 implementation of platform.h: threads, the binary semaphore and thread-local slots.
#include <process.h>
#include <windows.h>

#include <vector>

#include "platform/platform.h"

namespace vox::platform {
namespace {

constexpr uint32_t kNoLimit = UINT32_MAX;

struct StartBlock {
  ThreadProc proc;
  void* argument;
};

unsigned __stdcall ThreadMain(void* raw) {
  StartBlock block = *static_cast<StartBlock*>(raw);
  delete static_cast<StartBlock*>(raw);
  return block.proc(block.argument);
}

DWORD WaitTime(uint32_t timeout_ms) {
  return timeout_ms == kNoLimit ? INFINITE : static_cast<DWORD>(timeout_ms);
}

class Win32Thread final : public Thread {
 public:
  Win32Thread(HANDLE handle, uint32_t id) : handle_(handle), id_(id) {}
  ~Win32Thread() override { CloseHandle(handle_); }
  Win32Thread(const Win32Thread&) = delete;
  Win32Thread& operator=(const Win32Thread&) = delete;

  uint32_t id() const override { return id_; }
  bool Wait(uint32_t timeout_ms) override {
    return WaitForSingleObject(handle_, WaitTime(timeout_ms)) == WAIT_OBJECT_0;
  }
  bool HasEnded() const override { return WaitForSingleObject(handle_, 0) == WAIT_OBJECT_0; }
  uint32_t ExitStatus() const override {
    DWORD status = STILL_ACTIVE;
    if (!GetExitCodeThread(handle_, &status)) return STILL_ACTIVE;
    return status;
  }
  HANDLE handle() const { return handle_; }

 private:
  HANDLE handle_;
  uint32_t id_;
};

}  // namespace

// Exposed to the control window's wait loop, which waits on the handle itself.
void* NativeThreadHandle(Thread& thread) {
  return static_cast<Win32Thread&>(thread).handle();
}

std::unique_ptr<Thread> StartThread(ThreadProc proc, void* argument, size_t stack_bytes) {
  auto* block = new StartBlock{proc, argument};
  unsigned id = 0;
  // The size is what the system commits at once; the reservation is the larger of it and the
  // program's default, so a thread asking for 64 KiB never has less than that.
  auto raw = _beginthreadex(nullptr, static_cast<unsigned>(stack_bytes), ThreadMain, block, 0, &id);
  if (raw == 0) {
    delete block;
    return nullptr;
  }
  return std::make_unique<Win32Thread>(reinterpret_cast<HANDLE>(raw), id);
}

uint32_t CurrentThreadId() {
  return GetCurrentThreadId();
}

int WaitAnyThread(Thread* const* threads, size_t count, uint32_t timeout_ms) {
  std::vector<HANDLE> handles;
  std::vector<int> index;
  for (size_t i = 0; i < count; ++i) {
    if (threads[i] == nullptr) continue;
    handles.push_back(static_cast<Win32Thread*>(threads[i])->handle());
    index.push_back(static_cast<int>(i));
  }
  if (handles.empty()) {
    Sleep(timeout_ms == kNoLimit ? 0 : timeout_ms);
    return -1;
  }
  // The system waits for at most 64 handles at once; the library never runs more than 33.
  if (handles.size() > MAXIMUM_WAIT_OBJECTS) handles.resize(MAXIMUM_WAIT_OBJECTS);
  DWORD got = WaitForMultipleObjects(static_cast<DWORD>(handles.size()), handles.data(), FALSE,
                                     WaitTime(timeout_ms));
  if (got < WAIT_OBJECT_0 + handles.size()) return index[got - WAIT_OBJECT_0];
  return -1;
}

// ---------------------------------------------------------------- Semaphore

struct Semaphore::State {
  HANDLE handle = nullptr;
};

Semaphore::Semaphore(bool initially_available) : state_(std::make_unique<State>()) {
  state_->handle = CreateSemaphoreW(nullptr, initially_available ? 1 : 0, 1, nullptr);
}

Semaphore::~Semaphore() {
  if (state_->handle != nullptr) CloseHandle(state_->handle);
}

void Semaphore::Acquire() {
  WaitForSingleObject(state_->handle, INFINITE);
}

bool Semaphore::TryAcquire(uint32_t timeout_ms) {
  return WaitForSingleObject(state_->handle, WaitTime(timeout_ms)) == WAIT_OBJECT_0;
}

void Semaphore::Release() {
  // At its maximum of 1 the system refuses the release: a second release before an acquire
  // is absorbed, as a binary semaphore should.
  ReleaseSemaphore(state_->handle, 1, nullptr);
}

// ---------------------------------------------------------------- ThreadLocalSlot

// A fiber-local slot with a release callback: the system calls it with the slot's value when
// a thread that set one ends, in a DLL and in a program alike. (Plain TLS slots would need
// the DLL's thread notifications, which a program linking the library statically never gets.)
ThreadLocalSlot::ThreadLocalSlot(void (*release)(void* value)) : key_(0) {
  DWORD index = FlsAlloc(reinterpret_cast<PFLS_CALLBACK_FUNCTION>(release));
  if (index != FLS_OUT_OF_INDEXES) key_ = static_cast<uintptr_t>(index) + 1;
}

ThreadLocalSlot::~ThreadLocalSlot() {
  if (key_ != 0) FlsFree(static_cast<DWORD>(key_ - 1));
}

void* ThreadLocalSlot::Get() const {
  return key_ != 0 ? FlsGetValue(static_cast<DWORD>(key_ - 1)) : nullptr;
}

void ThreadLocalSlot::Set(void* value) {
  if (key_ != 0) FlsSetValue(static_cast<DWORD>(key_ - 1), value);
}

}  // namespace vox::platform
