// Exported point functions: the point stream and the site data; the site data itself is
// built in the job room under the task's solution lock.
#include <new>

#include "base/engine_log.h"
#include "job/site_records.h"
#include "platform/platform.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_streams.h"

extern "C" {

VOX_API void* VOX_CALL vox_OpenPointStream(void) {
  vox::Trace("open point stream\n");
  const vox::TTask* task = vox::CurrentTask();
  if (task == nullptr || task->job.points.empty()) return nullptr;
  return new (std::nothrow) vox::PointCursor(task->job.points.head());
}

VOX_API uint32_t VOX_CALL vox_GetPointId(void* stream) {
  vox::Trace("get point id\n");
  if (stream == nullptr) return 0;
  const vox::TPointItem* point = static_cast<vox::PointCursor*>(stream)->Next();
  return point != nullptr ? point->id : 0;
}

VOX_API void VOX_CALL vox_ClosePointStream(void* stream) {
  vox::Trace("close point stream\n");
  delete static_cast<vox::PointCursor*>(stream);
}

VOX_API int32_t VOX_CALL vox_GetSiteData(vox_SiteData* record) {
  const vox::platform::QuietFloatingPoint quiet;
  vox::Trace("get site data\n");
  vox::TTask* task = vox::CurrentTask();
  if (record == nullptr || task == nullptr) return 0;
  return vox::GetSiteData(task->job, task->solution_lock, *record) ? 1 : 0;
}

}  // extern "C"
