/* vox engine SDK: the epoch stream.
 *
 * An engine reads the observations of one occupation epoch by epoch. vox re-reads the
 * occupation's raw file from the first epoch inside the occupation's span and delivers, per
 * epoch, one vox_EpochData followed by one vox_EpochSatData per satellite:
 *
 *   void* s = vox_OpenEpochStream(occupation, 0, NULL, NULL);
 *   vox_EpochData e;  vox_EpochSatData sat;
 *   for (int ok = vox_FindEpoch(s, NULL, &e); ok; ok = vox_GetNextEpoch(s, &e))
 *     while (vox_GetEpochDataEx(s, &sat)) { ... }
 *   vox_CloseEpochStream(s);
 *
 * Code values arrive in seconds on one time scale (GPS time for GPS, GALILEO and SBAS in
 * two-byte-code records; see docs/engine-sdk.md for the full table), phase values as the
 * receiver wrote them. Value i of a satellite record is written only when bit i of its
 * presence mask is set; the other values keep what the buffer held.
 *
 * The stream also carries the occupation's NMEA output: every navigation solution handed to
 * vox_SetEpochNavSolutionEx becomes a $GPGGA sentence in the occupation's GGAPath file.
 *
 * A stream belongs to the engine between its open and close calls and must be used by one
 * thread at a time; it takes no locks and writes no trace line. */
#ifndef VOX_SDK_EPOCH_H
#define VOX_SDK_EPOCH_H

#include "vox_sdk_core.h"

#pragma pack(push, 1)

/* Bits of vox_EpochData.flags. */
#define VOX_EPOCH_HAS_POSITION 0x1u /* x, y, z hold the occupation's navigation coordinates */
#define VOX_EPOCH_ALWAYS 0x8u

/* One epoch (66 bytes). */
typedef struct VOX_PACKED vox_EpochData {
  uint32_t one;       /* always 1 */
  uint32_t flags;     /* VOX_EPOCH_ALWAYS, plus VOX_EPOCH_HAS_POSITION */
  uint32_t seconds;   /* epoch time: whole seconds since the GPS time origin */
  uint16_t ms;        /* milliseconds */
  uint32_t sat_count; /* satellite blocks of the epoch, invalid satellites included */
  double x, y, z;     /* navigation coordinates of the occupation, metres; else 0 */
  uint8_t zero[24];
} vox_EpochData;
VOX_CHECK_SIZE(vox_EpochData, 66);
VOX_CHECK_OFFSET(vox_EpochData, one, 0);
VOX_CHECK_OFFSET(vox_EpochData, flags, 4);
VOX_CHECK_OFFSET(vox_EpochData, seconds, 8);
VOX_CHECK_OFFSET(vox_EpochData, ms, 12);
VOX_CHECK_OFFSET(vox_EpochData, sat_count, 14);
VOX_CHECK_OFFSET(vox_EpochData, x, 18);
VOX_CHECK_OFFSET(vox_EpochData, y, 26);
VOX_CHECK_OFFSET(vox_EpochData, z, 34);
VOX_CHECK_OFFSET(vox_EpochData, zero, 42);

/* Signal slots: value 2 s is the code of slot s, value 2 s + 1 its phase. */
#define VOX_SLOT_L1C 0
#define VOX_SLOT_L1P 1
#define VOX_SLOT_L2C 2
#define VOX_SLOT_L2P 3
#define VOX_SLOT_L5X 4

/* One satellite of the current epoch (88 bytes). */
typedef struct VOX_PACKED vox_EpochSatData {
  SatId sat;
  uint8_t b2, b3;     /* bytes of the satellite block, passed through */
  uint32_t presence;  /* bit i: values[i] was written */
  double values[10];  /* code (seconds) and phase of the five slots */
} vox_EpochSatData;
VOX_CHECK_SIZE(vox_EpochSatData, 88);
VOX_CHECK_OFFSET(vox_EpochSatData, sat, 0);
VOX_CHECK_OFFSET(vox_EpochSatData, b2, 2);
VOX_CHECK_OFFSET(vox_EpochSatData, b3, 3);
VOX_CHECK_OFFSET(vox_EpochSatData, presence, 4);
VOX_CHECK_OFFSET(vox_EpochSatData, values, 8);

/* A navigation solution for the NMEA output: the layout of vox_EpochData, of which the time,
 * the satellite count and the position are read, plus the HDOP value at offset 50. */
typedef struct VOX_PACKED vox_NavSolutionData {
  uint32_t reserved0;
  uint32_t reserved1;
  uint32_t seconds;
  uint16_t ms;
  uint32_t sat_count;
  double x, y, z;
  uint8_t reserved2[8];
  double hdop;
  uint8_t reserved3[8];
} vox_NavSolutionData;
VOX_CHECK_SIZE(vox_NavSolutionData, 66);
VOX_CHECK_OFFSET(vox_NavSolutionData, reserved0, 0);
VOX_CHECK_OFFSET(vox_NavSolutionData, reserved1, 4);
VOX_CHECK_OFFSET(vox_NavSolutionData, seconds, 8);
VOX_CHECK_OFFSET(vox_NavSolutionData, ms, 12);
VOX_CHECK_OFFSET(vox_NavSolutionData, sat_count, 14);
VOX_CHECK_OFFSET(vox_NavSolutionData, x, 18);
VOX_CHECK_OFFSET(vox_NavSolutionData, y, 26);
VOX_CHECK_OFFSET(vox_NavSolutionData, z, 34);
VOX_CHECK_OFFSET(vox_NavSolutionData, reserved2, 42);
VOX_CHECK_OFFSET(vox_NavSolutionData, hdop, 50);
VOX_CHECK_OFFSET(vox_NavSolutionData, reserved3, 58);

#pragma pack(pop)

VOX_BEGIN_DECLS

/* A stream over an occupation (its number or full identifier), thinned to interval_ms when
 * that is not 0, limited to [*from, *to] where these lie inside the occupation's span.
 * Null when the occupation has no epochs or its file cannot be read. */
VOX_API void* VOX_CALL vox_OpenEpochStream(uint32_t occupation_id, uint32_t interval_ms,
                                           const TimeMs* from, const TimeMs* to);
/* The first epoch at or after *time (the stream's start when time is null): 1 with out
 * filled, 0 when there is none. Must precede the first vox_GetNextEpoch. */
VOX_API int32_t VOX_CALL vox_FindEpoch(void* stream, const TimeMs* time, vox_EpochData* out);
/* The next epoch: 1 with out filled, 0 at the end of the span or the file. */
VOX_API int32_t VOX_CALL vox_GetNextEpoch(void* stream, vox_EpochData* out);
/* The next valid satellite of the current epoch: 1 with out filled, 0 when none is left. */
VOX_API int32_t VOX_CALL vox_GetEpochDataEx(void* stream, vox_EpochSatData* out);
/* Writes a $GPGGA sentence (quality 1) to the occupation's NMEA file, creating the file at
 * the first call of the stream. Returns 0. */
VOX_API int32_t VOX_CALL vox_SetEpochNavSolutionEx(void* stream,
                                                   const vox_NavSolutionData* solution);
/* Closes the NMEA output and the file and frees the stream (null is accepted); returns 1. */
VOX_API int32_t VOX_CALL vox_CloseEpochStream(void* stream);

VOX_END_DECLS

#endif /* VOX_SDK_EPOCH_H */
