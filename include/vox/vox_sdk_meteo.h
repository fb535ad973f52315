/* vox engine SDK: meteorological data.
 *
 * Some raw files carry samples of a meteorological sensor. vox keeps them as one track per
 * raw file; an engine opens a stream for a raw file and asks for pressure, temperature,
 * humidity and the pressure sensor's height at any time, interpolated linearly between the
 * samples around it. The functions write no trace and take no locks: the tracks are complete
 * before any engine runs. A stream belongs to the engine between its open and close calls. */
#ifndef VOX_SDK_METEO_H
#define VOX_SDK_METEO_H

#include "vox_sdk_core.h"

#pragma pack(push, 1)

/* One sample, or the result of a query (22 bytes). */
typedef struct VOX_PACKED vox_MeteoData {
  uint32_t seconds;   /* time, whole seconds since the GPS time origin */
  uint16_t ms;        /* milliseconds */
  float pressure;     /* hPa */
  float temperature;  /* degrees Celsius */
  float humidity;     /* relative humidity, percent */
  float height;       /* height of the pressure sensor, metres */
} vox_MeteoData;
VOX_CHECK_SIZE(vox_MeteoData, 22);
VOX_CHECK_OFFSET(vox_MeteoData, seconds, 0);
VOX_CHECK_OFFSET(vox_MeteoData, ms, 4);
VOX_CHECK_OFFSET(vox_MeteoData, pressure, 6);
VOX_CHECK_OFFSET(vox_MeteoData, temperature, 10);
VOX_CHECK_OFFSET(vox_MeteoData, humidity, 14);
VOX_CHECK_OFFSET(vox_MeteoData, height, 18);

#pragma pack(pop)

VOX_BEGIN_DECLS

/* A stream over the track of a raw file (its identifier), or null when it has none. */
VOX_API void* VOX_CALL vox_OpenMeteoStream(uint32_t file_id);
/* The values at *time: 1 with out filled, 0 when an argument is null or the track is empty. */
VOX_API int32_t VOX_CALL vox_GetMeteoData(void* stream, const TimeMs* time, vox_MeteoData* out);
/* Frees the stream (null is accepted); returns 1. */
VOX_API int32_t VOX_CALL vox_CloseMeteoStream(void* stream);

VOX_END_DECLS

#endif /* VOX_SDK_METEO_H */
