/* vox engine SDK: the job's occupations, antennas, receivers, raw files, points, vectors and
 * fans, as an engine reads them, and the small solution queries.
 *
 * Streams follow one pattern: vox_Open...Stream returns a cursor (null when there is nothing
 * to stream), vox_GetNext... fills the caller's record and advances (0 at the end, and on
 * every later call), vox_Close...Stream frees the cursor. A cursor belongs to the thread that
 * opened it.
 *
 * Identifiers: an argument that names an item is or-ed with the item's type tag, so the plain
 * section number works as well as the full identifier (point 0x01000000, occupation
 * 0x02000000, raw file 0x04000000, vector 0x08000000, fan 0x10000000, antenna and receiver
 * 0x80000000).
 *
 * Threads: the job's items do not change while an engine runs, so the streams take no lock.
 * Navigation coordinates, navigation means and solved positions are the exception: they are
 * read and written under the task's solution lock (vox_GetNavCoord, vox_SetNavCoord,
 * vox_GetSiteData), so engine threads may call those concurrently.
 *
 * All records are packed and little-endian; the offsets below are part of the interface.
 * Text fields hold at most 63 bytes and a terminating zero. */
#ifndef VOX_SDK_STREAMS_H
#define VOX_SDK_STREAMS_H

#include "vox_sdk_core.h"
#include "vox_sdk_engine.h"

#ifndef VOX_TRAYSTREAM_DECLARED
#define VOX_TRAYSTREAM_DECLARED
/* A fan's ray stream (vox_OpenRayStream / vox_CloseRayStream); opaque to engines. */
typedef struct TRayStream TRayStream;
#endif

/* Request bits of the occupation records' mask: set before the call; the call clears the
 * record and sets the bits of what it filled. */
#define VOX_OCC_METEO 0x02u       /* meteorological values; filled: 0x02 and 0x400 */
#define VOX_OCC_SAT_STATES 0x04u  /* satellite state tables */
#define VOX_OCC_EPOCHS 0x08u      /* always filled: epoch count and intervals */
#define VOX_OCC_ANTENNA 0x10u     /* antenna record (no filled bit of its own) */
#define VOX_OCC_ANTENNA_ALT 0x20u /* antenna record; filled together with 0x40 */
#define VOX_OCC_L1_OFFSETS 0x40u  /* L1 antenna offsets; filled: 0x20 and 0x40 */
#define VOX_OCC_NAME 0x80u        /* occupation name */
#define VOX_OCC_SIGNALS 0x200u    /* inverted signal masks; filled: 0x200 and 0x800 */
#define VOX_OCC_METEO_FILLED 0x400u
#define VOX_OCC_SIGNALS_FILLED 0x800u

/* Satellite states of the state tables (two bits per satellite). */
#define VOX_SAT_NONE 0u
#define VOX_SAT_USABLE 1u
#define VOX_SAT_EXCLUDED 2u

/* Site types of vox_SiteData. */
#define VOX_SITE_NONE 0u
#define VOX_SITE_KNOWN 1u
#define VOX_SITE_SOLVED 2u
#define VOX_SITE_NAV_MEAN 3u

#pragma pack(push, 1)

/* An antenna (344 bytes). Pattern blocks: GPS L1, L2, L5, L6 (slots 0 to 3), each filled
 * only when the antenna holds an accepted pattern in that slot. */
typedef struct VOX_PACKED vox_AntennaData {
  uint32_t id;
  uint32_t type_word; /* 0 for antennas of the job file */
  uint8_t reserved[20];
  float l2_offset[3]; /* up, east, north, metres */
  float patterns[4][19];
} vox_AntennaData;

/* An antenna with all sixteen pattern slots (1264 bytes). */
typedef struct VOX_PACKED vox_AntennaDataEx {
  uint32_t id;
  uint32_t type_word;
  uint8_t reserved[20];
  float l2_offset[3];    /* up, east, north, metres */
  uint32_t pattern_mask; /* bit k: slot k filled */
  uint32_t slot_count;   /* one more than the highest filled slot, 0 if none */
  float patterns[16][19];
} vox_AntennaDataEx;

