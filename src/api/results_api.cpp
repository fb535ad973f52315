// The engine's result functions: resolve the task and the writer, then hand over to the
// results room. A null writer in the Ex forms means the task's own writer.
#include "base/engine_log.h"
#include "platform/platform.h"
#include "results/ray_stream.h"
#include "results/result_functions.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_results.h"

namespace {

// The writer an Ex call names, or the task's writer; null when there is neither.
vox::TResultFile* WriterOf(void* writer, vox::TTask* task) {
  if (writer != nullptr) return static_cast<vox::TResultFile*>(writer);
  return task != nullptr ? &task->result_file : nullptr;
}

vox::TRayStream* RayStreamOf(TRayStream* stream) {
  return reinterpret_cast<vox::TRayStream*>(stream);
}

}  // namespace

extern "C" {

VOX_API int32_t VOX_CALL vox_SetVectorResultEx(void* writer, uint32_t vector_id,
                                               const vox_VectorResult* result) {
  const vox::platform::QuietFloatingPoint quiet;
  vox::Trace("set vector result #%08X\n", vector_id);
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  vox::TVectorItem* vector = task->job.FindVector(vector_id);
  if (vector == nullptr) return 0;
  return vox::SetVectorResult(*WriterOf(writer, task), vector, vector_id, result,
                              task->solution_lock);
}

VOX_API int32_t VOX_CALL vox_SetVectorResult(uint32_t vector_id, const vox_VectorResult* result) {
  return vox_SetVectorResultEx(nullptr, vector_id, result);
}

VOX_API int32_t VOX_CALL vox_SetFanResultEx(void* writer, uint32_t fan_id,
                                            const vox_FanResult* result) {
  const vox::platform::QuietFloatingPoint quiet;
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  vox::TFanItem* fan = task->job.FindFan(fan_id);
  if (fan == nullptr) return 0;
  return vox::SetFanResult(*WriterOf(writer, task), fan, fan_id, result);
}

VOX_API int32_t VOX_CALL vox_SetFanResult(uint32_t fan_id, const vox_FanResult* result) {
  return vox_SetFanResultEx(nullptr, fan_id, result);
}

VOX_API int32_t VOX_CALL vox_SetNextRayEx(void* writer, TRayStream* stream,
                                          const vox_RayData* ray) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr) return 0;
  vox::TResultFile* w = WriterOf(writer, vox::CurrentTask());
  if (w == nullptr) return 0;
  return vox::SetNextRay(*w, RayStreamOf(stream), ray);
}

VOX_API int32_t VOX_CALL vox_SetNextRay(TRayStream* stream, const vox_RayData* ray) {
  return vox_SetNextRayEx(nullptr, stream, ray);
}

VOX_API int32_t VOX_CALL vox_CopyDataEx(void* writer, uint32_t kind, const vox_CopyDataRec* record,
                                        uint32_t size) {
  const vox::platform::QuietFloatingPoint quiet;
  vox::TTask* task = vox::CurrentTask();
  vox::TResultFile* w = WriterOf(writer, task);
  if (w == nullptr) return 0;
  static const vox::ItemList<vox::TVectorItem> kNoVectors(false);
  static const vox::ItemList<vox::TFanItem> kNoFans(false);
  const bool task_writer = task != nullptr && w == &task->result_file;
  return vox::CopyData(*w, kind, record, size, task ? task->job.vectors : kNoVectors,
                       task ? task->job.fans : kNoFans, task_writer ? &task->done_units : nullptr);
}

VOX_API int32_t VOX_CALL vox_CopyData(uint32_t kind, const vox_CopyDataRec* record, uint32_t size) {
  return vox_CopyDataEx(nullptr, kind, record, size);
}

}  // extern "C"
