#include "run/control_channel.h"

#include <mutex>

#include "base/engine_log.h"
#include "platform/platform.h"
#include "run/current_task.h"
#include "run/run_state.h"

namespace vox {

namespace {

// Layout of the pair a host hands to command 8 (vox_HostCallbackPair in vox_host.h).
struct CallbackPair {
  HostCallbackFn fn;
  void* context;
};

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

uint32_t Execute(uint32_t command, uintptr_t argument) {
  RunState& run = TheRun();
  switch (command) {
    case kCommandBreak:
      run.break_flag.store(1);
      return 0;
    case kCommandPause:
      // The sender has been released already where the OS can do that; the window's own
      // thread then stays in the pause loop until the flag is cleared (see vox_host.h).
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

bool Paused() {
  return TheRun().pause_flag.load() != 0;
}

// The window layer learns what the commands do, and the message operation of the engine
// log pumps the window's messages, before the first window opens.
void Connect() {
  static std::once_flag connected;
  std::call_once(connected, [] {
    platform::ControlWindowProcs procs;
    procs.execute = Execute;
    procs.paused = Paused;
    platform::SetControlWindowProcs(procs);
    SetMessagePump(platform::PumpPendingMessages);
  });
}

}  // namespace

uint64_t OpenControlWindow() {
  Connect();
  TheRun().pause_flag.store(0);
  const platform::ControlWindowOpened opened = platform::OpenControlWindow();
  switch (opened.failure) {
    case platform::ControlWindowFailure::kNone:
      break;
    case platform::ControlWindowFailure::kRegisterClass:
      Trace("Can not registered class / errno=%u\n", opened.error);
      Trace("Can not register window class\n");
      break;
    case platform::ControlWindowFailure::kCreateWindow:
      Trace("Can not create window\n");
      break;
  }
  return opened.handle;
}

void CloseControlWindow(uint64_t handle) {
  if (handle == 0 || handle != platform::CurrentControlWindow()) return;
  platform::CloseControlWindow(static_cast<uintptr_t>(handle));
  // A pause left standing would outlive the window that could have lifted it; drop it with
  // the window.
  TheRun().pause_flag.store(0);
}

bool ControlWindowIsOpen(uint64_t handle) {
  return platform::ControlWindowIsOpen(static_cast<uintptr_t>(handle));
}

uint64_t CurrentWindow() {
  return platform::CurrentControlWindow();
}

void SetControlWindowTitle(uint64_t handle, const std::string& title) {
  platform::SetControlWindowTitle(static_cast<uintptr_t>(handle), title);
}

size_t GetControlWindowTitle(uint64_t handle, char* buffer, size_t capacity) {
  return platform::GetControlWindowTitle(static_cast<uintptr_t>(handle), buffer, capacity);
}

bool IsLatestWindow(uint64_t handle) {
  return platform::IsLatestControlWindow(static_cast<uintptr_t>(handle));
}

uint32_t SendControlCommand(uint64_t handle, uint32_t command, uintptr_t argument) {
  // Registration is the one command the latest handle still takes after its job has ended:
  // a host registers right after the run call, and a job may end before it gets there. The
  // callback it registers is told the exit code at once.
  if (command == kCommandCallback && IsLatestWindow(handle) && !ControlWindowIsOpen(handle))
    return RegisterCallback(argument);
  return platform::SendControlMessage(static_cast<uintptr_t>(handle), command, argument);
}

}  // namespace vox
