// POSIX implementation of platform.h: the control window.
//
// There are no window messages here, so a window is a generation number: the layer keeps
// only the generation of the window that is open now, and a command sent on any other handle
// (a window that has been closed, or one that never existed) finds nothing and returns 0.
// Handles therefore stay harmless for the life of the process. Commands run on the sender's
// thread; a pause holds nobody up.
//
// The open generation and the title are guarded by a mutex.
#include <cstring>
#include <mutex>

#include "platform/platform.h"

namespace vox::platform {
namespace {

constexpr const char* kInitialTitle = "EngineControlWindow";

struct Channel {
  std::mutex mutex;
  ControlWindowProcs procs;
  uintptr_t last_generation = 0;
  uintptr_t open = 0;  // 0: no window open
  std::string title;
};

Channel& TheChannel() {
  static Channel channel;
  return channel;
}

}  // namespace

void SetControlWindowProcs(const ControlWindowProcs& procs) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  c.procs = procs;
}

ControlWindowOpened OpenControlWindow() {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  c.open = ++c.last_generation;
  c.title = kInitialTitle;
  ControlWindowOpened opened;
  opened.handle = c.open;
  return opened;
}

void CloseControlWindow(uintptr_t handle) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  if (handle == 0 || handle != c.open) return;
  c.open = 0;
  c.title.clear();
}

bool ControlWindowIsOpen(uintptr_t handle) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  return handle != 0 && handle == c.open;
}

uintptr_t CurrentControlWindow() {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  return c.open;
}

bool IsLatestControlWindow(uintptr_t handle) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  return handle != 0 && handle == c.last_generation;
}

void SetControlWindowTitle(uintptr_t handle, const std::string& title) {
  Channel& c = TheChannel();
  std::lock_guard lock(c.mutex);
  if (handle != 0 && handle == c.open) c.title = title;
}

size_t GetControlWindowTitle(uintptr_t handle, char* buffer, size_t capacity) {
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

uint32_t SendControlMessage(uintptr_t handle, uint32_t command, uintptr_t argument) {
  ControlWindowProcs procs;
  {
    Channel& c = TheChannel();
    std::lock_guard lock(c.mutex);
    if (handle == 0 || handle != c.open || c.procs.execute == nullptr) return 0;
    procs = c.procs;
  }
  // Outside the lock: a command may register a callback that the host then calls, and the
  // host may send another command from it.
  return procs.execute(command, argument);
}

void PumpPendingMessages() {}

void WaitForThreadHandlingMessages(Thread& thread) {
  thread.Wait(UINT32_MAX);
}

}  // namespace vox::platform
