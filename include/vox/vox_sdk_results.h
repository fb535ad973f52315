/* vox engine SDK: result functions, result records and plot streams.
 *
 * An engine stores its results through these functions; vox turns each record into a record
 * of the job's result file (or, for the span kinds of vox_CopyData, keeps it on the vector or
 * fan it names). Every function whose name ends in Ex takes a result writer first: the writer
 * of the vox_ThreadContext the engine was handed (null means the task's own writer); the
 * plain form always uses the task's writer.
 *
 * Threads: engine threads may call these concurrently, each through its own thread writer
 * (see vox_InitNewThread). vox_SetVectorResult(Ex) holds the task's solution lock while it
 * updates the solved positions of the job's points and writes its record. A plot stream or a
 * ray stream belongs to the thread that opened it.
 *
 * All records are packed and little-endian; the offsets below are part of the interface. */
#ifndef VOX_SDK_RESULTS_H
#define VOX_SDK_RESULTS_H

#include "vox_sdk_core.h"

#ifndef VOX_TRAYSTREAM_DECLARED
#define VOX_TRAYSTREAM_DECLARED
/* A fan's ray stream (vox_OpenRayStream / vox_CloseRayStream); opaque to engines. */
typedef struct TRayStream TRayStream;
#endif

/* A plot stream (vox_OpenPlotStream / vox_ClosePlotStream); opaque to engines. */
typedef struct vox_PlotStream vox_PlotStream;

#pragma pack(push, 1)

/* Input of vox_SetVectorResult (124 bytes). The values marked "stored" are kept in the
 * result record as received. */
typedef struct VOX_PACKED vox_VectorResult {
  uint32_t solved;   /* nonzero: the record carries a solution */
  uint32_t reversed; /* nonzero: the solution runs from the second point to the first */
  double base[3];    /* base position X, Y, Z, metres */
  float base_rms;
  double baseline[3]; /* dX, dY, dZ, metres */
  float baseline_rms;
  uint32_t solution_flags;
  uint32_t stored_a[4]; /* stored */
  float stored_b;       /* stored */
  float stored_c;       /* stored */
  uint32_t stored_d[4]; /* stored */
  float stored_e;       /* stored */
  float stored_f;       /* stored */
  uint32_t reserved;    /* not read */
  float extra;          /* stored only when solution_flags carry 0x1000 */
} vox_VectorResult;

/* Input of vox_SetFanResult (28 bytes). */
typedef struct VOX_PACKED vox_FanResult {
  uint32_t has_position; /* nonzero: position holds the fan's solved position */
  double position[3];    /* X, Y, Z, metres */
} vox_FanResult;

/* Input of vox_SetNextRay (54 bytes): one kinematic position of a fan. */
typedef struct VOX_PACKED vox_RayData {
  TimeMs time;        /* GPS time */
  double position[3]; /* X, Y, Z, metres (Earth-centred) */
  uint32_t values[3]; /* stored */
  uint32_t flags;     /* bits 0-1 fix kind, 3, 10, 13-29 quality marks (see below) */
  float hdop;
  uint32_t satellites;
} vox_RayData;

/* vox_CopyData kinds 5 and 10 (at least 56 bytes): per-satellite record with two times. */
typedef struct VOX_PACKED vox_CopySatellite {
  uint8_t reserved[16]; /* not read */
  uint16_t obs_flags;
  uint8_t sat_a; /* satellite index (0 to 148) */
  uint8_t sat_b; /* second satellite index, 0 when there is none */
  TimeMs time1;
  TimeMs time2;
  uint32_t value;
  float value_f;
  uint32_t values[4];
} vox_CopySatellite;

/* vox_CopyData kinds 8 and 11 (at least 32 bytes). */
typedef struct VOX_PACKED vox_CopySatelliteShort {
  uint8_t reserved[16]; /* not read */
  uint16_t obs_flags;
  uint8_t sat_a;
  uint8_t sat_b;
  uint32_t values[3];
} vox_CopySatelliteShort;

/* vox_CopyData kind 1 (8 bytes): start of a solution. */
typedef struct VOX_PACKED vox_CopySolution {
  uint32_t type;
  uint32_t flags;
} vox_CopySolution;

/* vox_CopyData kind 6 (at least 168 bytes): the processing span of a vector. */
typedef struct VOX_PACKED vox_CopyVectorSpan {
  uint8_t reserved[124]; /* not read */
  uint32_t vector_id;    /* section number or full identifier */
  TimeMs start;
  TimeMs end;
  uint32_t value1;
  uint32_t value2;
  float value;   /* 0 or more: the span is set */
  char name[16]; /* zero-terminated; at most 15 characters are stored */
} vox_CopyVectorSpan;

/* vox_CopyData kind 7 (at least 76 bytes): the processing span of a fan. */
typedef struct VOX_PACKED vox_CopyFanSpan {
  uint8_t reserved[32]; /* not read */
  uint32_t fan_id;
  TimeMs start;
  TimeMs end;
  uint32_t value1;
  uint32_t value2;
  float value;
  char name[16];
} vox_CopyFanSpan;

