// Exported leap-second functions: the table and its lock live in the job room.
#include "job/leap_seconds.h"
#include "vox/vox_sdk_leap.h"

extern "C" {

VOX_API uint32_t VOX_CALL vox_GetLeapSeconds(const TimeMs* time) {
  if (time == nullptr) return vox::kLeapUnknown;
  return vox::GetLeapSeconds(*time);
}

VOX_API uint32_t VOX_CALL vox_GetLeapChanges(const TimeMs* first, const TimeMs* second) {
  if (first == nullptr || second == nullptr) return 0;
  return vox::GetLeapChanges(*first, *second);
}

VOX_API uint32_t VOX_CALL vox_SetLeapSeconds(const TimeMs* time, uint32_t leap_seconds) {
  if (time == nullptr) return vox::kLeapUnknown;
  return vox::SetLeapSeconds(*time, leap_seconds);
}

}  // extern "C"
