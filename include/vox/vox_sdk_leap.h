/* vox engine SDK: leap seconds (GPS time minus UTC, in whole seconds).
 *
 * The library keeps one table for the whole process. Any thread may call these functions
 * at any time; the table is locked for the duration of each call. They write no trace. */
#ifndef VOX_SDK_LEAP_H
#define VOX_SDK_LEAP_H

#include "vox_sdk_core.h"

VOX_BEGIN_DECLS

/* The leap seconds at *time, or 0xFFFFFFFF when the table does not cover it (or time is
 * null). */
VOX_API uint32_t VOX_CALL vox_GetLeapSeconds(const TimeMs* time);

/* The leap seconds at *second minus those at *first (a time the table does not cover counts
 * 0); a decrease comes out as its two's complement. 0 when there is no table or a pointer is
 * null. */
VOX_API uint32_t VOX_CALL vox_GetLeapChanges(const TimeMs* first, const TimeMs* second);

/* Reports the leap seconds observed at *time. When the table covers the time, its value is
 * returned and nothing changes; otherwise a span for the half year holding the time is added
 * with leap_seconds, which is returned. 0xFFFFFFFF when the table is full (or time is null). */
VOX_API uint32_t VOX_CALL vox_SetLeapSeconds(const TimeMs* time, uint32_t leap_seconds);

VOX_END_DECLS

#endif /* VOX_SDK_LEAP_H */
