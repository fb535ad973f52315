/* vox engine SDK: ephemeris functions and records. */
#ifndef VOX_SDK_EPHEMERIS_H
#define VOX_SDK_EPHEMERIS_H

#include "vox_sdk_core.h"

/* ---- Broadcast ephemerides ---------------------------------------------------------------
 *
 * The broadcast ephemerides of the job's raw files, one time-ordered list per satellite. An
 * engine opens a stream for one satellite, optionally positions it at the ephemeris valid at a
 * given time (vox_FindEphemerisEx), and reads ephemerides one after the other. vox stores,
 * orders, de-duplicates and converts units; it does not evaluate orbits. The fields named
 * after a letter and a number (G1.., C1.., E1.., R1.., S1..) are passed through unchanged.
 *
 * Validity window of an ephemeris of time t (whole seconds), both ends inclusive:
 *   GPS      t - 7200 to t + 7200   (a 4-hour window centred on t)
 *   GLONASS  t - 900  to t + 900    (a 30-minute window centred on t)
 *   BDS, GALILEO  t - 3600 to t + 3600
 *   SBAS     t - 300  to t + 300; an SBAS ephemeris whose rate fields (S5 to S13) are all
 *            zero is valid at every time.
 * Centring the windows makes vox_FindEphemerisEx return an ephemeris valid at the time asked
 * for, and vox_OpenEphemerisStreamEx start at the first ephemeris relevant to the span.
 *
 * Streams take no locks: the store is complete before any engine runs and read-only after.
 * A stream belongs to the engine between its open and close calls. */

#pragma pack(push, 1)

/* The first 8 bytes of every ephemeris record. */
typedef struct VOX_PACKED vox_EphemerisHead {
  uint32_t seconds; /* time, whole seconds since the GPS time origin */
  uint16_t ms;      /* milliseconds */
  SatId sat;
} vox_EphemerisHead;
VOX_CHECK_SIZE(vox_EphemerisHead, 8);
VOX_CHECK_OFFSET(vox_EphemerisHead, seconds, 0);
VOX_CHECK_OFFSET(vox_EphemerisHead, ms, 4);
VOX_CHECK_OFFSET(vox_EphemerisHead, sat, 6);

/* GPS layout (raw records of tags 13 and 45). BDS uses the same layout with C in place of G,
 * except that byte 120 holds C25 and byte 121 holds C24. */
typedef struct VOX_PACKED vox_GpsEphemeris {
  uint32_t seconds;
  uint16_t ms;
  SatId sat;
  float g3_g6[4];   /* G3, G4, G5, G6 */
  double g8;
  double g9;
  double g10;
  float g11;
  float g13;
  float g12;
  float g14_g16[3]; /* G14, G15, G16 */
  double g17;
  double g18;
  double g20;
  float g19;
  float g21;
  float g7;
  uint32_t g1;
  uint32_t g2;
  uint16_t g22_wide; /* G22 widened to 16 bits */
  uint8_t g22;
  uint8_t g23;
  uint8_t g25_bit2;  /* bit 2 of G25 (0 or 1); BDS: C25 */
  uint8_t g24_byte;  /* tag 13: low byte of G24; tag 45: 0 when G24 is 1, else 1; BDS: C24 */
  uint8_t zero[7];
} vox_GpsEphemeris;
VOX_CHECK_SIZE(vox_GpsEphemeris, 129);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g3_g6, 8);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g8, 24);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g9, 32);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g10, 40);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g11, 48);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g13, 52);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g12, 56);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g14_g16, 60);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g17, 72);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g18, 80);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g20, 88);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g19, 96);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g21, 100);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g7, 104);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g1, 108);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g2, 112);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g22_wide, 116);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g22, 118);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g23, 119);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g25_bit2, 120);
VOX_CHECK_OFFSET(vox_GpsEphemeris, g24_byte, 121);
VOX_CHECK_OFFSET(vox_GpsEphemeris, zero, 122);

/* GALILEO layout (raw records of tag 47). */
typedef struct VOX_PACKED vox_GalileoEphemeris {
  uint32_t seconds;
  uint16_t ms;
  SatId sat;
  float e3_e6[4];
  double e7;
  double e8_e10[3];
  float e12;
  float e14;
  float e13;
  float e15_e17[3];
  double e18;
  double e19;
  double e21;
  float e20;
  float e22;
  float e11;
  uint32_t e1;
  uint32_t e2;
  uint16_t e23;
  uint8_t e24;
  uint8_t e25;
  uint8_t zero;
} vox_GalileoEphemeris;
VOX_CHECK_SIZE(vox_GalileoEphemeris, 129);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e3_e6, 8);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e7, 24);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e8_e10, 32);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e12, 56);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e14, 60);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e13, 64);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e15_e17, 68);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e18, 80);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e19, 88);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e21, 96);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e20, 104);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e22, 108);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e11, 112);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e1, 116);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e2, 120);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e23, 124);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e24, 126);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, e25, 127);
VOX_CHECK_OFFSET(vox_GalileoEphemeris, zero, 128);

