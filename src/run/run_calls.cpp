#include "run/run_calls.h"

#include <cstdio>
#include <memory>

#include "base/engine_log.h"
#include "job/job_text.h"
#include "platform/platform.h"
#include "run/control_channel.h"
#include "run/pipeline.h"
#include "run/run_context.h"
#include "run/run_state.h"

namespace vox {

namespace {

constexpr size_t kJobThreadStack = 0x100000;

uint32_t ThreadEpilogue(uint32_t exit_code) {
  RunState& run = TheRun();
  run.exit_code.store(exit_code);
  run.run_in_flight.store(false);
  NotifyHost(kCallbackExitCode, exit_code);
  return run.exit_code.load();
}

uint32_t FileJobThread(void* context) {
  return ThreadEpilogue(ReadJobFileAndRun(static_cast<TRunContext*>(context)));
}

uint32_t TextJobThread(void* context) {
  return ThreadEpilogue(RunPipeline(static_cast<TRunContext*>(context)));
}

// Prologue steps up to the window; false when refused as busy.
bool ClaimRun() {
  bool expected = false;
  if (!TheRun().run_in_flight.compare_exchange_strong(expected, true)) {
    WriteOwnEngineLog("Program is busy\n");
    return false;
  }
  OpenEngineLog();
  StoreJobLabels({});
  return true;
}

struct Started {
  uint64_t window = 0;
  std::unique_ptr<platform::Thread> thread;  // null when it could not be started
};

Started StartJob(TRunContext* context, platform::ThreadProc proc) {
  Started started;
  started.window = OpenControlWindow();
  RunState& run = TheRun();
  if (started.window == 0) {
    // Refused before anything started: the run is over and the record goes.
    delete context;
    run.run_in_flight.store(false);
    return started;
  }
  run.job_thread_id.store(0);
  run.break_flag.store(0);
  run.progress.store(0);
  run.exit_code.store(kExitStillActive);

  context->window = started.window;
  context->AddRef();
  started.thread = platform::StartThread(proc, context, kJobThreadStack);
  if (!started.thread) {
    context->Release();
    run.exit_code.store(kExitThreadFailed);
    run.run_in_flight.store(false);
    return started;
  }
  run.job_thread_id.store(started.thread->id());
  return started;
}

}  // namespace

void WriteOwnEngineLog(const char* text) {
  if (FILE* log = OpenSideLog()) {
    std::fputs(text, log);
    std::fclose(log);
  }
}

uint64_t RunJobFile(const std::string& path, const std::vector<std::string>& variables, bool wait) {
  if (!ClaimRun()) return 0;
  auto* context = new TRunContext;
  context->job_path = path;
  for (const std::string& v : variables)
    context->variables.Add(v);
  Started started = StartJob(context, FileJobThread);
  if (!wait || started.window == 0) return wait ? 0 : started.window;
  if (!started.thread) {
    Trace("Can not run thread\n");
    return 0;
  }
  // The control window lives on this thread, and the job thread's last act waits for it to
  // handle the close: keep handling messages while waiting.
  platform::WaitForThreadHandlingMessages(*started.thread);
  return 1;
}

uint64_t RunJobText(const char* text) {
  if (!ClaimRun()) return 0;
  auto* context = new TRunContext;
  context->job_text = text != nullptr ? text : "";
  RemoveCarriageReturns(context->job_text);
  return StartJob(context, TextJobThread).window;
}

}  // namespace vox
