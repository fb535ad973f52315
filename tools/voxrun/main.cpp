// voxrun: runs one job file through libvox and reports how it ended.
//
//   voxrun [--var NAME=VALUE]... [--quiet] JOBFILE
//
// The job runs on the library's job thread; this thread only watches: it registers the host
// callback, redraws the progress, turns Ctrl-C into a break request and waits for the exit
// code. voxrun exits with the job's exit code.
#include <signal.h>
#include <unistd.h>
#ifdef _WIN32
#include <windows.h>
#endif

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <mutex>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "progress_view.h"
#include "vox/vox_host.h"

namespace {

constexpr int kAbortExitCode = 130;

// What the callback reports, read by the main thread.
struct JobWatch {
  std::mutex mutex;
  std::condition_variable ended_signal;
  bool ended = false;
  uint32_t exit_code = VOX_EXIT_STILL_ACTIVE;
  std::atomic<uint32_t> progress{0};
};

void VOX_CALL OnJobEvent(void* context, uint32_t code, uint32_t value) {
  auto* watch = static_cast<JobWatch*>(context);
  if (code == VOX_CALLBACK_PROGRESS) {
    watch->progress.store(value);
  } else if (code == VOX_CALLBACK_EXIT_CODE) {
    std::lock_guard lock(watch->mutex);
    watch->exit_code = value;
    watch->ended = true;
    watch->ended_signal.notify_all();
  }
}

volatile sig_atomic_t g_interrupts = 0;

void OnInterrupt(int) {
  g_interrupts = g_interrupts + 1;
  if (g_interrupts >= 2) {
    static const char text[] = "\nvoxrun: aborted\n";
    (void)!write(STDERR_FILENO, text, sizeof text - 1);
    _exit(kAbortExitCode);
  }
}

const char* ExitMeaning(uint32_t code) {
  switch (code) {
    case VOX_EXIT_DONE:
      return "job done, result file complete";
    case VOX_EXIT_JOB_FILE:
      return "job file cannot be read, or a $( is not closed";
    case VOX_EXIT_PARSE:
      return "job file cannot be parsed, or its engine cannot be loaded";
    case VOX_EXIT_RESULT_FILE:
      return "result file cannot be opened";
    case VOX_EXIT_PREPARATION:
      return "data preparation failed";
    case VOX_EXIT_THREAD:
      return "job thread cannot be started";
    case VOX_EXIT_BREAK:
      return "stopped by a break";
    case VOX_EXIT_CLOSE:
      return "result file could not be completed";
    default:
      return "unknown exit code";
  }
}

std::string JobName() {
  char name[256];
  GetEngineJobName(name, sizeof name);
  return name;
}

const char* kDescription =
    "Runs one vox job file and reports how it ended.\n\n"
    "The job runs through libvox: its name is shown once the job file has been read, then a\n"
    "progress bar with the elapsed time (on a terminal) or one line per progress step (when\n"
    "the output is a file or a pipe). Ctrl-C asks the job to stop (it then ends with exit\n"
    "code 10); a second Ctrl-C aborts voxrun at once (exit status 130).\n\n"
    "The last line reads: exit code, its meaning and the result path. voxrun exits with the\n"
    "job's exit code:\n"
    "   0  job done, result file complete\n"
    "   5  job file cannot be read, or a $( is not closed\n"
    "   6  job file cannot be parsed, or its engine cannot be loaded\n"
    "   7  result file cannot be opened\n"
    "   8  data preparation failed\n"
    "   9  job thread cannot be started\n"
    "  10  stopped by a break (Ctrl-C)\n"
    "  11  result file could not be completed\n"
    "   1  the job could not be started at all\n\n"
    "Set a folder named \"engine\" in the temporary folder (TMPDIR, else /tmp) to get a\n"
    "trace file of the run there (OUT*.tmp).";

}  // namespace

int main(int argc, char** argv) {
  CLI::App app{kDescription, "voxrun"};
  std::vector<std::string> variables;
  bool quiet = false;
  std::string job_file;
  app.add_option("--var", variables,
                 "Run variable NAME=VALUE: every $(NAME) in the job file reads VALUE; may be "
                 "given several times (the last one of a name wins); an unknown $(NAME) reads "
                 "as nothing")
      ->type_name("NAME=VALUE")
      ->allow_extra_args(false);
  app.add_flag("-q,--quiet", quiet,
               "Show neither the job name nor the progress, only the last line");
  app.add_option("JOBFILE", job_file, "The job file to run")->required();
  CLI11_PARSE(app, argc, argv);

#ifdef _WIN32
  signal(SIGINT, OnInterrupt);
#else
  struct sigaction action {};
  action.sa_handler = OnInterrupt;
  sigemptyset(&action.sa_mask);
  sigaction(SIGINT, &action, nullptr);
#endif

  std::vector<const char*> definitions;
  for (const std::string& v : variables)
    definitions.push_back(v.c_str());

  const auto started = std::chrono::steady_clock::now();
  JobWatch watch;
  vox_ControlHandle handle = RunProcessWithVariables(job_file.c_str(), definitions.data(),
                                                     static_cast<uint32_t>(definitions.size()));
  if (handle == nullptr) {
    std::fprintf(stderr, "voxrun: the job could not be started (another job is running)\n");
    return 1;
  }
  vox_HostCallbackPair callback{OnJobEvent, &watch};
  SendEngineControl(handle, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&callback));

  const bool terminal = isatty(STDOUT_FILENO) != 0;
  voxrun::ProgressView view(stdout, terminal, quiet);
  bool name_shown = false;
  bool break_sent = false;
  std::unique_lock lock(watch.mutex);
  while (!watch.ended) {
    watch.ended_signal.wait_for(lock, std::chrono::milliseconds(100));
#ifdef _WIN32
    // The control window lives on this thread, and the job's end waits until it has handled
    // its close: keep handling its messages.
    lock.unlock();
    MSG message;
    while (PeekMessageA(&message, nullptr, 0, 0, PM_REMOVE))
      DispatchMessageA(&message);
    lock.lock();
#endif
    if (g_interrupts > 0 && !break_sent) {
      SendEngineControl(handle, VOX_CMD_BREAK, 0);
      break_sent = true;
      view.Note("break requested; press Ctrl-C again to abort");
    }
    if (watch.ended) break;
    if (!name_shown) {
      const std::string name = JobName();
      if (!name.empty()) {
        view.ShowJobName(name);
        name_shown = true;
      }
    }
    const double elapsed =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - started).count();
    view.Update(watch.progress.load(), elapsed);
  }
  const uint32_t exit_code = watch.exit_code;
  lock.unlock();

  if (!name_shown) {
    const std::string name = JobName();
    if (!name.empty()) view.ShowJobName(name);
  }
  view.Finish();
  char result_path[4096];
  GetEngineResultPath(result_path, sizeof result_path);
  std::printf("exit code %u: %s; result: %s\n", exit_code, ExitMeaning(exit_code),
              result_path[0] != '\0' ? result_path : "(none)");
  return static_cast<int>(exit_code);
}
