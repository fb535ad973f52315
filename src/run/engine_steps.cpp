#include "run/engine_steps.h"

#include <memory>

#include "base/engine_log.h"
#include "engine/engine.h"
#include "platform/platform.h"
#include "run/engine_call.h"
#include "run/engine_threads.h"
#include "run/raw_filter.h"
#include "run/run_state.h"
#include "run/task.h"

namespace vox {

namespace {

constexpr uint32_t kRawFilterMessage = 21;
constexpr uint32_t kRawFilterDoneMessage = 1079;
constexpr uint32_t kStepEndMessage = 32;

// Group results that mean the engine failed.
bool GroupSucceeded(uint32_t result) {
  return result != 0 && result != 3;
}

// One group call of engine on the job thread with the task's writer. A call that throws or
// faults counts as a failed one (0): whatever it returned is unknown.
uint32_t RunGroupCall(TTask& task, TEngine& engine, bool multi_threaded) {
  task.current_engine.store(&engine);
  vox_ThreadContext context = MakeThreadContext(task, task.engine_flags(), 1);
  uint32_t result = 0;
  if (!CallEngineGuarded(engine, multi_threaded ? "ProcessGroupMT" : "ProcessGroup", [&] {
        result = multi_threaded ? engine.ProcessGroupMT(&context) : engine.ProcessGroup(&context);
      }))
    result = 0;
  task.current_engine.store(nullptr);
  return result;
}

bool IsKinematic(uint32_t job_kind) {
  return job_kind == 2 || job_kind == 3;
}

}  // namespace

bool RunRawFilterStep(TTask& task) {
  platform::SetEngineFloatingPointMode();
  task.result_file.WriteMessage("RawFilter", kRawFilterMessage);

  // The path goes through the job file's code page and back, as every path from the job
  // does before it reaches the loader.
  std::unique_ptr<TEngine> raw_filter;
  LoadEngineInto(raw_filter,
                 platform::PathFromAnsi(platform::AnsiFromPath(task.job.raw_filter_path)));
  bool ran = false;
  {
    EngineRef reference(raw_filter.get());
    if (reference.loaded()) {
      ran = task.thread_count() > 1 ? RunRawFilterMulti(task, *raw_filter)
                                    : RunRawFilterSingle(task, *raw_filter);
    }
  }
  raw_filter.reset();  // unloads it, with its line in the engine log

  task.result_file.WriteMessage("RawFilter - OK", kRawFilterDoneMessage);
  task.result_file.WriteMessage(nullptr, kStepEndMessage);
  return ran;
}

bool RunEngineStep(TTask& task) {
  platform::SetEngineFloatingPointMode();
  const JobModel& job = task.job;

  // A multi-site kinematic job first has the static engine fix what it can; the processing
  // engine runs only on its success.
  if (job.multi_site && IsKinematic(job.job_kind)) {
    TEngine* static_engine = task.engines->static_engine();
    EngineRef reference(static_engine);
    if (!reference.loaded()) return false;
    if (!GroupSucceeded(RunGroupCall(task, *static_engine, false))) return false;
  }

  TEngine* engine = task.engines->processing();
  EngineRef reference(engine);
  if (!reference.loaded()) return false;
  // Only a single-site job may spread its group over threads.
  const bool multi_threaded = !job.multi_site && task.thread_count() >= 2 &&
                              engine->Exports(EngineFunction::kProcessGroupMT);
  return GroupSucceeded(RunGroupCall(task, *engine, multi_threaded));
}

void BreakCheck(TTask& task) {
  if (TheRun().break_flag.load() != 1) return;
  TEngine* engine = task.current_engine.load();
  if (engine == nullptr) return;
  EngineRef reference(engine);
  if (reference.loaded()) engine->BreakProcess();
}

}  // namespace vox
