// A test engine that takes its time: its group call raises the progress by one percent every
// few milliseconds up to 98 and stops early when asked to break. It gives a host test a job
// long enough to pause, resume and break through the control window.
#include <windows.h>

#include <atomic>

#include "test_engine.h"

namespace {
std::atomic<bool> g_break{false};
}

TEST_ENGINE_REQUIRED_FUNCTIONS(VOX_ENGINE_INTERFACE_VERSION)

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  g_break.store(true);
  return 1;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  g_break.store(false);
  for (int32_t percent = 1; percent <= 98 && !g_break.load(); ++percent) {
    Sleep(25);
    context->progress(context->writer, percent);
  }
  return 1;
}
