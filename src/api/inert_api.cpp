// The exports that do nothing. They are kept because engines built against older interfaces
// import them; each returns at once without reading its arguments or touching anything, and
// none writes a trace line.
#include "vox/vox_sdk_inert.h"

extern "C" {

VOX_API int32_t VOX_CALL vox_GetEditOccupationData(void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetEditOccupationDataEx(void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetEditOccupationData(const void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetEditOccupationDataEx(const void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetEpochData(void*, vox_EpochSatData*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetEpochNavSolution(void*, const vox_NavSolutionData*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetNextRay(TRayStream*, vox_RayData*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetFanResult(uint32_t, vox_FanResult*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetFanProcessed(uint32_t) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetFanProcessed(uint32_t) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetVectorProcessed(uint32_t) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetVectorProcessed(uint32_t) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetFanProperty(uint32_t, const void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetVectorProperty(uint32_t, const void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetSolutionProperty(uint32_t, const void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetNextSolXOccup(void*, void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_GetPrevSolXOccup(void*, void*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetOccupationMeasMask(uint32_t, uint32_t) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_SetOccupationStatus(uint32_t, uint32_t) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_InitNewThreadTLS(vox_ThreadContext*) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_Lock(void) {
  return 0;
}
VOX_API int32_t VOX_CALL vox_Translate(void) {
  return 0;
}

VOX_API void VOX_CALL vox_AntennaToOffset(void) {}
VOX_API void VOX_CALL vox_GetOccupationTiming(void) {}
VOX_API void VOX_CALL vox_GetOccupationTimingEx(void) {}
VOX_API void VOX_CALL vox_UnLock(void) {}

}  // extern "C"
