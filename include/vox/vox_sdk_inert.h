/* vox engine SDK: functions that do nothing.
 *
 * These exports exist so that engines written against older interfaces still load and run.
 * Each returns at once: it reads no argument, touches no record, takes no lock and writes no
 * trace line. Where a working sibling exists, the declaration borrows its argument list, so
 * an engine can switch to the sibling by changing the name:
 *
 *   vox_GetEpochData        -> vox_GetEpochDataEx
 *   vox_SetEpochNavSolution -> vox_SetEpochNavSolutionEx
 *   vox_GetNextRay          (rays are written with vox_SetNextRay; they cannot be read back)
 *   vox_GetFanResult        (fan results are written with vox_SetFanResult)
 *
 * vox_Lock and vox_UnLock take no lock: an engine that needs mutual exclusion between its own
 * threads must bring its own. The 22 functions with a result return 0 (failure, nothing found,
 * false); the 4 declared void return nothing. */
#ifndef VOX_SDK_INERT_H
#define VOX_SDK_INERT_H

#include "vox_sdk_core.h"
#include "vox_sdk_epoch.h"
#include "vox_sdk_results.h"

VOX_BEGIN_DECLS

/* Returning 0. */
VOX_API int32_t VOX_CALL vox_GetEditOccupationData(void* record);
VOX_API int32_t VOX_CALL vox_GetEditOccupationDataEx(void* record);
VOX_API int32_t VOX_CALL vox_SetEditOccupationData(const void* record);
VOX_API int32_t VOX_CALL vox_SetEditOccupationDataEx(const void* record);
VOX_API int32_t VOX_CALL vox_GetEpochData(void* stream, vox_EpochSatData* out);
VOX_API int32_t VOX_CALL vox_SetEpochNavSolution(void* stream,
                                                 const vox_NavSolutionData* solution);
VOX_API int32_t VOX_CALL vox_GetNextRay(TRayStream* stream, vox_RayData* ray);
VOX_API int32_t VOX_CALL vox_GetFanResult(uint32_t fan_id, vox_FanResult* result);
VOX_API int32_t VOX_CALL vox_GetFanProcessed(uint32_t fan_id);
VOX_API int32_t VOX_CALL vox_SetFanProcessed(uint32_t fan_id);
VOX_API int32_t VOX_CALL vox_GetVectorProcessed(uint32_t vector_id);
VOX_API int32_t VOX_CALL vox_SetVectorProcessed(uint32_t vector_id);
VOX_API int32_t VOX_CALL vox_SetFanProperty(uint32_t fan_id, const void* block);
VOX_API int32_t VOX_CALL vox_SetVectorProperty(uint32_t vector_id, const void* block);
VOX_API int32_t VOX_CALL vox_SetSolutionProperty(uint32_t unused, const void* block);
VOX_API int32_t VOX_CALL vox_GetNextSolXOccup(void* stream, void* record);
VOX_API int32_t VOX_CALL vox_GetPrevSolXOccup(void* stream, void* record);
VOX_API int32_t VOX_CALL vox_SetOccupationMeasMask(uint32_t occupation_id, uint32_t mask);
VOX_API int32_t VOX_CALL vox_SetOccupationStatus(uint32_t occupation_id, uint32_t status);
VOX_API int32_t VOX_CALL vox_InitNewThreadTLS(vox_ThreadContext* context);
VOX_API int32_t VOX_CALL vox_Lock(void);
VOX_API int32_t VOX_CALL vox_Translate(void);

/* Returning nothing. */
VOX_API void VOX_CALL vox_AntennaToOffset(void);
VOX_API void VOX_CALL vox_GetOccupationTiming(void);
VOX_API void VOX_CALL vox_GetOccupationTimingEx(void);
VOX_API void VOX_CALL vox_UnLock(void);

VOX_END_DECLS

#endif /* VOX_SDK_INERT_H */
