#include "run/run_state.h"

#include <mutex>

#include "run/current_task.h"

namespace vox {

namespace {

struct Callback {
  HostCallbackFn fn;
  void* context;
};

// Registered once and kept for the life of the process; never freed, so a host thread that
// loaded the pointer can still call through it while another thread registers.
std::atomic<const Callback*> g_callback{nullptr};
std::mutex g_callback_mutex;

std::mutex g_labels_mutex;
JobLabels g_labels;

uint64_t Pack(const GpsWeekTime& t) {
  return (uint64_t{t.week} << 32) | t.ms_of_week;
}

int64_t PackedMs(uint64_t packed) {
  return static_cast<int64_t>(packed >> 32) * kMsPerWeek +
         static_cast<int64_t>(packed & 0xFFFFFFFFu);
}

}  // namespace

RunState& TheRun() {
  static RunState state;
  return state;
}

TTask* CurrentTask() {
  return TheRun().current_task.load(std::memory_order_acquire);
}

bool RegisterHostCallback(HostCallbackFn fn, void* context) {
  if (fn == nullptr) return false;
  std::lock_guard lock(g_callback_mutex);
  if (g_callback.load() != nullptr) return false;
  g_callback.store(new Callback{fn, context});
  return true;
}

void NotifyHost(uint32_t code, uint32_t value) {
  const Callback* cb = g_callback.load();
  if (cb != nullptr) cb->fn(cb->context, code, value);
}

void RaiseProgress(uint32_t percent) {
  uint32_t current = TheRun().progress.load();
  while (percent > current) {
    if (TheRun().progress.compare_exchange_weak(current, percent)) {
      NotifyHost(kCallbackProgress, percent);
      return;
    }
  }
}

void StoreJobStart(const GpsWeekTime& t) {
  TheRun().job_start.store(Pack(t));
}
void StoreJobEnd(const GpsWeekTime& t) {
  TheRun().job_end.store(Pack(t));
}

uint32_t ElapsedSeconds() {
  const uint64_t start = TheRun().job_start.load();
  const uint64_t end =
      CurrentTask() != nullptr ? Pack(LocalGpsWeekTime()) : TheRun().job_end.load();
  const int64_t ms = PackedMs(end) - PackedMs(start);
  // The local clock may be set back during a job; a negative span reads as 0.
  return ms <= 0 ? 0 : static_cast<uint32_t>(ms / 1000);
}

void StoreJobLabels(JobLabels labels) {
  std::lock_guard lock(g_labels_mutex);
  g_labels = std::move(labels);
}

JobLabels LastJobLabels() {
  std::lock_guard lock(g_labels_mutex);
  return g_labels;
}

}  // namespace vox
