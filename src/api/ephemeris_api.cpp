// Exported broadcast and precise ephemeris streams: thin adapters over the task's stores.
// None of them traces; the stores are read-only while engines run, so none takes a lock.
#include <new>

#include "raw/ephemeris_store.h"
#include "raw/precise_store.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_ephemeris.h"

namespace {

void* OwnPrecise(std::optional<vox::PreciseCursor> cursor) {
  if (!cursor) return nullptr;
  return new (std::nothrow) vox::PreciseCursor(*cursor);
}

}  // namespace

extern "C" {

VOX_API void* VOX_CALL vox_OpenEphemerisStreamEx(SatId sat, const uint32_t* from,
                                                 const uint32_t* to) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return nullptr;
  return vox::OpenEphemerisStream(task->ephemerides, sat, from, to);
}

VOX_API void* VOX_CALL vox_OpenEphemerisStream(uint8_t short_number, const uint32_t* from,
                                               const uint32_t* to) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return nullptr;
  return vox::OpenEphemerisStreamShort(task->ephemerides, short_number, from, to);
}

VOX_API int32_t VOX_CALL vox_FindEphemerisEx(void* stream, const uint32_t* time,
                                             vox_EphemerisData* out) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  return vox::FindEphemeris(task->ephemerides, static_cast<vox::EphemerisCursor*>(stream), time,
                            out);
}

VOX_API int32_t VOX_CALL vox_FindEphemeris(void* stream, const uint32_t* time,
                                           vox_ShortEphemerisData* out) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr) return 0;
  return vox::FindEphemerisShort(task->ephemerides, static_cast<vox::EphemerisCursor*>(stream),
                                 time, out);
}

VOX_API int32_t VOX_CALL vox_GetNextEphemerisEx(void* stream, vox_EphemerisData* out) {
  return vox::GetNextEphemeris(static_cast<vox::EphemerisCursor*>(stream), out);
}

VOX_API int32_t VOX_CALL vox_GetNextEphemeris(void* stream, vox_ShortEphemerisData* out) {
  return vox::GetNextEphemerisShort(static_cast<vox::EphemerisCursor*>(stream), out);
}

VOX_API int32_t VOX_CALL vox_CloseEphemerisStream(void* stream) {
  return vox::CloseEphemerisStream(static_cast<vox::EphemerisCursor*>(stream));
}

VOX_API void* VOX_CALL vox_OpenPreciseEphemerisStreamEx(SatId sat, const uint32_t* from,
                                                        const uint32_t* to) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr || from == nullptr || to == nullptr) return nullptr;
  return OwnPrecise(task->precise.Open(sat, *from, *to));
}

VOX_API void* VOX_CALL vox_OpenPreciseEphemerisStream(uint8_t short_number, const uint32_t* from,
                                                      const uint32_t* to) {
  vox::TTask* task = vox::CurrentTask();
  if (task == nullptr || from == nullptr || to == nullptr) return nullptr;
  return OwnPrecise(task->precise.OpenShort(short_number, *from, *to));
}

VOX_API int32_t VOX_CALL vox_GetNextPreciseEphemeris(void* stream, vox_PreciseEphemerisData* out) {
  if (stream == nullptr || out == nullptr) return 0;
  return vox::GetNextPrecise(*static_cast<vox::PreciseCursor*>(stream), *out) ? 1 : 0;
}

VOX_API int32_t VOX_CALL vox_ClosePreciseEphemerisStream(void* stream) {
  delete static_cast<vox::PreciseCursor*>(stream);
  return 1;
}

}  // extern "C"