/* An occupation (562 bytes). Set `id` and `mask` (request bits) before
 * vox_GetOccupationData; the stream functions set only `mask`. */
typedef struct VOX_PACKED vox_OccupationData {
  uint32_t occupation_id;
  uint32_t mask;
  uint32_t id;          /* input of vox_GetOccupationData; output copy */
  uint32_t receiver_id; /* 0 if none */
  uint32_t point_id;    /* 0 if none */
  uint32_t file_id;     /* 0 if none */
  uint32_t file_id2;
  TimeMs first_epoch;
  TimeMs last_epoch;
  vox_AntennaData antenna; /* bit 0x10 or 0x20 */
  uint8_t reserved1[20];
  float l1_offset[3]; /* up, east, north, metres (bit 0x40) */
  uint8_t reserved2[12];
  uint32_t meteo_present; /* 1 when the values below are set (bit 0x02) */
  float temperature;
  float humidity;
  float pressure;
  uint32_t epoch_interval_ms; /* the file's interval times the occupation's epoch gap */
  uint32_t epoch_count;
  uint32_t max_satellites; /* the raw file's largest satellite count of an epoch */
  uint32_t file_interval_ms;
  uint8_t signal_masks[2]; /* GPS, GLONASS; a set bit marks an absent signal (0x200) */
  uint8_t reserved3[8];
  uint32_t epoch_interval_ms2; /* copy of epoch_interval_ms */
  uint16_t sat_states[2][5];   /* GPS, GLONASS: satellite n in bits 2(n%8) of word n/8 */
  char name[64];               /* bit 0x80 */
  float meteo_height;          /* bit 0x02 */
} vox_OccupationData;

/* An occupation, all five systems (1704 bytes). */
typedef struct VOX_PACKED vox_OccupationDataEx {
  uint32_t reserved0;
  uint32_t occupation_id;
  uint32_t mask;
  uint32_t id; /* input of vox_GetOccupationDataEx; output copy */
  uint32_t receiver_id;
  uint32_t point_id;
  uint32_t file_id;
  uint32_t file_id2;
  TimeMs first_epoch;
  TimeMs last_epoch;
  vox_AntennaDataEx antenna;
  uint8_t reserved1[20];
  float l1_offset[3]; /* up, east, north */
  uint8_t reserved2[12];
  uint32_t meteo_present;
  float temperature;
  float humidity;
  float pressure;
  float meteo_height;
  uint32_t epoch_interval_ms;
  uint32_t epoch_count;
  uint32_t max_satellites;
  uint32_t file_interval_ms;
  uint32_t signal_masks[5]; /* GPS, GLONASS, BDS, GALILEO, SBAS: code/phase pairs, inverted */
  uint8_t reserved3[28];
  char name[64];
  uint8_t reserved4[8];
  uint32_t epoch_interval_ms2;
  uint32_t sat_states[5][4]; /* satellite n in bits 2(n%16) of word n/16 */
  uint8_t reserved5[112];
} vox_OccupationDataEx;

/* An occupation linked to a vector or fan (28 bytes). */
typedef struct VOX_PACKED vox_ROccupData {
  uint32_t occupation_id;
  uint32_t occupation_id2;
  uint32_t occupation_id3;
  uint32_t point_id;
  uint32_t file_id;
  uint32_t file_id2;
  uint32_t reserved;
} vox_ROccupData;

/* A receiver (196 bytes). */
typedef struct VOX_PACKED vox_ReceiverData {
  uint32_t id; /* as passed */
  char vendor[64];
  char name[64];
  char serial[64];
} vox_ReceiverData;

/* A raw file (68 bytes). Set `id` before vox_GetTrackData. */
typedef struct VOX_PACKED vox_TrackData {
  uint32_t id;
  char file_name[64];
} vox_TrackData;