/* The record of vox_CopyData: one layout per data kind, all at the same address. */
typedef union vox_CopyDataRec {
  uint8_t bytes[168];
  vox_CopySolution solution;              /* kind 1 */
  vox_CopySatellite satellite;            /* kinds 5 and 10 */
  vox_CopyVectorSpan vector_span;         /* kind 6 */
  vox_CopyFanSpan fan_span;               /* kind 7 */
  vox_CopySatelliteShort satellite_short; /* kinds 8 and 11 */
} vox_CopyDataRec;

#pragma pack(pop)

VOX_CHECK_SIZE(vox_VectorResult, 124);
VOX_CHECK_OFFSET(vox_VectorResult, solved, 0);
VOX_CHECK_OFFSET(vox_VectorResult, reversed, 4);
VOX_CHECK_OFFSET(vox_VectorResult, base, 8);
VOX_CHECK_OFFSET(vox_VectorResult, base_rms, 32);
VOX_CHECK_OFFSET(vox_VectorResult, baseline, 36);
VOX_CHECK_OFFSET(vox_VectorResult, baseline_rms, 60);
VOX_CHECK_OFFSET(vox_VectorResult, solution_flags, 64);
VOX_CHECK_OFFSET(vox_VectorResult, stored_a, 68);
VOX_CHECK_OFFSET(vox_VectorResult, stored_b, 84);
VOX_CHECK_OFFSET(vox_VectorResult, stored_c, 88);
VOX_CHECK_OFFSET(vox_VectorResult, stored_d, 92);
VOX_CHECK_OFFSET(vox_VectorResult, stored_e, 108);
VOX_CHECK_OFFSET(vox_VectorResult, stored_f, 112);
VOX_CHECK_OFFSET(vox_VectorResult, reserved, 116);
VOX_CHECK_OFFSET(vox_VectorResult, extra, 120);

VOX_CHECK_SIZE(vox_FanResult, 28);
VOX_CHECK_OFFSET(vox_FanResult, has_position, 0);
VOX_CHECK_OFFSET(vox_FanResult, position, 4);

VOX_CHECK_SIZE(vox_RayData, 54);
VOX_CHECK_OFFSET(vox_RayData, time, 0);
VOX_CHECK_OFFSET(vox_RayData, position, 6);
VOX_CHECK_OFFSET(vox_RayData, values, 30);
VOX_CHECK_OFFSET(vox_RayData, flags, 42);
VOX_CHECK_OFFSET(vox_RayData, hdop, 46);
VOX_CHECK_OFFSET(vox_RayData, satellites, 50);

VOX_CHECK_SIZE(vox_CopySatellite, 56);
VOX_CHECK_OFFSET(vox_CopySatellite, reserved, 0);
VOX_CHECK_OFFSET(vox_CopySatellite, obs_flags, 16);
VOX_CHECK_OFFSET(vox_CopySatellite, sat_a, 18);
VOX_CHECK_OFFSET(vox_CopySatellite, sat_b, 19);
VOX_CHECK_OFFSET(vox_CopySatellite, time1, 20);
VOX_CHECK_OFFSET(vox_CopySatellite, time2, 26);
VOX_CHECK_OFFSET(vox_CopySatellite, value, 32);
VOX_CHECK_OFFSET(vox_CopySatellite, value_f, 36);
VOX_CHECK_OFFSET(vox_CopySatellite, values, 40);

VOX_CHECK_SIZE(vox_CopySatelliteShort, 32);
VOX_CHECK_OFFSET(vox_CopySatelliteShort, reserved, 0);
VOX_CHECK_OFFSET(vox_CopySatelliteShort, obs_flags, 16);
VOX_CHECK_OFFSET(vox_CopySatelliteShort, sat_a, 18);
VOX_CHECK_OFFSET(vox_CopySatelliteShort, sat_b, 19);
VOX_CHECK_OFFSET(vox_CopySatelliteShort, values, 20);

VOX_CHECK_SIZE(vox_CopySolution, 8);
VOX_CHECK_OFFSET(vox_CopySolution, type, 0);
VOX_CHECK_OFFSET(vox_CopySolution, flags, 4);

VOX_CHECK_SIZE(vox_CopyVectorSpan, 168);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, reserved, 0);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, vector_id, 124);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, start, 128);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, end, 134);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, value1, 140);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, value2, 144);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, value, 148);
VOX_CHECK_OFFSET(vox_CopyVectorSpan, name, 152);

VOX_CHECK_SIZE(vox_CopyFanSpan, 76);
VOX_CHECK_OFFSET(vox_CopyFanSpan, reserved, 0);
VOX_CHECK_OFFSET(vox_CopyFanSpan, fan_id, 32);
VOX_CHECK_OFFSET(vox_CopyFanSpan, start, 36);
VOX_CHECK_OFFSET(vox_CopyFanSpan, end, 42);
VOX_CHECK_OFFSET(vox_CopyFanSpan, value1, 48);
VOX_CHECK_OFFSET(vox_CopyFanSpan, value2, 52);
VOX_CHECK_OFFSET(vox_CopyFanSpan, value, 56);
VOX_CHECK_OFFSET(vox_CopyFanSpan, name, 60);

