// Exported vector functions and the parameter block helpers. Every vector function writes
// its trace line first, before any check.
#include <new>

#include "base/engine_log.h"
#include "job/parameter_assign.h"
#include "job/vector_records.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_streams.h"

namespace {

const vox::JobModel* Job() {
  const vox::TTask* task = vox::CurrentTask();
  return task != nullptr ? &task->job : nullptr;
}

}  // namespace

extern "C" {

VOX_API void* VOX_CALL vox_OpenVectorStream(void) {
  vox::Trace("open vector stream\n");
  const vox::JobModel* job = Job();
  if (job == nullptr || job->vectors.empty()) return nullptr;
  return new (std::nothrow) vox::VectorCursor{job->vectors.head()};
}

VOX_API int32_t VOX_CALL vox_GetNextVector(void* stream, vox_VectorData* out) {
  vox::Trace("get next vector\n");
  if (stream == nullptr || out == nullptr) return 0;
  const vox::TVectorItem* vector = vox::NextVector(*static_cast<vox::VectorCursor*>(stream));
  if (vector == nullptr) return 0;
  vox::FillVectorData(*vector, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetVectorData(vox_VectorData* record) {
  vox::Trace("get vector data\n");
  const vox::JobModel* job = Job();
  if (record == nullptr || job == nullptr) return 0;
  const vox::TVectorItem* vector = job->FindVector(record->id);
  if (vector == nullptr) return 0;
  vox::FillVectorData(*vector, *record);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetVectorProperty(uint32_t vector_id, ParameterBlock* out) {
  vox::Trace("get vector property\n");
  const vox::JobModel* job = Job();
  if (out == nullptr || job == nullptr) return 0;
  const vox::TVectorItem* vector = job->FindVector(vector_id);
  if (vector == nullptr) return 0;
  if (vector->property) vox::AssignParameterBlock(out, vector->property->data());
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetSolutionProperty(uint32_t, ParameterBlock* out) {
  vox::Trace("get solution property\n");
  const vox::JobModel* job = Job();
  if (out == nullptr || job == nullptr) return 0;
  if (job->engine_params) vox::AssignParameterBlock(out, job->engine_params->data());
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetVectorResult(uint32_t, uint32_t* result) {
  vox::Trace("get vector result\n");
  if (result != nullptr) *result = 0;
  return 0;
}

VOX_API int32_t VOX_CALL vox_CloseVectorStream(void* stream) {
  vox::Trace("close vector stream\n");
  delete static_cast<vox::VectorCursor*>(stream);
  return 1;
}

VOX_API void VOX_CALL vox_AssignVectorProperty(ParameterBlock* destination,
                                               const ParameterBlock* source) {
  vox::AssignParameterBlock(destination, source);
}

VOX_API int32_t VOX_CALL vox_CompareVectorProperty(const ParameterBlock* a,
                                                   const ParameterBlock* b) {
  return vox::CompareParameterBlocks(a, b) ? 1 : 0;
}

}  // extern "C"