/* A navigation (single-point) position (48 bytes). */
typedef struct VOX_PACKED vox_NavCoordData {
  double x, y, z;      /* metres, Earth-centred Cartesian */
  float sx, sy, sz;    /* standard deviations, metres */
  float rxy, rxz, ryz; /* correlation coefficients */
} vox_NavCoordData;

/* What is known of a point (108 bytes). Set `id` before vox_GetSiteData. */
typedef struct VOX_PACKED vox_SiteData {
  uint32_t id;
  uint32_t reserved;
  uint32_t occupation_count;
  double x, y, z;
  float rms;
  uint32_t site_type; /* VOX_SITE_* */
  char name[64];
} vox_SiteData;

/* A vector (152 bytes). Set `id` before vox_GetVectorData. */
typedef struct VOX_PACKED vox_VectorData {
  uint32_t id;
  uint8_t reserved[12];
  uint32_t first_point_id;
  uint32_t second_point_id;
  char first_point_name[64];
  char second_point_name[64];
} vox_VectorData;

/* A fan (156 bytes). Set `id` before vox_GetFanData. */
typedef struct VOX_PACKED vox_FanData {
  uint32_t id;
  uint8_t reserved[12];
  uint32_t base_point_id;
  uint32_t rover_file_id;
  char base_point_name[64];
  char rover_file_name[64]; /* file name without folder */
  uint32_t reserved2;
} vox_FanData;

/* The job's solution (76 bytes). The first word is not written. */
typedef struct VOX_PACKED vox_SolutionData {
  uint32_t untouched;
  uint32_t reserved;
  uint32_t job_kind; /* 1 static, 2 and 3 kinematic, 0 unknown */
  char job_name[64];
} vox_SolutionData;

/* The job's solution, extended (84 bytes). The first eight bytes are not written. */
typedef struct VOX_PACKED vox_SolutionDataEx {
  uint8_t untouched[8];
  uint32_t reserved;
  uint32_t job_kind;
  char job_name[64];
  uint32_t max_extra_bases;
} vox_SolutionDataEx;

#pragma pack(pop)

VOX_CHECK_SIZE(vox_AntennaData, 344);
VOX_CHECK_OFFSET(vox_AntennaData, id, 0);
VOX_CHECK_OFFSET(vox_AntennaData, type_word, 4);
VOX_CHECK_OFFSET(vox_AntennaData, reserved, 8);
VOX_CHECK_OFFSET(vox_AntennaData, l2_offset, 28);
VOX_CHECK_OFFSET(vox_AntennaData, patterns, 40);

VOX_CHECK_SIZE(vox_AntennaDataEx, 1264);
VOX_CHECK_OFFSET(vox_AntennaDataEx, id, 0);
VOX_CHECK_OFFSET(vox_AntennaDataEx, type_word, 4);
VOX_CHECK_OFFSET(vox_AntennaDataEx, reserved, 8);
VOX_CHECK_OFFSET(vox_AntennaDataEx, l2_offset, 28);
VOX_CHECK_OFFSET(vox_AntennaDataEx, pattern_mask, 40);
VOX_CHECK_OFFSET(vox_AntennaDataEx, slot_count, 44);
VOX_CHECK_OFFSET(vox_AntennaDataEx, patterns, 48);

