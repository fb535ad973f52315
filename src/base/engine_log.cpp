#include "base/engine_log.h"

#include <atomic>
#include <mutex>
#include <shared_mutex>

#include "platform/platform.h"

namespace vox {

namespace {

// The open log. Writers check the pointer without the lock first, so tracing with no log
// open costs one atomic load.
std::atomic<FILE*> g_log{nullptr};
// Held shared while writing and exclusively while the log is replaced or closed.
std::shared_mutex g_log_guard;
std::atomic<void (*)()> g_pump{nullptr};

// Where a run call's log goes: a new "OUT" file in <temp>/engine when that folder exists,
// else the null device, so that tracing costs nothing but writes nowhere.
std::string ChooseLogPath() {
  std::string folder = platform::TempFolder();
  if (folder.empty()) folder = "./";
  const std::string engine_folder = folder + "engine";
  if (platform::DirectoryExists(engine_folder)) {
    std::string path = platform::CreateUniqueTempFile(engine_folder + "/", "OUT");
    if (!path.empty()) return path;
  }
  return platform::NullDevicePath();
}

FILE* OpenLogFile(const std::string& path) {
  return std::fopen(path.c_str(), "w");
}

// Installs file as the log and closes the previous one once no writer uses it.
void ReplaceLog(FILE* file) {
  FILE* previous;
  {
    std::unique_lock lock(g_log_guard);
    previous = g_log.exchange(file);
  }
  if (previous) std::fclose(previous);
}

}  // namespace

void TraceV(const char* format, va_list arguments) {
  if (format == nullptr || g_log.load(std::memory_order_acquire) == nullptr) return;
  std::shared_lock lock(g_log_guard);
  FILE* log = g_log.load(std::memory_order_acquire);
  if (log) std::vfprintf(log, format, arguments);
}

void Trace(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  TraceV(format, arguments);
  va_end(arguments);
}

int Message(int /*level*/, const char* text) {
  PumpMessages();
  Trace("%s\n", text ? text : "");
  return 1;
}

void SetMessagePump(void (*pump)()) {
  g_pump.store(pump);
}

void PumpMessages() {
  if (auto pump = g_pump.load()) pump();
}

std::string OpenEngineLog() {
  const std::string path = ChooseLogPath();
  ReplaceLog(OpenLogFile(path));
  return path;
}

void CloseEngineLog() {
  ReplaceLog(nullptr);
}

bool EngineLogIsOpen() {
  return g_log.load() != nullptr;
}

FILE* OpenSideLog(std::string* path) {
  const std::string chosen = ChooseLogPath();
  if (path) *path = chosen;
  return OpenLogFile(chosen);
}

}  // namespace vox
