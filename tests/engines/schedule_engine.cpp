// The scheduling engine: a raw filter and group engine that records how vox calls it, for
// the tests of the engine steps. Built twice, as test_schedule.eng and (with the role
// "static") test_schedule_static.eng, so that a multi-site job can tell its two engines
// apart.
//
// Settings come from the environment, read at each call:
//   VOX_TEST_RECORD=<path>    the lines below are appended to this file
//   SCHED_SLOW_MS=<ms>        each occupation takes this long
//   SCHED_THROW_OCC=<n>       the call for occupation n throws
//   SCHED_FAULT_OCC=<n>       the call for occupation n writes through a null pointer
//   SCHED_STACK_KB=<k>        each occupation call first uses k KiB of its stack
//   SCHED_GROUP_RESULT=<r>    what the group calls return (default 1)
//   SCHED_GROUP_FAIL=1|2      the group calls throw (1) or fault (2)
//
// Lines: "occ <role> id=<id> flags=<flags> running=<workers in the engine now>",
// "stack <role> free=<bytes below the engine's first frame>", "group <role> ...",
// "groupMT <role> ...", "break <role>". Each occupation call also writes the messages
// "begin <n>" and "end <n>" through its writer.
#ifdef _WIN32
#include <windows.h>
#else
#include <pthread.h>
#endif

#include <atomic>
#include <chrono>
#include <cstdint>
#include <mutex>
#include <stdexcept>
#include <thread>

#include "test_engine.h"

#ifndef SCHEDULE_ROLE
#define SCHEDULE_ROLE "proc"
#endif

namespace {

std::atomic<int> g_running{0};
std::mutex g_record_mutex;

template <typename... Args>
void Line(const char* format, Args... args) {
  std::lock_guard lock(g_record_mutex);
  test_engine::Record(format, args...);
}

// Bytes of stack left below this frame on the calling thread.
size_t StackFree() {
#ifdef _WIN32
  ULONG_PTR low = 0, high = 0;
  GetCurrentThreadStackLimits(&low, &high);
  char here = 0;
  return static_cast<size_t>(reinterpret_cast<ULONG_PTR>(&here) - low);
#else
  pthread_attr_t attributes;
  if (pthread_getattr_np(pthread_self(), &attributes) != 0) return 0;
  void* base = nullptr;
  size_t size = 0;
  pthread_attr_getstack(&attributes, &base, &size);
  pthread_attr_destroy(&attributes);
  char here = 0;
  return static_cast<size_t>(&here - static_cast<char*>(base));
#endif
}

// Touches k KiB of stack so that a stack too small for it faults.
__attribute__((noinline)) void UseStack(unsigned long kib) {
  if (kib == 0) return;
  volatile char block[1024];
  for (size_t i = 0; i < sizeof block; i += 64)
    block[i] = static_cast<char>(i);
  UseStack(kib - 1);
  block[0] = block[1];
}

// Read through a volatile pointer, so that no optimiser can prove it null and drop the store.
int* volatile g_nowhere = nullptr;

void Fault() {
  *g_nowhere = 1;
}

uint32_t Group(const char* label, vox_ThreadContext* context) {
  Line("%s %s id=%u flags=%08X", label, SCHEDULE_ROLE, context->id, context->flags);
  context->progress(context->writer, 50);
  const unsigned long fail = test_engine::EnvNumber("SCHED_GROUP_FAIL", 0);
  if (fail == 1) throw std::runtime_error("schedule engine: group call throws");
  if (fail == 2) Fault();
  return static_cast<uint32_t>(test_engine::EnvNumber("SCHED_GROUP_RESULT", 1));
}

}  // namespace

TEST_ENGINE_REQUIRED_FUNCTIONS(VOX_ENGINE_INTERFACE_VERSION)

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessOccupation(vox_ThreadContext* context) {
  const unsigned long number = context->id & 0xFFFFFFu;
  const int running = ++g_running;
  Line("occ %s id=%08X flags=%08X running=%d", SCHEDULE_ROLE, context->id, context->flags, running);
  Line("stack %s free=%zu", SCHEDULE_ROLE, StackFree());
  UseStack(test_engine::EnvNumber("SCHED_STACK_KB", 0));

  char text[32];
  std::snprintf(text, sizeof text, "begin %lu", number);
  context->message(context->writer, 1, text);
  const unsigned long slow = test_engine::EnvNumber("SCHED_SLOW_MS", 0);
  if (slow > 0) std::this_thread::sleep_for(std::chrono::milliseconds(slow));
  context->progress(context->writer, 50);
  --g_running;

  if (test_engine::EnvNumber("SCHED_THROW_OCC", 0) == number)
    throw std::runtime_error("schedule engine: asked to throw");
  if (test_engine::EnvNumber("SCHED_FAULT_OCC", 0) == number) Fault();

  std::snprintf(text, sizeof text, "end %lu", number);
  context->message(context->writer, 1, text);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  return Group("group", context);
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroupMT(vox_ThreadContext* context) {
  return Group("groupMT", context);
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  Line("break %s", SCHEDULE_ROLE);
  return 0;
}