VOX_CHECK_SIZE(vox_OccupationData, 562);
VOX_CHECK_OFFSET(vox_OccupationData, occupation_id, 0);
VOX_CHECK_OFFSET(vox_OccupationData, mask, 4);
VOX_CHECK_OFFSET(vox_OccupationData, id, 8);
VOX_CHECK_OFFSET(vox_OccupationData, receiver_id, 12);
VOX_CHECK_OFFSET(vox_OccupationData, point_id, 16);
VOX_CHECK_OFFSET(vox_OccupationData, file_id, 20);
VOX_CHECK_OFFSET(vox_OccupationData, file_id2, 24);
VOX_CHECK_OFFSET(vox_OccupationData, first_epoch, 28);
VOX_CHECK_OFFSET(vox_OccupationData, last_epoch, 34);
VOX_CHECK_OFFSET(vox_OccupationData, antenna, 40);
VOX_CHECK_OFFSET(vox_OccupationData, reserved1, 384);
VOX_CHECK_OFFSET(vox_OccupationData, l1_offset, 404);
VOX_CHECK_OFFSET(vox_OccupationData, reserved2, 416);
VOX_CHECK_OFFSET(vox_OccupationData, meteo_present, 428);
VOX_CHECK_OFFSET(vox_OccupationData, temperature, 432);
VOX_CHECK_OFFSET(vox_OccupationData, humidity, 436);
VOX_CHECK_OFFSET(vox_OccupationData, pressure, 440);
VOX_CHECK_OFFSET(vox_OccupationData, epoch_interval_ms, 444);
VOX_CHECK_OFFSET(vox_OccupationData, epoch_count, 448);
VOX_CHECK_OFFSET(vox_OccupationData, max_satellites, 452);
VOX_CHECK_OFFSET(vox_OccupationData, file_interval_ms, 456);
VOX_CHECK_OFFSET(vox_OccupationData, signal_masks, 460);
VOX_CHECK_OFFSET(vox_OccupationData, reserved3, 462);
VOX_CHECK_OFFSET(vox_OccupationData, epoch_interval_ms2, 470);
VOX_CHECK_OFFSET(vox_OccupationData, sat_states, 474);
VOX_CHECK_OFFSET(vox_OccupationData, name, 494);
VOX_CHECK_OFFSET(vox_OccupationData, meteo_height, 558);

VOX_CHECK_SIZE(vox_OccupationDataEx, 1704);
VOX_CHECK_OFFSET(vox_OccupationDataEx, reserved0, 0);
VOX_CHECK_OFFSET(vox_OccupationDataEx, occupation_id, 4);
VOX_CHECK_OFFSET(vox_OccupationDataEx, mask, 8);
VOX_CHECK_OFFSET(vox_OccupationDataEx, id, 12);
VOX_CHECK_OFFSET(vox_OccupationDataEx, receiver_id, 16);
VOX_CHECK_OFFSET(vox_OccupationDataEx, point_id, 20);
VOX_CHECK_OFFSET(vox_OccupationDataEx, file_id, 24);
VOX_CHECK_OFFSET(vox_OccupationDataEx, file_id2, 28);
VOX_CHECK_OFFSET(vox_OccupationDataEx, first_epoch, 32);
VOX_CHECK_OFFSET(vox_OccupationDataEx, last_epoch, 38);
VOX_CHECK_OFFSET(vox_OccupationDataEx, antenna, 44);
VOX_CHECK_OFFSET(vox_OccupationDataEx, reserved1, 1308);
VOX_CHECK_OFFSET(vox_OccupationDataEx, l1_offset, 1328);
VOX_CHECK_OFFSET(vox_OccupationDataEx, reserved2, 1340);
VOX_CHECK_OFFSET(vox_OccupationDataEx, meteo_present, 1352);
VOX_CHECK_OFFSET(vox_OccupationDataEx, temperature, 1356);
VOX_CHECK_OFFSET(vox_OccupationDataEx, humidity, 1360);
VOX_CHECK_OFFSET(vox_OccupationDataEx, pressure, 1364);
VOX_CHECK_OFFSET(vox_OccupationDataEx, meteo_height, 1368);
VOX_CHECK_OFFSET(vox_OccupationDataEx, epoch_interval_ms, 1372);
VOX_CHECK_OFFSET(vox_OccupationDataEx, epoch_count, 1376);
VOX_CHECK_OFFSET(vox_OccupationDataEx, max_satellites, 1380);
VOX_CHECK_OFFSET(vox_OccupationDataEx, file_interval_ms, 1384);
VOX_CHECK_OFFSET(vox_OccupationDataEx, signal_masks, 1388);
VOX_CHECK_OFFSET(vox_OccupationDataEx, reserved3, 1408);
VOX_CHECK_OFFSET(vox_OccupationDataEx, name, 1436);
VOX_CHECK_OFFSET(vox_OccupationDataEx, reserved4, 1500);
VOX_CHECK_OFFSET(vox_OccupationDataEx, epoch_interval_ms2, 1508);
VOX_CHECK_OFFSET(vox_OccupationDataEx, sat_states, 1512);
VOX_CHECK_OFFSET(vox_OccupationDataEx, reserved5, 1592);

