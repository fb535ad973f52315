// Exported fan and ray stream functions; they write no trace lines. The ray stream object
// and its NMEA output belong to the results room.
#include <new>

#include "job/parameter_assign.h"
#include "job/vector_records.h"
#include "results/ray_stream.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_streams.h"

namespace {

const vox::JobModel* Job() {
  const vox::TTask* task = vox::CurrentTask();
  return task != nullptr ? &task->job : nullptr;
}

// The SDK's opaque TRayStream is the results room's object.
::TRayStream* ToSdk(vox::TRayStream* stream) {
  return reinterpret_cast<::TRayStream*>(stream);
}
vox::TRayStream* FromSdk(::TRayStream* stream) {
  return reinterpret_cast<vox::TRayStream*>(stream);
}

}  // namespace

extern "C" {

VOX_API void* VOX_CALL vox_OpenFanStream(void) {
  const vox::JobModel* job = Job();
  if (job == nullptr || job->fans.empty()) return nullptr;
  return new (std::nothrow) vox::FanCursor(job->fans.head());
}

VOX_API int32_t VOX_CALL vox_GetNextFan(void* stream, vox_FanData* out) {
  if (stream == nullptr || out == nullptr) return 0;
  const vox::TFanItem* fan = static_cast<vox::FanCursor*>(stream)->Next();
  if (fan == nullptr) return 0;
  vox::FillFanData(*fan, *out);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetFanData(vox_FanData* record) {
  const vox::JobModel* job = Job();
  if (record == nullptr || job == nullptr) return 0;
  const vox::TFanItem* fan = job->FindFan(record->id);
  if (fan == nullptr) return 0;
  vox::FillFanData(*fan, *record);
  return 1;
}

VOX_API int32_t VOX_CALL vox_GetFanProperty(uint32_t fan_id, ParameterBlock* out) {
  const vox::JobModel* job = Job();
  if (out == nullptr || job == nullptr) return 0;
  const vox::TFanItem* fan = job->FindFan(fan_id);
  if (fan == nullptr) return 0;
  if (fan->property) vox::AssignParameterBlock(out, fan->property->data());
  return 1;
}

VOX_API int32_t VOX_CALL vox_CloseFanStream(void* stream) {
  delete static_cast<vox::FanCursor*>(stream);
  return 1;
}

VOX_API TRayStream* VOX_CALL vox_OpenRayStream(uint32_t fan_id, uint32_t mode) {
  // Rays are only written; reading them back is not offered.
  if (mode != 0) return nullptr;
  return vox_OpenRayStreamForAdd(fan_id);
}

VOX_API TRayStream* VOX_CALL vox_OpenRayStreamForAdd(uint32_t fan_id) {
  const vox::JobModel* job = Job();
  vox::TFanItem* fan = job != nullptr ? job->FindFan(fan_id) : nullptr;
  if (fan == nullptr) return nullptr;
  return ToSdk(vox::OpenRayStream(*fan).release());
}

VOX_API int32_t VOX_CALL vox_CloseRayStream(TRayStream* stream) {
  return vox::CloseRayStream(FromSdk(stream));
}

}  // extern "C"