/* GLONASS layout (raw records of tag 14); position, velocity and acceleration in metres. */
typedef struct VOX_PACKED vox_GlonassEphemeris {
  uint32_t seconds;
  uint16_t ms;
  SatId sat;
  float r1;
  float r2;
  double position[3];     /* m */
  double velocity[3];     /* m/s */
  float acceleration[3];  /* m/s^2 */
  uint8_t r4;
  uint8_t r3;
  uint8_t zero[51];
} vox_GlonassEphemeris;
VOX_CHECK_SIZE(vox_GlonassEphemeris, 129);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, r1, 8);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, r2, 12);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, position, 16);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, velocity, 40);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, acceleration, 64);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, r4, 76);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, r3, 77);
VOX_CHECK_OFFSET(vox_GlonassEphemeris, zero, 78);

/* SBAS layout (raw records of tag 21). The time is the reference time of day placed on the
 * reception day (milliseconds 0). S5 to S13 are the rate fields. */
typedef struct VOX_PACKED vox_SbasEphemeris {
  uint32_t seconds;
  uint16_t ms;
  SatId sat;
  float s12;
  float s13;
  double s3_s5[3];
  float s6_s11[6];
  uint8_t s1;
  uint8_t s2;
  uint8_t zero[63];
} vox_SbasEphemeris;
VOX_CHECK_SIZE(vox_SbasEphemeris, 129);
VOX_CHECK_OFFSET(vox_SbasEphemeris, s12, 8);
VOX_CHECK_OFFSET(vox_SbasEphemeris, s13, 12);
VOX_CHECK_OFFSET(vox_SbasEphemeris, s3_s5, 16);
VOX_CHECK_OFFSET(vox_SbasEphemeris, s6_s11, 40);
VOX_CHECK_OFFSET(vox_SbasEphemeris, s1, 64);
VOX_CHECK_OFFSET(vox_SbasEphemeris, s2, 65);
VOX_CHECK_OFFSET(vox_SbasEphemeris, zero, 66);

/* The full ephemeris record (129 bytes) of the Ex functions; the system of head.sat tells
 * which layout applies. */
typedef union vox_EphemerisData {
  vox_EphemerisHead head;
  vox_GpsEphemeris gps; /* GPS and BDS */
  vox_GalileoEphemeris galileo;
  vox_GlonassEphemeris glonass;
  vox_SbasEphemeris sbas;
  uint8_t bytes[129];
} vox_EphemerisData;
VOX_CHECK_SIZE(vox_EphemerisData, 129);

/* The short record of vox_FindEphemeris and vox_GetNextEphemeris (GPS and GLONASS only). */
typedef struct VOX_PACKED vox_GpsShortEphemeris {
  uint8_t number;    /* GPS satellite number */
  uint32_t seconds;
  uint16_t ms;
  uint8_t g24_byte;  /* byte 121 of the full record */
  float g3_g6[4];    /* bytes 8 to 23 */
  float g7;          /* byte 104 */
  double g8_g10[3];  /* bytes 24 to 47 */
  uint8_t from48[24];  /* bytes 48 to 71: G11, G13, G12, G14, G15, G16 */
  uint8_t from72[24];  /* bytes 72 to 95: G17, G18, G20 */
  uint8_t from96[8];   /* bytes 96 to 103: G19, G21 */
  uint8_t from108[10]; /* bytes 108 to 117: G1, G2, G22 widened */
  uint8_t from118[3];  /* bytes 118 to 120: G22, G23, bit 2 of G25 */
} vox_GpsShortEphemeris;
VOX_CHECK_SIZE(vox_GpsShortEphemeris, 121);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, number, 0);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, seconds, 1);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, ms, 5);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, g24_byte, 7);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, g3_g6, 8);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, g7, 24);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, g8_g10, 28);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, from48, 52);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, from72, 76);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, from96, 100);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, from108, 108);
VOX_CHECK_OFFSET(vox_GpsShortEphemeris, from118, 118);

typedef struct VOX_PACKED vox_GlonassShortEphemeris {
  uint8_t number;  /* 128 + GLONASS slot */
  uint32_t seconds;
  uint16_t ms;
  uint8_t r3;      /* byte 77 of the full record */
  float r1;
  float r2;
  double position[3];
  double velocity[3];
  float acceleration[3];
  uint8_t r4;
} vox_GlonassShortEphemeris;
VOX_CHECK_SIZE(vox_GlonassShortEphemeris, 77);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, number, 0);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, seconds, 1);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, ms, 5);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, r3, 7);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, r1, 8);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, r2, 12);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, position, 16);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, velocity, 40);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, acceleration, 64);
VOX_CHECK_OFFSET(vox_GlonassShortEphemeris, r4, 76);

