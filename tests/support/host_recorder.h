// What a test host's callback has been told, and a wait for a job's exit code through it.
// One callback serves the whole process (the first registration stays in force), so a test
// program has one recorder: HostRecorder::Instance().
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <vector>

#include "vox/vox_host.h"

namespace vox::test {

struct HostRecorder {
  std::mutex mutex;
  std::condition_variable changed;
  std::vector<uint32_t> exit_codes;
  std::vector<uint32_t> progress;
  vox_HostCallbackPair pair{&HostRecorder::Record, this};

  static HostRecorder& Instance() {
    static HostRecorder recorder;
    return recorder;
  }

  static void VOX_CALL Record(void* context, uint32_t code, uint32_t value) {
    auto* r = static_cast<HostRecorder*>(context);
    std::lock_guard lock(r->mutex);
    if (code == VOX_CALLBACK_EXIT_CODE) r->exit_codes.push_back(value);
    if (code == VOX_CALLBACK_PROGRESS) r->progress.push_back(value);
    r->changed.notify_all();
  }

  void Clear() {
    std::lock_guard lock(mutex);
    exit_codes.clear();
    progress.clear();
  }

  // Registers the recorder on h and waits for the job's exit code (0xFFFFFFFF when none came
  // within the limit).
  uint32_t WaitForEnd(vox_ControlHandle h, std::chrono::seconds limit) {
    SendEngineControl(h, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&pair));
    std::unique_lock lock(mutex);
    const bool ended = changed.wait_for(lock, limit, [this] { return !exit_codes.empty(); });
    return ended ? exit_codes.front() : 0xFFFFFFFFu;
  }
};

}  // namespace vox::test
