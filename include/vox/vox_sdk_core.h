/* vox engine SDK: basic types shared by every record and function family. */
#ifndef VOX_SDK_CORE_H
#define VOX_SDK_CORE_H

#include "vox_defs.h"

#pragma pack(push, 1)

/* Time of the whole system: whole seconds since the GPS time origin (1980-01-06 00:00:00)
 * and milliseconds of that second; packed as 4 + 2 bytes. */
typedef struct VOX_PACKED TimeMs {
  uint32_t seconds;
  uint16_t ms;
} TimeMs;
VOX_CHECK_SIZE(TimeMs, 6);
VOX_CHECK_OFFSET(TimeMs, ms, 4);

/* Satellite identifier: number in bits 0 to 7, system in bits 8 to 10
 * (0 GPS, 1 GLONASS, 2 BDS, 3 GALILEO, 4 SBAS). */
typedef uint16_t SatId;

/* Callbacks handed to every engine call inside vox_ThreadContext. They return the task's
 * engine flags with bit 31 set (MessageProc returns 0 for a null writer). */
typedef uint32_t(VOX_CALL* vox_ProgressProc)(void* writer, int32_t percent);
typedef uint32_t(VOX_CALL* vox_MessageProc)(void* writer, uint32_t kind, const char* text);

/* The record handed to every engine call (40 bytes). An engine that starts threads of its
 * own passes a copy to vox_InitNewThread before the thread writes any result. */
typedef struct VOX_PACKED vox_ThreadContext {
  uint32_t flags;           /* engine flags for group runs, 0 per occupation; bit 6: own thread */
  void* writer;             /* result writer, passed back to result functions and callbacks */
  void* control_window;     /* the run's control handle */
  vox_ProgressProc progress;
  vox_MessageProc message;
  uint32_t id;              /* occupation number for per-occupation runs, 1 for group runs */
} vox_ThreadContext;
#pragma pack(pop)

VOX_CHECK_SIZE(vox_ThreadContext, 40);
VOX_CHECK_OFFSET(vox_ThreadContext, flags, 0);
VOX_CHECK_OFFSET(vox_ThreadContext, writer, 4);
VOX_CHECK_OFFSET(vox_ThreadContext, control_window, 12);
VOX_CHECK_OFFSET(vox_ThreadContext, progress, 20);
VOX_CHECK_OFFSET(vox_ThreadContext, message, 28);
VOX_CHECK_OFFSET(vox_ThreadContext, id, 36);

VOX_BEGIN_DECLS

/* Thread functions. An engine thread that writes results registers itself before its first
 * result with vox_InitNewThread, passing its own copy of the context it was given: the copy
 * then carries a result writer of the thread's own (bit 6 set in flags), and the calling
 * thread's floating-point mode is set for engine code. Returns 1.
 * vox_DeleteThread releases it when the thread's work is done: the thread's records reach
 * the result file as one block, and the thread counts as 100 percent done. Returns 0.
 * vox_GetThreadCount: the job's "NumCPUs" (1 to 32). All three are for engine calls only. */
VOX_API uint32_t vox_InitNewThread(vox_ThreadContext* context);
VOX_API uint32_t vox_DeleteThread(vox_ThreadContext* context);
VOX_API uint32_t vox_GetThreadCount(void);

VOX_END_DECLS

#endif /* VOX_SDK_CORE_H */