VOX_CHECK_SIZE(vox_ROccupData, 28);
VOX_CHECK_OFFSET(vox_ROccupData, occupation_id, 0);
VOX_CHECK_OFFSET(vox_ROccupData, occupation_id2, 4);
VOX_CHECK_OFFSET(vox_ROccupData, occupation_id3, 8);
VOX_CHECK_OFFSET(vox_ROccupData, point_id, 12);
VOX_CHECK_OFFSET(vox_ROccupData, file_id, 16);
VOX_CHECK_OFFSET(vox_ROccupData, file_id2, 20);
VOX_CHECK_OFFSET(vox_ROccupData, reserved, 24);

VOX_CHECK_SIZE(vox_ReceiverData, 196);
VOX_CHECK_OFFSET(vox_ReceiverData, id, 0);
VOX_CHECK_OFFSET(vox_ReceiverData, vendor, 4);
VOX_CHECK_OFFSET(vox_ReceiverData, name, 68);
VOX_CHECK_OFFSET(vox_ReceiverData, serial, 132);

VOX_CHECK_SIZE(vox_TrackData, 68);
VOX_CHECK_OFFSET(vox_TrackData, id, 0);
VOX_CHECK_OFFSET(vox_TrackData, file_name, 4);

VOX_CHECK_SIZE(vox_NavCoordData, 48);
VOX_CHECK_OFFSET(vox_NavCoordData, x, 0);
VOX_CHECK_OFFSET(vox_NavCoordData, y, 8);
VOX_CHECK_OFFSET(vox_NavCoordData, z, 16);
VOX_CHECK_OFFSET(vox_NavCoordData, sx, 24);
VOX_CHECK_OFFSET(vox_NavCoordData, sy, 28);
VOX_CHECK_OFFSET(vox_NavCoordData, sz, 32);
VOX_CHECK_OFFSET(vox_NavCoordData, rxy, 36);
VOX_CHECK_OFFSET(vox_NavCoordData, rxz, 40);
VOX_CHECK_OFFSET(vox_NavCoordData, ryz, 44);

VOX_CHECK_SIZE(vox_SiteData, 108);
VOX_CHECK_OFFSET(vox_SiteData, id, 0);
VOX_CHECK_OFFSET(vox_SiteData, reserved, 4);
VOX_CHECK_OFFSET(vox_SiteData, occupation_count, 8);
VOX_CHECK_OFFSET(vox_SiteData, x, 12);
VOX_CHECK_OFFSET(vox_SiteData, y, 20);
VOX_CHECK_OFFSET(vox_SiteData, z, 28);
VOX_CHECK_OFFSET(vox_SiteData, rms, 36);
VOX_CHECK_OFFSET(vox_SiteData, site_type, 40);
VOX_CHECK_OFFSET(vox_SiteData, name, 44);

VOX_CHECK_SIZE(vox_VectorData, 152);
VOX_CHECK_OFFSET(vox_VectorData, id, 0);
VOX_CHECK_OFFSET(vox_VectorData, reserved, 4);
VOX_CHECK_OFFSET(vox_VectorData, first_point_id, 16);
VOX_CHECK_OFFSET(vox_VectorData, second_point_id, 20);
VOX_CHECK_OFFSET(vox_VectorData, first_point_name, 24);
VOX_CHECK_OFFSET(vox_VectorData, second_point_name, 88);

VOX_CHECK_SIZE(vox_FanData, 156);
VOX_CHECK_OFFSET(vox_FanData, id, 0);
VOX_CHECK_OFFSET(vox_FanData, reserved, 4);
VOX_CHECK_OFFSET(vox_FanData, base_point_id, 16);
VOX_CHECK_OFFSET(vox_FanData, rover_file_id, 20);
VOX_CHECK_OFFSET(vox_FanData, base_point_name, 24);
VOX_CHECK_OFFSET(vox_FanData, rover_file_name, 88);
VOX_CHECK_OFFSET(vox_FanData, reserved2, 152);

