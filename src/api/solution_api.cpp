// Exported solution queries: a job has exactly one solution. None writes a trace line.
#include "job/vector_records.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_streams.h"

namespace {

int32_t TheOneSolution(uint32_t* solution) {
  if (solution == nullptr) return 0;
  *solution = 1;
  return 1;
}

}  // namespace

extern "C" {

VOX_API int32_t VOX_CALL vox_GetSolutionBySolXOccup(uint32_t, uint32_t* solution) {
  return TheOneSolution(solution);
}

VOX_API int32_t VOX_CALL vox_GetSolutionByVector(uint32_t, uint32_t* solution) {
  return TheOneSolution(solution);
}

// A null record is refused rather than written through.
VOX_API int32_t VOX_CALL vox_GetSolutionData(vox_SolutionData* out) {
  const vox::TTask* task = vox::CurrentTask();
  if (out == nullptr || task == nullptr) return 0;
  vox::FillSolutionData(task->job, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetSolutionDataEx(vox_SolutionDataEx* out) {
  const vox::TTask* task = vox::CurrentTask();
  if (out == nullptr || task == nullptr) return 0;
  vox::FillSolutionDataEx(task->job, *out);
  return 1;
}

VOX_API uint32_t VOX_CALL vox_GetSolutionType(void) {
  const vox::TTask* task = vox::CurrentTask();
  return task != nullptr ? task->job.job_kind : 0;
}

VOX_API int32_t VOX_CALL vox_SetSolutionProcessed(void) {
  return 1;
}

}  // extern "C"
