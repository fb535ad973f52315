// Exported meteorological stream functions over the task's tracks. None of them traces.
#include <new>

#include "platform/platform.h"
#include "raw/meteo_stream.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_meteo.h"

extern "C" {

VOX_API void* VOX_CALL vox_OpenMeteoStream(uint32_t file_id) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return nullptr;
  try {
    return vox::OpenMeteoCursor(task->meteo_tracks, file_id).release();
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

VOX_API int32_t VOX_CALL vox_GetMeteoData(void* stream, const TimeMs* time, vox_MeteoData* out) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr || time == nullptr || out == nullptr) return 0;
  return vox::QueryMeteo(*static_cast<vox::MeteoCursor*>(stream), *time, *out) ? 1 : 0;
}

VOX_API int32_t VOX_CALL vox_CloseMeteoStream(void* stream) {
  delete static_cast<vox::MeteoCursor*>(stream);
  return 1;
}

}  // extern "C"
