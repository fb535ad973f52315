#include "run/pipeline.h"

#include <cstdarg>
#include <cstdio>
#include <memory>

#include "base/buf_file.h"
#include "base/engine_log.h"
#include "base/gps_time.h"
#include "job/job_text.h"
#include "platform/platform.h"
#include "run/control_channel.h"
#include "run/data_preparation.h"
#include "run/engine_steps.h"
#include "run/job_parse.h"
#include "run/run_context.h"
#include "run/run_state.h"
#include "run/task.h"

namespace vox {

namespace {

constexpr uint32_t kErrorMessage = 3;  // message flags of the pipeline's failure texts
constexpr size_t kMaxErrorText = 255;

// Formats a failure text and writes it to the result file as an error message.
void ResultError(TTask& task, const char* format, ...) __attribute__((format(printf, 2, 3)));
void ResultError(TTask& task, const char* format, ...) {
  char text[256];
  va_list args;
  va_start(args, format);
  std::vsnprintf(text, sizeof text, format, args);
  va_end(args);
  // While the result file is not open (a parse failure) the writer refuses the message.
  task.result_file.WriteMessage(text, kErrorMessage);
}

// Steps 4 to 12 on a created task; returns the exit code.
uint32_t RunTask(TTask& task, TRunContext& context) {
  if (!ParseJobIntoTask(task, context.job_text, context.job_path, context.cpu_count)) {
    const std::string error = LastErrorText();
    Trace("Can not parse input file\n");
    ResultError(task, "Engine '%s' not found (%s)", task.job.engine_path.c_str(), error.c_str());
    return kExitParseFailed;
  }
  context.job_name = task.job.job_name;
  StoreJobLabels({task.job.job_name, task.result_file.path()});
  context.cpu_count = task.job.thread_count;

  if (!task.result_file.Open()) {
    const std::string error = LastErrorText();
    Trace("Can not open result file: %s\n", task.result_file.path().c_str());
    ResultError(task, "Can not open result file: '%s' (%s)", task.result_file.path().c_str(),
                error.c_str());
    return kExitResultFileFailed;
  }
  if (!PrepareData(task)) {
    Trace("Can not prepare data\n");
    ResultError(task, "Can not prepare data");
    return kExitPreparationFailed;
  }
  SetControlWindowTitle(context.window, task.job.job_name);

  if (RunRawFilterStep(task) && TheRun().break_flag.load() == 0 && !task.job.raw_filter_only)
    RunEngineStep(task);
  // The engine steps unmask floating-point traps on this thread; the host callback that
  // follows on this thread must not inherit them.
  platform::RestoreDefaultFloatingPointMode();

  const bool closed = task.result_file.Close();
  TheRun().progress.store(99);
  if (TheRun().break_flag.load() != 0) return kExitBreak;
  return closed ? kExitDone : kExitCloseFailed;
}

}  // namespace

std::string LastErrorText() {
  std::string text = platform::SystemErrorText(platform::LastSystemError());
  if (text.size() > kMaxErrorText) text.resize(kMaxErrorText);
  return text;
}

uint32_t ReadJobFileAndRun(TRunContext* context) {
  uint32_t exit_code = kExitJobFileUnreadable;
  std::string text = ReadWholeFile(context->job_path);
  if (text.empty()) {
    Trace("Process fault: %s (%s)\n", context->job_path.c_str(), LastErrorText().c_str());
  } else {
    RemoveCarriageReturns(text);
    if (!SubstituteVariables(text, context->variables)) {
      Trace("Process fault: %s (Cannot substitute variables)\n", context->job_path.c_str());
    } else {
      context->job_text = std::move(text);
      context->AddRef();
      exit_code = RunPipeline(context);
    }
  }
  context->Release();
  return exit_code;
}

uint32_t RunPipeline(TRunContext* context) {
  StoreJobStart(LocalGpsWeekTime());
  auto task = std::make_unique<TTask>();
  task->job.thread_count = context->cpu_count;
  TheRun().current_task.store(task.get(), std::memory_order_release);

  const uint32_t exit_code = RunTask(*task, *context);

  CloseControlWindow(context->window);
  // The end time is taken before the task goes, so that command 5 never pairs this job's
  // start with the previous job's end.
  StoreJobEnd(LocalGpsWeekTime());
  TheRun().current_task.store(nullptr, std::memory_order_release);
  task.reset();
  CloseEngineLog();

  context->Release();
  return exit_code;
}

}  // namespace vox
