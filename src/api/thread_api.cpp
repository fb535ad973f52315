// The engine's thread functions.
#include "base/engine_log.h"
#include "run/current_task.h"
#include "run/engine_threads.h"
#include "run/task.h"
#include "vox/vox_sdk_core.h"

extern "C" {

VOX_API uint32_t vox_InitNewThread(vox_ThreadContext* context) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  return vox::InitNewThread(*task, context);
}

VOX_API uint32_t vox_DeleteThread(vox_ThreadContext* context) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  return vox::DeleteThread(*task, context);
}

VOX_API uint32_t vox_GetThreadCount(void) {
  vox::TTask* task = vox::CurrentTask();
  return task != nullptr ? task->thread_count() : 0;
}

}  // extern "C"
