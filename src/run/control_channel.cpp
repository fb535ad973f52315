#include "run/control_channel.h"

#include <cstring>
#include <mutex>

#include "run/current_task.h"
#include "run/run_state.h"

namespace vox {

namespace {

// Layout of the pair a host hands to command 8 (vox_HostCallbackPair in vox_host.h).
struct CallbackPair {
  HostCallbackFn fn;
  void* context;
};

struct Channel {
  std::mutex mutex;
  uint64_t last_generation = 0;
  uint64_t open = 0;  // 0: no window open
  std::string title;
};

Channel& TheChannel() {
  static Channel channel;
  return channel;
}

uint32_t RegisterCallback(uintptr_t argument) {
  const auto* pair = reinterpret_cast<const CallbackPair*>(argument);
  if (pair == nullptr) return kCommandCallback;
  RegisterHostCallback(pair->fn, pair->context);
  // The caller's own function is told at once when the job has already ended, whether or
  // not it became the registered one.
  const uint32_t exit_code = TheRun().exit_code.load();
  if (pair->fn != nullptr && exit_code != kExitStillActive)
    pair->fn(pair->context, kCallbackExitCode, exit_code);
  return kCommandCallback;
}

}  // namespace

uint64_t OpenControlWindow() {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  c.open = ++c.last_generation;
  c.title = kInitialWindowTitle;
  TheRun().pause_flag.store(0);
  return c.open;
}

void CloseControlWindow(uint64_t handle) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  if (handle == 0 || handle != c.open) return;
  c.open = 0;
  c.title.clear();
  // Nothing waits on a pause here, but a pause left standing would outlive the window that
  // could have lifted it; drop it with the window.
  TheRun().pause_flag.store(0);
}

bool ControlWindowIsOpen(uint64_t handle) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  return handle != 0 && handle == c.open;
}

uint64_t CurrentWindow() {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  return c.open;
}

void SetControlWindowTitle(uint64_t handle, const std::string& title) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  if (handle != 0 && handle == c.open) c.title = title;
}

size_t GetControlWindowTitle(uint64_t handle, char* buffer, size_t capacity) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  if (handle == 0 || handle != c.open) {
    if (buffer != nullptr && capacity > 0) buffer[0] = '\0';
    return 0;
  }
  if (buffer != nullptr && capacity > 0) {
    const size_t n = c.title.size() < capacity - 1 ? c.title.size() : capacity - 1;
    std::memcpy(buffer, c.title.data(), n);
    buffer[n] = '\0';
  }
  return c.title.size();
}

bool IsLatestWindow(uint64_t handle) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  return handle != 0 && handle == c.last_generation;
}

uint32_t SendControlCommand(uint64_t handle, uint32_t command, uintptr_t argument) {
  // Registration is the one command the latest handle still takes after its job has ended:
  // a host registers right after the run call, and a job may end before it gets there. The
  // callback it registers is told the exit code at once.
  if (command == kCommandCallback && IsLatestWindow(handle)) return RegisterCallback(argument);
  if (!ControlWindowIsOpen(handle)) return 0;
  RunState& run = TheRun();
  switch (command) {
    case kCommandBreak:
      run.break_flag.store(1);
      return 0;
    case kCommandPause:
      // The sender is released at once; the flag is all a pause amounts to here (see
      // vox_host.h).
      run.pause_flag.store(1);
      return 1;
    case kCommandResume:
      run.pause_flag.store(0);
      return 2;
    case kCommandProgress:
      return run.progress.load();
    case kCommandPing:
      return 4;
    case kCommandElapsed:
      return ElapsedSeconds();
    case kCommandThreadId:
      return run.job_thread_id.load();
    case kCommandExitCode:
      return run.exit_code.load();
    case kCommandCallback:
      return RegisterCallback(argument);
    default:
      return 0;
  }
}

}  // namespace vox
