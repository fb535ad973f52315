#include "run/engine_threads.h"

#include <memory>

#include "base/engine_log.h"
#include "platform/platform.h"
#include "run/control_channel.h"
#include "run/current_task.h"
#include "run/engine_steps.h"
#include "run/run_state.h"
#include "run/task.h"

namespace vox {

namespace {

constexpr uint32_t kOwnThreadFlag = 64;
constexpr uint32_t kProgressCap = 99;

// Null when the writer is neither the task's nor one of its live thread writers. Caller
// holds the solution lock.
TResultFile* KnownThreadWriter(TTask& task, void* writer) {
  auto* w = static_cast<TResultFile*>(writer);
  return task.thread_writers.count(w) != 0 ? w : nullptr;
}

void Report(uint32_t percent) {
  RaiseProgress(percent > kProgressCap ? kProgressCap : percent);
}

}  // namespace

int64_t TaskWriterProgress(uint32_t done_units, uint32_t total_units, int32_t percent) {
  if (total_units == 0 || percent < 0) return -1;
  const uint64_t p = (uint64_t{done_units} * 100 + static_cast<uint32_t>(percent)) / total_units;
  return p > kProgressCap ? kProgressCap : static_cast<int64_t>(p);
}

vox_ThreadContext MakeThreadContext(TTask& task, uint32_t flags, uint32_t id) {
  vox_ThreadContext c{};
  c.flags = flags;
  c.writer = &task.result_file;
  c.control_window = reinterpret_cast<void*>(static_cast<uintptr_t>(CurrentWindow()));
  c.progress = ProgressProc;
  c.message = MessageProc;
  c.id = id;
  return c;
}

uint32_t InitNewThread(TTask& task, vox_ThreadContext* context) {
  if (context == nullptr) return 0;
  platform::SetEngineFloatingPointMode();
  auto writer = std::make_unique<TResultFile>();
  writer->nesting_depth = task.result_file.nesting_depth;
  writer->result_version = task.result_file.result_version;
  writer->set_path(platform::CreateUniqueTempFile(platform::TempFolder(), "VOX"));
  // A file that cannot be created leaves the writer closed: its records are lost, and the
  // merge at release finds nothing; the thread itself carries on.
  if (!writer->path().empty()) writer->OpenThreadFile();

  context->writer = writer.get();
  context->flags |= kOwnThreadFlag;
  context->progress = ProgressProc;
  context->message = MessageProc;
  {
    TLockGuard lock(task.solution_lock);
    task.thread_writers.insert(writer.release());
  }
  Trace("create thread: %p\n", static_cast<void*>(context));
  return 1;
}

uint32_t DeleteThread(TTask& task, vox_ThreadContext* context) {
  Trace("delete thread: %p\n", static_cast<void*>(context));
  if (context == nullptr) return 0;
  std::unique_ptr<TResultFile> writer;
  {
    // Only a writer we handed out is released, and only once: a context released twice, or
    // one that still holds the task's own writer, must not free what it does not own.
    TLockGuard lock(task.solution_lock);
    TResultFile* known = KnownThreadWriter(task, context->writer);
    if (known == nullptr) return 0;
    task.thread_writers.erase(known);
    writer.reset(known);
  }
  context->writer = nullptr;
  writer->Close();
  {
    // The merge writes into the task's file, which other threads write too: occupation and
    // solution records under this same lock. Holding it keeps a merged block from being
    // interleaved with those records (or two threads' blocks with each other).
    TLockGuard lock(task.solution_lock);
    if (!writer->path().empty()) task.result_file.Append(writer->path());
    task.worker_progress_sum += 100u - writer->progress;
  }
  if (!writer->path().empty()) platform::RemoveFile(writer->path());
  return 0;
}

uint32_t VOX_CALL ProgressProc(void* writer, int32_t percent) {
  TTask* task = CurrentTask();
  if (task == nullptr) return CallbackResult(0);
  if (percent >= 0) {
    if (writer == &task->result_file) {
      const int64_t p = TaskWriterProgress(task->done_units, task->total_units, percent);
      if (p >= 0) Report(static_cast<uint32_t>(p));
    } else {
      TLockGuard lock(task->solution_lock);
      if (TResultFile* w = KnownThreadWriter(*task, writer)) {
        const uint32_t value = static_cast<uint32_t>(percent);
        task->worker_progress_sum += value - w->progress;
        w->progress = value;
        if (task->total_units != 0) Report(task->worker_progress_sum / task->total_units);
      }
    }
  }
  PumpMessages();
  BreakCheck(*task);
  return CallbackResult(task->engine_flags());
}

uint32_t VOX_CALL MessageProc(void* writer, uint32_t kind, const char* text) {
  TTask* task = CurrentTask();
  if (task == nullptr) return 0;
  PumpMessages();
  BreakCheck(*task);
  if (writer == nullptr) return 0;
  TResultFile* target = nullptr;
  if (writer == &task->result_file) {
    target = &task->result_file;
  } else {
    TLockGuard lock(task->solution_lock);
    target = KnownThreadWriter(*task, writer);
  }
  if (target == nullptr) return 0;
  target->WriteMessage(text, kind);
  return CallbackResult(task->engine_flags());
}

}  // namespace vox