VOX_CHECK_SIZE(vox_CopyDataRec, 168);
VOX_CHECK_OFFSET(vox_CopyDataRec, bytes, 0);
VOX_CHECK_OFFSET(vox_CopyDataRec, solution, 0);
VOX_CHECK_OFFSET(vox_CopyDataRec, satellite, 0);
VOX_CHECK_OFFSET(vox_CopyDataRec, vector_span, 0);
VOX_CHECK_OFFSET(vox_CopyDataRec, fan_span, 0);
VOX_CHECK_OFFSET(vox_CopyDataRec, satellite_short, 0);

/* Data kinds of vox_CopyData. */
#define VOX_COPY_SOLUTION_START 1 /* vox_CopySolution; clears the writer's plot counter */
#define VOX_COPY_SATELLITE_B 5    /* vox_CopySatellite, one-byte satellite codes */
#define VOX_COPY_VECTOR_SPAN 6    /* vox_CopyVectorSpan */
#define VOX_COPY_FAN_SPAN 7       /* vox_CopyFanSpan */
#define VOX_COPY_SATELLITE_A 8    /* vox_CopySatelliteShort, one-byte satellite codes */
#define VOX_COPY_PLOT_COUNTER 9   /* raises the writer's plot counter; returns 0 */
#define VOX_COPY_SATELLITE_C 10   /* vox_CopySatellite, two-byte satellite codes */
#define VOX_COPY_SATELLITE_D 11   /* vox_CopySatelliteShort, two-byte satellite codes */

VOX_BEGIN_DECLS

/* Stores a vector solution; writes the trace "set vector result #%08X\n". Returns 0 when no
 * vector has the identifier, 2 when the solution's end point lies more than 1 m + 10 ppm of
 * the baseline length away from its stored solution (the record is still written), else 1. */
VOX_API int32_t VOX_CALL vox_SetVectorResult(uint32_t vector_id, const vox_VectorResult* result);
VOX_API int32_t VOX_CALL vox_SetVectorResultEx(void* writer, uint32_t vector_id,
                                               const vox_VectorResult* result);

/* Stores a fan's solved position. 0 when no fan has the identifier, else 1. */
VOX_API int32_t VOX_CALL vox_SetFanResult(uint32_t fan_id, const vox_FanResult* result);
VOX_API int32_t VOX_CALL vox_SetFanResultEx(void* writer, uint32_t fan_id,
                                            const vox_FanResult* result);

/* Stores one ray of a fan (and its GGA sentence when the fan has an NMEA output). The NMEA
 * quality is 0 when any of the flag bits 13 to 29 is set, else 4, 4, 5, 2 for the values 0 to
 * 3 of bits 0-1. 0 for a null stream, else 1. */
VOX_API int32_t VOX_CALL vox_SetNextRay(TRayStream* stream, const vox_RayData* ray);
VOX_API int32_t VOX_CALL vox_SetNextRayEx(void* writer, TRayStream* stream, const vox_RayData* ray);

/* Stores a record of the given data kind (VOX_COPY_*); size is the record's size in bytes.
 * 1 when the kind was handled, 0 for an unknown kind, a size below the kind's minimum, or a
 * span whose vector or fan does not exist. */
VOX_API int32_t VOX_CALL vox_CopyData(uint32_t kind, const vox_CopyDataRec* record, uint32_t size);
VOX_API int32_t VOX_CALL vox_CopyDataEx(void* writer, uint32_t kind, const vox_CopyDataRec* record,
                                        uint32_t size);

/* Plot streams: open, describe each line (vox_SetLine), write the descriptions
 * (vox_CreatePlot), then per epoch send the time on line 1 followed by the values of the
 * other lines (vox_SendData), and close. Lines are indexed 0 to 1023. A line name such as
 * "G05-G12 L1" or "R07 L2C" names the satellites and the signal; options "m" and "c" are
 * marks for the host that draws the curves. */
VOX_API vox_PlotStream* VOX_CALL vox_OpenPlotStream(void);
VOX_API vox_PlotStream* VOX_CALL vox_OpenPlotStreamEx(void* writer);
VOX_API int32_t VOX_CALL vox_SetLine(vox_PlotStream* stream, int32_t index, uint32_t mode,
                                     uint32_t unused, const char* name, const char* options);
VOX_API int32_t VOX_CALL vox_CreatePlot(vox_PlotStream* stream, uint32_t unused, int32_t index,
                                        uint32_t unused2);
VOX_API int32_t VOX_CALL vox_SendData(vox_PlotStream* stream, int32_t index, uint32_t epoch,
                                      double value);
VOX_API int32_t VOX_CALL vox_ClosePlotStream(vox_PlotStream* stream);

VOX_END_DECLS

#endif /* VOX_SDK_RESULTS_H */