VOX_CHECK_SIZE(vox_SolutionData, 76);
VOX_CHECK_OFFSET(vox_SolutionData, untouched, 0);
VOX_CHECK_OFFSET(vox_SolutionData, reserved, 4);
VOX_CHECK_OFFSET(vox_SolutionData, job_kind, 8);
VOX_CHECK_OFFSET(vox_SolutionData, job_name, 12);

VOX_CHECK_SIZE(vox_SolutionDataEx, 84);
VOX_CHECK_OFFSET(vox_SolutionDataEx, untouched, 0);
VOX_CHECK_OFFSET(vox_SolutionDataEx, reserved, 8);
VOX_CHECK_OFFSET(vox_SolutionDataEx, job_kind, 12);
VOX_CHECK_OFFSET(vox_SolutionDataEx, job_name, 16);
VOX_CHECK_OFFSET(vox_SolutionDataEx, max_extra_bases, 80);

VOX_BEGIN_DECLS

/* Occupations. The stream over all occupations of the job (null when there are none); the
 * get-next calls fill the record as vox_GetOccupationData does, with the request bits taken
 * from the record's mask. */
VOX_API void* VOX_CALL vox_OpenSolOccupStream(void);
VOX_API int32_t VOX_CALL vox_GetNextSolOccup(void* stream, vox_OccupationData* out);
VOX_API int32_t VOX_CALL vox_GetNextSolOccupEx(void* stream, vox_OccupationDataEx* out);
VOX_API int32_t VOX_CALL vox_CloseSolOccupStream(void* stream);

/* The occupations linked to a vector (selector not 0) or a fan (selector 0); null when the
 * item is unknown or has none. */
VOX_API void* VOX_CALL vox_OpenROccupStream(uint32_t item_id, uint32_t selector);
VOX_API int32_t VOX_CALL vox_GetNextROccup(void* stream, vox_ROccupData* out);
VOX_API int32_t VOX_CALL vox_CloseROccupStream(void* stream);

/* One occupation by record->id with the request bits in record->mask: 1 when filled, 0 when
 * the occupation is unknown or has no raw file (the identifiers are filled then). */
VOX_API int32_t VOX_CALL vox_GetOccupationData(vox_OccupationData* record);
VOX_API int32_t VOX_CALL vox_GetOccupationDataEx(vox_OccupationDataEx* record);

/* Antennas, receivers and raw files by identifier: 1 when found. The antenna record is
 * cleared even when the antenna is unknown; the receiver record is then left untouched. */
VOX_API int32_t VOX_CALL vox_GetAntennaType(uint32_t antenna_id, vox_AntennaData* out);
VOX_API int32_t VOX_CALL vox_GetAntennaTypeEx(uint32_t antenna_id, vox_AntennaDataEx* out);
VOX_API int32_t VOX_CALL vox_GetReceiverData(uint32_t receiver_id, vox_ReceiverData* out);
VOX_API int32_t VOX_CALL vox_GetTrackData(vox_TrackData* record);

/* Navigation coordinates of an occupation. vox_SetNavCoord stores them and folds them into
 * the information-weighted mean of the occupation's point; it returns 1 only when the
 * occupation has a point (the coordinates are stored either way). vox_GetNavCoord returns 1
 * with the stored coordinates, 0 when none are stored. */
VOX_API int32_t VOX_CALL vox_GetNavCoord(uint32_t occupation_id, vox_NavCoordData* out);
VOX_API int32_t VOX_CALL vox_SetNavCoord(uint32_t occupation_id, const vox_NavCoordData* in);

/* Points: the stream yields point identifiers (0 at the end). vox_GetSiteData returns the
 * best position known for record->id: the job's coordinates, else a solved position, else
 * the navigation mean; 1 when there is one. */