typedef union vox_ShortEphemerisData {
  uint8_t number; /* GPS number, or 128 + GLONASS slot */
  vox_GpsShortEphemeris gps;
  vox_GlonassShortEphemeris glonass;
  uint8_t bytes[121];
} vox_ShortEphemerisData;
VOX_CHECK_SIZE(vox_ShortEphemerisData, 121);

#pragma pack(pop)

VOX_BEGIN_DECLS

/* A stream over one satellite's ephemerides, starting at the first one whose window overlaps
 * [*from, *to] (whole seconds). Null when a pointer is null, the satellite is unknown or no
 * ephemeris qualifies. The stream then runs to the end of the satellite's list. */
VOX_API void* VOX_CALL vox_OpenEphemerisStreamEx(SatId sat, const uint32_t* from,
                                                 const uint32_t* to);
/* The same with a short satellite number: 1 to 127 name the satellite index number - 1
 * (1 to 37 are GPS 1 to 37); 128 + n names GLONASS slot n; 0 names nothing. */
VOX_API void* VOX_CALL vox_OpenEphemerisStream(uint8_t short_number, const uint32_t* from,
                                               const uint32_t* to);
/* Moves the stream to the first ephemeris valid at *time and copies it out: 1, or 0 when none
 * is valid. */
VOX_API int32_t VOX_CALL vox_FindEphemerisEx(void* stream, const uint32_t* time,
                                             vox_EphemerisData* out);
/* Fills the short record when vox_FindEphemerisEx succeeds for a GPS or GLONASS satellite;
 * returns 0 in every case. */
VOX_API int32_t VOX_CALL vox_FindEphemeris(void* stream, const uint32_t* time,
                                           vox_ShortEphemerisData* out);
/* The next ephemeris (right after open or find: the one they chose): 1, or 0 at the end. */
VOX_API int32_t VOX_CALL vox_GetNextEphemerisEx(void* stream, vox_EphemerisData* out);
/* Fills the short record when vox_GetNextEphemerisEx succeeds; returns 0 in every case. */
VOX_API int32_t VOX_CALL vox_GetNextEphemeris(void* stream, vox_ShortEphemerisData* out);
/* Frees the stream; returns 1. */
VOX_API int32_t VOX_CALL vox_CloseEphemerisStream(void* stream);

VOX_END_DECLS

/* ---- end of broadcast ephemerides ---- */

/* ---- Precise ephemerides -----------------------------------------------------------------
 *
 * Tabulated satellite positions and clock offsets from the job's precise orbit files (SP3
 * layout) and from the satellite position records of its raw files, one time-ordered list
 * per satellite with at most one sample per whole second. A stream starts at the first
 * sample whose window t - 900 to t + 900 (whole seconds, both ends inclusive) overlaps
 * [*from, *to], and then runs to the end of the satellite's list.
 *
 * Streams take no locks: the store is complete before any engine runs and read-only after.
 * A stream belongs to the engine between its open and close calls. */

#pragma pack(push, 1)

/* One sample (51 bytes). The satellite is the one the stream was opened for. */
typedef struct VOX_PACKED vox_PreciseEphemerisData {
  uint32_t seconds;     /* time, whole seconds since the GPS time origin */
  uint16_t ms;          /* milliseconds */
  double x;             /* position, metres */
  double y;
  double z;
  uint8_t zero1[12];
  float clock;          /* clock offset, seconds */
  uint8_t zero2[5];
} vox_PreciseEphemerisData;
VOX_CHECK_SIZE(vox_PreciseEphemerisData, 51);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, seconds, 0);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, ms, 4);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, x, 6);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, y, 14);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, z, 22);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, zero1, 30);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, clock, 42);
VOX_CHECK_OFFSET(vox_PreciseEphemerisData, zero2, 46);

#pragma pack(pop)

VOX_BEGIN_DECLS

/* A stream over one satellite's samples (see above). Null when a pointer is null, the
 * satellite is unknown, or no sample qualifies. */
VOX_API void* VOX_CALL vox_OpenPreciseEphemerisStreamEx(SatId sat, const uint32_t* from,
                                                        const uint32_t* to);
/* The same with a short satellite number, mapped as for vox_OpenEphemerisStream. */
VOX_API void* VOX_CALL vox_OpenPreciseEphemerisStream(uint8_t short_number, const uint32_t* from,
                                                      const uint32_t* to);
/* The next sample (right after open: the first qualifying one): 1, or 0 at the end. */
VOX_API int32_t VOX_CALL vox_GetNextPreciseEphemeris(void* stream, vox_PreciseEphemerisData* out);
/* Frees the stream; returns 1. */
VOX_API int32_t VOX_CALL vox_ClosePreciseEphemerisStream(void* stream);

VOX_END_DECLS

/* ---- end of precise ephemerides ---- */

#endif /* VOX_SDK_EPHEMERIS_H */
