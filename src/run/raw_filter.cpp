#include "run/raw_filter.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <memory>

#include "base/engine_log.h"
#include "engine/engine.h"
#include "platform/platform.h"
#include "results/occupation_record.h"
#include "run/engine_call.h"
#include "run/engine_threads.h"
#include "run/run_state.h"
#include "run/task.h"

namespace vox {

namespace {

// How long the job thread waits for workers before it looks at the break flag and its own
// messages again.
constexpr uint32_t kWorkerWaitMs = 1000;

bool BreakRequested() {
  return TheRun().break_flag.load() != 0;
}

// One occupation: the raw filter's call, then the occupation's record. A call that throws or
// faults produced nothing we can trust, so its record is not written.
void ProcessOccupation(TTask& task, TEngine& raw_filter, vox_ThreadContext& context,
                       const TOccupItem& occupation, TResultFile& writer) {
  if (!CallEngineGuarded(raw_filter, "ProcessOccupation",
                         [&] { raw_filter.ProcessOccupation(&context); }))
    return;
  try {
    WriteOccupationRecordLocked(task, writer, occupation);
  } catch (...) {
    // Only memory exhaustion gets here; the record is lost, the run goes on.
    Trace("OCCUP#%08X: occupation record lost\n", occupation.id);
  }
}

// A worker slot: the context the worker's engine call receives, what it works on, and
// whether it is still at work. running is set by the job thread before the worker starts
// and cleared by the worker as its last act (release), so the job thread that sees it clear
// (acquire) also sees everything the worker wrote.
struct WorkerSlot {
  vox_ThreadContext context{};
  TTask* task = nullptr;
  TEngine* engine = nullptr;
  const TOccupItem* occupation = nullptr;
  std::atomic<bool> running{false};
  std::unique_ptr<platform::Thread> thread;  // job thread only
};

uint32_t WorkerMain(void* argument) {
  auto& slot = *static_cast<WorkerSlot*>(argument);
  // The engine's arithmetic traps behave the same on every worker, whatever mode the
  // platform gives a new thread.
  platform::SetEngineFloatingPointMode();
  ProcessOccupation(*slot.task, *slot.engine, slot.context, *slot.occupation,
                    *static_cast<TResultFile*>(slot.context.writer));
  slot.running.store(false, std::memory_order_release);
  return 0;
}

class WorkerPool {
 public:
  WorkerPool(TTask& task, TEngine& raw_filter, StartWorkerFn start_worker)
      : task_(task),
        raw_filter_(raw_filter),
        start_worker_(start_worker),
        count_(std::min(task.thread_count(), kMaxRawFilterWorkers)) {}

  // Hands the occupations to free slots in list order until they are all started or a
  // break is requested.
  void Dispatch() {
    bool all_busy = false;
    for (const TOccupItem& occupation : task_.job.occupations) {
      if (BreakRequested()) return;
      int free_slot = -1;
      for (;;) {
        if (all_busy) WaitForAnyWorker();
        free_slot = CollectFinished();
        if (free_slot >= 0) break;
        all_busy = true;
        if (BreakRequested()) return;
      }
      all_busy = false;
      Start(slots_[static_cast<size_t>(free_slot)], occupation);
    }
  }

  // Collects every worker, waiting for those still at work.
  void Drain() {
    for (;;) {
      WorkerSlot* busy = nullptr;
      for (uint32_t i = 0; i < count_ && busy == nullptr; ++i) {
        WorkerSlot& slot = slots_[i];
        if (slot.running.load(std::memory_order_acquire))
          busy = &slot;
        else if (slot.thread)
          Collect(slot);
      }
      if (busy == nullptr) return;
      busy->thread->Wait(kWorkerWaitMs);
      PumpMessages();
    }
  }

 private:
  // Collects the finished slots; returns the highest-numbered free slot, -1 if none.
  int CollectFinished() {
    int free_slot = -1;
    for (uint32_t i = 0; i < count_; ++i) {
      WorkerSlot& slot = slots_[i];
      if (slot.running.load(std::memory_order_acquire)) continue;
      if (slot.thread) Collect(slot);
      free_slot = static_cast<int>(i);
    }
    return free_slot;
  }

  void WaitForAnyWorker() {
    std::array<platform::Thread*, kMaxRawFilterWorkers> threads{};
    for (uint32_t i = 0; i < count_; ++i)
      threads[i] = slots_[i].thread.get();
    platform::WaitAnyThread(threads.data(), count_, kWorkerWaitMs);
    PumpMessages();
  }

  void Start(WorkerSlot& slot, const TOccupItem& occupation) {
    slot.context = MakeThreadContext(task_, 0, occupation.id);
    slot.task = &task_;
    slot.engine = &raw_filter_;
    slot.occupation = &occupation;
    slot.running.store(true, std::memory_order_release);
    InitNewThread(task_, &slot.context);
    slot.thread = start_worker_(WorkerMain, &slot, kRawFilterWorkerStack);
    if (slot.thread) return;
    // No thread runs for this slot: free it at once, or the drain would wait for it forever.
    // The occupation goes unprocessed.
    Trace("OCCUP#%08X: raw filter worker could not be started\n", occupation.id);
    DeleteThread(task_, &slot.context);
    slot.running.store(false, std::memory_order_release);
  }

  // The worker has cleared its running flag and is ending: wait for it to be gone (its exit
  // may still run the engine's thread-local clean-up, and the engine is unloaded once the
  // run is over), then merge its records into the result file.
  void Collect(WorkerSlot& slot) {
    slot.thread->Wait(UINT32_MAX);
    slot.thread.reset();
    DeleteThread(task_, &slot.context);
  }

  TTask& task_;
  TEngine& raw_filter_;
  const StartWorkerFn start_worker_;
  const uint32_t count_;
  std::array<WorkerSlot, kMaxRawFilterWorkers> slots_;
};

}  // namespace

bool WriteOccupationRecordLocked(TTask& task, TResultFile& writer, const TOccupItem& occupation) {
  TLockGuard lock(task.solution_lock);
  return WriteOccupationRecord(writer, occupation);
}

bool RunRawFilterSingle(TTask& task, TEngine& raw_filter) {
  task.current_engine.store(&raw_filter);
  for (const TOccupItem& occupation : task.job.occupations) {
    if (BreakRequested()) break;
    vox_ThreadContext context = MakeThreadContext(task, 0, occupation.id);
    ProcessOccupation(task, raw_filter, context, occupation, task.result_file);
  }
  task.current_engine.store(nullptr);
  return true;
}

bool RunRawFilterMulti(TTask& task, TEngine& raw_filter, StartWorkerFn start_worker) {
  task.current_engine.store(&raw_filter);
  {
    auto pool = std::make_unique<WorkerPool>(task, raw_filter, start_worker);
    pool->Dispatch();
    pool->Drain();
  }
  task.current_engine.store(nullptr);
  return true;
}

}  // namespace vox
