// The control channel: what the run's control window does with its commands.
//
// A run opens one window and the host steers the job through it with numbered commands
// (SendEngineControl in vox_host.h). The window's mechanics are the platform's (on Windows
// a hidden window and a registered message, on POSIX a generation number; see platform.h):
// a command sent on a window that has been closed, or one that never existed, finds nothing
// and returns 0, so handles stay harmless for the life of the process.
//
// Threads: every function may be called from any thread. Commands touch only the run state's
// atomics, so a command that races with the window's closing is still harmless. On Windows
// commands run on the window's thread, which must keep handling messages while a job runs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

namespace vox {

// Command numbers of the control channel.
enum ControlCommand : uint32_t {
  kCommandBreak = 0,
  kCommandPause = 1,
  kCommandResume = 2,
  kCommandProgress = 3,
  kCommandPing = 4,
  kCommandElapsed = 5,
  kCommandThreadId = 6,
  kCommandExitCode = 7,
  kCommandCallback = 8,
};

// The title a window has until the pipeline names it after the job.
inline constexpr const char* kInitialWindowTitle = "EngineControlWindow";

// Opens a new window on the calling thread, closing the one that is open (a failed job may
// leave its window open until the next run). Returns its handle; 0 when the window cannot be
// made, after tracing why ("Can not register window class", "Can not create window").
uint64_t OpenControlWindow();
// Closes the open window, if handle is that window; later commands on it return 0. A pause
// still in force is dropped with it. On Windows this waits until the window's thread has
// handled the close.
void CloseControlWindow(uint64_t handle);
bool ControlWindowIsOpen(uint64_t handle);
// The handle of the open window, 0 if none.
uint64_t CurrentWindow();
// True for the handle of the most recently opened window, open or closed.
bool IsLatestWindow(uint64_t handle);
void SetControlWindowTitle(uint64_t handle, const std::string& title);
// Copies the title (cut to fit, always terminated when capacity > 0) and returns its full
// length; 0 for a closed window.
size_t GetControlWindowTitle(uint64_t handle, char* buffer, size_t capacity);

// Carries out one command on the window; 0 when the window is not open or the command is
// unknown. Command 8 (callback registration) is also taken on the latest window after it
// has closed, so a host that registers right after its run call cannot miss the end.
uint32_t SendControlCommand(uint64_t handle, uint32_t command, uintptr_t argument);

}  // namespace vox
