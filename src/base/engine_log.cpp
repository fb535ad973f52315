#include "base/engine_log.h"

#include <atomic>
#include <memory>
#include <mutex>

#include "platform/platform.h"

namespace vox {

namespace {

// The open log, shared by reference: a writer holds the file for the length of one write,
// and a replaced log is closed when its last writer lets go. No writer ever writes into a
// closed file, and replacing the log never waits for writers.
struct LogFile {
  explicit LogFile(FILE* f) : file(f) {}
  ~LogFile() { std::fclose(file); }
  FILE* file;
};
// g_log is guarded by g_log_mutex, held only to copy or swap the pointer (never while
// writing or closing a file). Not std::atomic<std::shared_ptr>: the standard library of
// g++ 12 releases that one's internal lock with relaxed order after a load, which leaves a
// load and a later store unordered (a data race the thread sanitizer reports).
std::mutex g_log_mutex;
std::shared_ptr<LogFile> g_log;

std::shared_ptr<LogFile> CurrentLog() {
  std::lock_guard lock(g_log_mutex);
  return g_log;
}
// Lets tracing with no log open cost one atomic load.
std::atomic<bool> g_log_open{false};
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
  return platform::OpenTextFileForWriting(path);
}

// Installs file as the log; the previous one is closed once no writer uses it.
void ReplaceLog(FILE* file) {
  std::shared_ptr<LogFile> next = file ? std::make_shared<LogFile>(file) : nullptr;
  g_log_open.store(next != nullptr, std::memory_order_release);
  {
    std::lock_guard lock(g_log_mutex);
    g_log.swap(next);
  }
  // next now holds the previous log, closed here (outside the lock) unless a writer still
  // uses it.
}

}  // namespace

void TraceV(const char* format, va_list arguments) {
  if (format == nullptr || !g_log_open.load(std::memory_order_acquire)) return;
  const std::shared_ptr<LogFile> log = CurrentLog();
  if (log) std::vfprintf(log->file, format, arguments);
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
  return CurrentLog() != nullptr;
}

FILE* OpenSideLog(std::string* path) {
  const std::string chosen = ChooseLogPath();
  if (path) *path = chosen;
  return OpenLogFile(chosen);
}

}  // namespace vox
