// The library-wide run state: one instance per loaded library, shared by the run calls (host
// threads), the control channel (any host thread), the job thread and every engine thread.
//
// Every field is a single atomic word, so readers never see a torn value and no lock is
// needed: the break flag is written by control commands and read by the job and engine
// threads; progress only rises (compare-and-swap); the current task is set and cleared by the
// job thread; the host callback is registered once and never cleared. Job start and end times
// are written by the job thread and read by control command 5.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>

#include "base/gps_time.h"

namespace vox {

struct TTask;

// Exit codes of a job.
enum ExitCode : uint32_t {
  kExitDone = 0,
  kExitJobFileUnreadable = 5,
  kExitParseFailed = 6,
  kExitResultFileFailed = 7,
  kExitPreparationFailed = 8,
  kExitThreadFailed = 9,
  kExitBreak = 10,
  kExitCloseFailed = 11,
  kExitStillActive = 259,
};

// The host callback: (context, code, value); code 3 reports progress, code 7 the exit code.
using HostCallbackFn = void (*)(void* context, uint32_t code, uint32_t value);
constexpr uint32_t kCallbackProgress = 3;
constexpr uint32_t kCallbackExitCode = 7;

struct RunState {
  std::atomic<TTask*> current_task{nullptr};
  std::atomic<uint32_t> break_flag{0};
  std::atomic<uint32_t> pause_flag{0};
  std::atomic<uint32_t> progress{0};
  std::atomic<uint32_t> job_thread_id{0};
  std::atomic<uint32_t> exit_code{kExitStillActive};
  // Set by a run call that passed the busy check, cleared by the thread epilogue (or by the
  // run call itself when its thread cannot start). Makes "busy" cover the whole run, not
  // only the span in which the task exists.
  std::atomic<bool> run_in_flight{false};
  // GPS week in the high half, millisecond of week in the low half; 0 before any job.
  std::atomic<uint64_t> job_start{0};
  std::atomic<uint64_t> job_end{0};
};

RunState& TheRun();

// Registers the host callback unless one is registered already; true when registered now.
bool RegisterHostCallback(HostCallbackFn fn, void* context);
// Calls the registered callback, if any.
void NotifyHost(uint32_t code, uint32_t value);

// Raises the job progress to percent if that is higher than the current value and tells the
// host; lower or equal values are dropped. Safe from any thread.
void RaiseProgress(uint32_t percent);

void StoreJobStart(const GpsWeekTime& t);
void StoreJobEnd(const GpsWeekTime& t);
// Control command 5: whole seconds since the job started while a task exists, otherwise the
// length of the last job (0 before any job).
uint32_t ElapsedSeconds();

// Name and result path of the most recent job, kept after it ends until the next run starts
// (empty until the job file has been parsed). Guarded by a mutex; any thread.
struct JobLabels {
  std::string name;
  std::string result_path;
};
void StoreJobLabels(JobLabels labels);
JobLabels LastJobLabels();

}  // namespace vox
