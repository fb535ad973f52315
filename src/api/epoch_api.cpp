// Exported epoch stream functions: the stream lives in the raw room; the navigation solutions
// it carries are written by the NMEA writer of the results room. None of them traces.
#include <new>

#include "platform/platform.h"
#include "raw/epoch_stream.h"
#include "results/nmea_writer.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_epoch.h"

namespace {

vox::EpochStream* StreamOf(void* stream) {
  return static_cast<vox::EpochStream*>(stream);
}

}  // namespace

extern "C" {

VOX_API void* VOX_CALL vox_OpenEpochStream(uint32_t occupation_id, uint32_t interval_ms,
                                           const TimeMs* from, const TimeMs* to) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return nullptr;
  vox::TOccupItem* occupation = task->job.FindOccup(occupation_id);
  if (occupation == nullptr) return nullptr;
  try {
    return vox::EpochStream::Open(*occupation, interval_ms, from, to).release();
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

VOX_API int32_t VOX_CALL vox_FindEpoch(void* stream, const TimeMs* time, vox_EpochData* out) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr || out == nullptr) return 0;
  return StreamOf(stream)->Find(time, *out) ? 1 : 0;
}

VOX_API int32_t VOX_CALL vox_GetNextEpoch(void* stream, vox_EpochData* out) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr || out == nullptr) return 0;
  return StreamOf(stream)->GetNext(*out) ? 1 : 0;
}

VOX_API int32_t VOX_CALL vox_GetEpochDataEx(void* stream, vox_EpochSatData* out) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr || out == nullptr) return 0;
  return StreamOf(stream)->GetSatellite(*out) ? 1 : 0;
}

VOX_API int32_t VOX_CALL vox_SetEpochNavSolutionEx(void* stream,
                                                   const vox_NavSolutionData* solution) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr || solution == nullptr) return 0;
  vox::EpochStream* s = StreamOf(stream);
  vox::TBufFile* output = s->NavOutput(vox::kNmeaOpenMode);
  if (output == nullptr) return 0;
  vox::NmeaFix fix;
  fix.time = TimeMs{solution->seconds, solution->ms};
  fix.x = solution->x;
  fix.y = solution->y;
  fix.z = solution->z;
  fix.hdop = static_cast<float>(solution->hdop);
  fix.satellites = solution->sat_count;
  fix.quality = 1;
  vox::WriteNmeaFix(*output, s->nav_sentence_counter(), fix);
  return 0;
}

VOX_API int32_t VOX_CALL vox_CloseEpochStream(void* stream) {
  delete StreamOf(stream);
  return 1;
}

}  // extern "C"