VOX_API void* VOX_CALL vox_OpenPointStream(void);
VOX_API uint32_t VOX_CALL vox_GetPointId(void* stream);
VOX_API void VOX_CALL vox_ClosePointStream(void* stream);
VOX_API int32_t VOX_CALL vox_GetSiteData(vox_SiteData* record);

/* Vectors. The stream skips vectors without occupations. The property functions copy the
 * item's parameter block into the caller's block by the rules of vox_AssignVectorProperty. */
VOX_API void* VOX_CALL vox_OpenVectorStream(void);
VOX_API int32_t VOX_CALL vox_GetNextVector(void* stream, vox_VectorData* out);
VOX_API int32_t VOX_CALL vox_GetVectorData(vox_VectorData* record);
VOX_API int32_t VOX_CALL vox_GetVectorProperty(uint32_t vector_id, ParameterBlock* out);
VOX_API int32_t VOX_CALL vox_GetSolutionProperty(uint32_t unused, ParameterBlock* out);
/* Always 0; writes 0 into *result when result is not null. */
VOX_API int32_t VOX_CALL vox_GetVectorResult(uint32_t unused, uint32_t* result);
VOX_API int32_t VOX_CALL vox_CloseVectorStream(void* stream);

/* Copies a parameter block. With source->allocated not 0, min(destination->allocated,
 * source->size) bytes are taken and become destination->size; with source->allocated 0,
 * min(destination->size, source->size) bytes are taken and the destination's header is kept.
 * Payload bytes (after the header) only; nothing happens for null or identical blocks. */
VOX_API void VOX_CALL vox_AssignVectorProperty(ParameterBlock* destination,
                                               const ParameterBlock* source);
/* 1 when the payloads agree over the smaller meaningful size; 0 for a null block or one of
 * meaningful size 0 (the same block always compares equal). */
VOX_API int32_t VOX_CALL vox_CompareVectorProperty(const ParameterBlock* a,
                                                   const ParameterBlock* b);

/* Fans. Unlike vectors, fans without occupations are streamed too. */
VOX_API void* VOX_CALL vox_OpenFanStream(void);
VOX_API int32_t VOX_CALL vox_GetNextFan(void* stream, vox_FanData* out);
VOX_API int32_t VOX_CALL vox_GetFanData(vox_FanData* record);
VOX_API int32_t VOX_CALL vox_GetFanProperty(uint32_t fan_id, ParameterBlock* out);
VOX_API int32_t VOX_CALL vox_CloseFanStream(void* stream);

/* Ray streams of a fan. Only mode 0 (writing) is offered; the fan's NMEA output, when it has
 * one, is replaced. vox_CloseRayStream flushes and closes it (null accepted); returns 1. */
VOX_API TRayStream* VOX_CALL vox_OpenRayStream(uint32_t fan_id, uint32_t mode);
VOX_API TRayStream* VOX_CALL vox_OpenRayStreamForAdd(uint32_t fan_id);
VOX_API int32_t VOX_CALL vox_CloseRayStream(TRayStream* stream);

/* The job has exactly one solution: these write 1 into *solution and return 1 (0 for a null
 * pointer). */
VOX_API int32_t VOX_CALL vox_GetSolutionBySolXOccup(uint32_t unused, uint32_t* solution);
VOX_API int32_t VOX_CALL vox_GetSolutionByVector(uint32_t unused, uint32_t* solution);
/* The job's kind and name (and MaxExtraBases): 1, or 0 for a null record. */
VOX_API int32_t VOX_CALL vox_GetSolutionData(vox_SolutionData* out);
VOX_API int32_t VOX_CALL vox_GetSolutionDataEx(vox_SolutionDataEx* out);
/* The job's kind: 1 static, 2 and 3 kinematic, 0 unknown. */
VOX_API uint32_t VOX_CALL vox_GetSolutionType(void);
/* Returns 1 and does nothing. */
VOX_API int32_t VOX_CALL vox_SetSolutionProcessed(void);

VOX_END_DECLS

#endif /* VOX_SDK_STREAMS_H */
