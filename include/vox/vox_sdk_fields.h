/* vox engine SDK: what the pass-through ephemeris and satellite fields mean.
 *
 * vox moves the numbered ephemeris fields of the raw files (G1..G25, C1..C25, E1..E25,
 * R1..R4, S1..S13) and the two satellite bytes B2, B3 of the epoch records to the engines
 * without reading them. Their meaning is fixed here, once, for every program of this tree
 * that writes raw files (the raw writer, the simulator) or reads them back (the reference
 * engines). Keep it that way: a second table elsewhere would drift.
 *
 * GPS (tag 13 and tag 45) and BDS (tag 49, C in place of G), Keplerian broadcast orbits.
 * All times are in the system's own time scale, seconds of its week.
 *
 *   field  width  meaning                                        unit
 *   G1     u32    toe, reference time of the orbit               s of week
 *   G2     u32    toc, reference time of the clock               s of week
 *   G3     f32    af2, clock drift rate                          s/s^2
 *   G4     f32    af1, clock drift                               s/s
 *   G5     f32    af0, clock bias                                s
 *   G6     f32    TGD, L1/L2 group delay (BDS: TGD1)             s
 *   G7     f32    delta n, mean motion difference                rad/s
 *   G8     f64    e, eccentricity                                -
 *   G9     f64    sqrt(A), root of the semi-major axis           m^1/2
 *   G10    f64    M0, mean anomaly at toe                        rad
 *   G11    f32    OMEGA dot, rate of right ascension             rad/s
 *   G12    f32    IDOT, rate of inclination                      rad/s
 *   G13    f32    Cuc, cosine correction of the latitude arg.    rad
 *   G14    f32    Cus, sine correction of the latitude arg.      rad
 *   G15    f32    Crc, cosine correction of the radius           m
 *   G16    f32    Crs, sine correction of the radius             m
 *   G17    f64    OMEGA0, longitude of the node at week start    rad
 *   G18    f64    omega, argument of perigee                     rad
 *   G19    f32    Cic, cosine correction of the inclination      rad
 *   G20    f64    i0, inclination at toe                         rad
 *   G21    f32    Cis, sine correction of the inclination        rad
 *   G22    u8     IODE (BDS: AODE)
 *   G23    u8     URA index
 *   G24    u16    health, 0 = healthy (engines see its low byte only: byte 121)
 *   G25    u8     bit 2: fit interval flag (0 = four hours); other bits zero
 *
 * The record time (the RawTime of the record, seconds and milliseconds of the engine's
 * record) is toe as an absolute GPS time: week * 604800 + toe. vox centres its validity
 * window on it, so this is what makes vox_FindEphemerisEx pick the right ephemeris. The week
 * is recovered from the record time and toe (vox_GpsWeekOf below), so a writer that stamped
 * a slightly different time still decodes right.
 *
 * Why this placement: the six 64-bit fields carry the six values whose rounding to 32 bits
 * would move the satellite by metres (e, sqrt(A), M0, OMEGA0, omega, i0). G8 and G20 are
 * checked by the raw reader (zero or 2^-33 <= |x| < 2^8, else the record is dropped), so
 * they hold e and i0, which always lie in that window (sqrt(A) ~ 5154 could not). Thirteen
 * 32-bit floats remain for the thirteen small values. toe and toc are multiples of 16 s.
 *
 * Tag 45 (GPS 33 to 37): the engine's byte 121 is 0 when G24 is 1, else 1. Writers of tag 45
 * therefore store G24 = 1 for a healthy satellite, so that byte 121 == 0 means healthy for
 * every GPS-layout record. BDS: C24 (a byte) is health and lands in byte 121 as well; C25 is
 * the AODC and lands in byte 120.
 *
 * GALILEO (tag 47): E1 toe, E2 toc (u32, s of week); E3 af2, E4 af1 (f32); E5 BGD E1/E5a,
 * E6 BGD E1/E5b (f32, s); E7 af0 (f64, s); E8 e, E9 sqrt(A), E10 M0 (f64); E11 delta n,
 * E12 OMEGA dot, E13 IDOT, E14 Cuc, E15 Cus, E16 Crc, E17 Crs (f32); E18 OMEGA0, E19 omega
 * (f64); E20 Cic (f32); E21 i0 (f64); E22 Cis (f32); E23 IODnav (u16); E24 SISA (u8);
 * E25 health, 0 = healthy (u8).
 *
 * GLONASS (tag 14): R1 tau_n, clock bias to subtract (f32, s); R2 gamma_n, relative
 * frequency bias (f32); R3 frequency channel number k as a two's complement byte (-7..+6);
 * R4 health, 0 = healthy. Position, velocity and acceleration are vox's own (metres).
 *
 * SBAS (tag 21): S1 IODN, S2 URA index (u8); S3, S4, S5 position X, Y, Z (f64, m); S6, S7, S8
 * velocity (f32, m/s); S9, S10, S11 acceleration (f32, m/s^2); S12 agf0 (f32, s); S13 agf1
 * (f32, s/s). The reference time is the record's reference time of day.
 *
 * B2, B3 (satellite block of tag 8 and tag 51 epochs): B2 is the L1 carrier-to-noise density
 * in whole dB-Hz (0 = unknown); B3 holds loss-of-lock flags: bit 0 for the L1 phase, bit 1 for
 * the L2 phase, set on the first epoch after the phase lost its count (a new ambiguity).
 *
 * Everything here is static inline C and needs no vox function: engines, tools and tests may
 * use it alike. */
#ifndef VOX_SDK_FIELDS_H
#define VOX_SDK_FIELDS_H

#include "vox_sdk_core.h"
#include "vox_sdk_ephemeris.h"

/* G-field numbers (GPS, tag 13/45) of the table above; the C-fields of BDS share them. */
enum {
  VOX_G_TOE = 1,
  VOX_G_TOC = 2,
  VOX_G_AF2 = 3,
  VOX_G_AF1 = 4,
  VOX_G_AF0 = 5,
  VOX_G_TGD = 6,
  VOX_G_DELTA_N = 7,
  VOX_G_E = 8,
  VOX_G_SQRT_A = 9,
  VOX_G_M0 = 10,
  VOX_G_OMEGA_DOT = 11,
  VOX_G_IDOT = 12,
  VOX_G_CUC = 13,
  VOX_G_CUS = 14,
  VOX_G_CRC = 15,
  VOX_G_CRS = 16,
  VOX_G_OMEGA0 = 17,
  VOX_G_OMEGA = 18,
  VOX_G_CIC = 19,
  VOX_G_I0 = 20,
  VOX_G_CIS = 21,
  VOX_G_IODE = 22,
  VOX_G_URA = 23,
  VOX_G_HEALTH = 24,
  VOX_G_FLAGS = 25,
  VOX_G_COUNT = 26 /* arrays indexed by field number: 0 unused, 1..25 */
};

/* Bit of G25 that carries the fit interval flag. */
#define VOX_G25_FIT_FLAG 0x04u
/* Bits of B3. */
#define VOX_B3_L1_LOSS_OF_LOCK 0x01u
#define VOX_B3_L2_LOSS_OF_LOCK 0x02u

#define VOX_GPS_WEEK_SECONDS 604800.0
/* Constants of the GPS user algorithm. */
#define VOX_GPS_MU 3.986005e14           /* m^3/s^2 */
#define VOX_GPS_OMEGA_E 7.2921151467e-5  /* rad/s */
#define VOX_GPS_F_REL (-4.442807633e-10) /* s/m^1/2 */
#define VOX_GPS_PI 3.1415926535898       /* the value the broadcast angles assume */
#define VOX_SPEED_OF_LIGHT 299792458.0   /* m/s */
#define VOX_GPS_L1_HZ 1575.42e6
#define VOX_GPS_L2_HZ 1227.60e6

/* Signal codes of tag-51 signal blocks that the tools of this tree write for GPS. */
#define VOX_SIGNAL_GPS_L1CA 16
#define VOX_SIGNAL_GPS_L2P 36
#define VOX_SIGNAL_GPS_L2C 34

/* A Keplerian broadcast orbit and clock, in plain units (GPS, BDS and GALILEO). */
typedef struct vox_GpsOrbitParams {
  uint32_t week; /* week of toe (from the record time) */
  double toe;    /* s of week */
  double toc;    /* s of week */
  double sqrt_a; /* m^1/2 */
  double e;
  double i0;         /* rad */
  double omega0;     /* rad */
  double omega;      /* rad */
  double m0;         /* rad */
  double delta_n;    /* rad/s */
  double omega_dot;  /* rad/s */
  double idot;       /* rad/s */
  double cuc, cus;   /* rad */
  double crc, crs;   /* m */
  double cic, cis;   /* rad */
  double af0;        /* s */
  double af1;        /* s/s */
  double af2;        /* s/s^2 */
  double tgd;        /* s; GALILEO: BGD E1/E5a */
  double tgd2;       /* s; GALILEO: BGD E1/E5b; 0 for GPS and BDS */
  uint32_t iode;     /* GALILEO: IODnav */
  uint32_t ura;      /* GALILEO: SISA */
  uint32_t health;   /* 0 = healthy */
  uint32_t fit_flag; /* GPS: fit interval flag; BDS: AODC */
} vox_GpsOrbitParams;

/* The week in which toe falls, for a record time of t seconds since the GPS origin: the week
 * that puts week * 604800 + toe nearest to t. */
static inline uint32_t vox_GpsWeekOf(uint32_t t, double toe) {
  double w = ((double)t - toe) / VOX_GPS_WEEK_SECONDS + 0.5;
  return w < 0.0 ? 0u : (uint32_t)w;
}

/* The value a 64-bit field checked by the raw reader must take: values below 2^-33 in
 * magnitude are written as zero (they are below any meaningful resolution of e and i0). */
static inline double vox_CheckedF64(double v) {
  return (v > -1.16415321826934814453125e-10 && v < 1.16415321826934814453125e-10) ? 0.0 : v;
}

/* Params -> field values g[1..25] (g[0] unused), widths not yet applied. */
static inline void vox_GpsOrbitToFields(const vox_GpsOrbitParams* p, double g[VOX_G_COUNT]) {
  g[0] = 0.0;
  g[VOX_G_TOE] = p->toe;
  g[VOX_G_TOC] = p->toc;
  g[VOX_G_AF2] = p->af2;
  g[VOX_G_AF1] = p->af1;
  g[VOX_G_AF0] = p->af0;
  g[VOX_G_TGD] = p->tgd;
  g[VOX_G_DELTA_N] = p->delta_n;
  g[VOX_G_E] = vox_CheckedF64(p->e);
  g[VOX_G_SQRT_A] = p->sqrt_a;
  g[VOX_G_M0] = p->m0;
  g[VOX_G_OMEGA_DOT] = p->omega_dot;
  g[VOX_G_IDOT] = p->idot;
  g[VOX_G_CUC] = p->cuc;
  g[VOX_G_CUS] = p->cus;
  g[VOX_G_CRC] = p->crc;
  g[VOX_G_CRS] = p->crs;
  g[VOX_G_OMEGA0] = p->omega0;
  g[VOX_G_OMEGA] = p->omega;
  g[VOX_G_CIC] = p->cic;
  g[VOX_G_I0] = vox_CheckedF64(p->i0);
  g[VOX_G_CIS] = p->cis;
  g[VOX_G_IODE] = (double)(p->iode & 0xFFu);
  g[VOX_G_URA] = (double)(p->ura & 0xFFu);
  g[VOX_G_HEALTH] = (double)(p->health & 0xFFFFu);
  g[VOX_G_FLAGS] = p->fit_flag ? (double)VOX_G25_FIT_FLAG : 0.0;
}

/* Field values g[1..25] and the record time -> params. */
static inline void vox_GpsOrbitFromFields(const double g[VOX_G_COUNT], uint32_t record_seconds,
                                          vox_GpsOrbitParams* p) {
  p->toe = g[VOX_G_TOE];
  p->toc = g[VOX_G_TOC];
  p->week = vox_GpsWeekOf(record_seconds, p->toe);
  p->af2 = g[VOX_G_AF2];
  p->af1 = g[VOX_G_AF1];
  p->af0 = g[VOX_G_AF0];
  p->tgd = g[VOX_G_TGD];
  p->tgd2 = 0.0;
  p->delta_n = g[VOX_G_DELTA_N];
  p->e = g[VOX_G_E];
  p->sqrt_a = g[VOX_G_SQRT_A];
  p->m0 = g[VOX_G_M0];
  p->omega_dot = g[VOX_G_OMEGA_DOT];
  p->idot = g[VOX_G_IDOT];
  p->cuc = g[VOX_G_CUC];
  p->cus = g[VOX_G_CUS];
  p->crc = g[VOX_G_CRC];
  p->crs = g[VOX_G_CRS];
  p->omega0 = g[VOX_G_OMEGA0];
  p->omega = g[VOX_G_OMEGA];
  p->cic = g[VOX_G_CIC];
  p->i0 = g[VOX_G_I0];
  p->cis = g[VOX_G_CIS];
  p->iode = (uint32_t)g[VOX_G_IODE];
  p->ura = (uint32_t)g[VOX_G_URA];
  p->health = (uint32_t)g[VOX_G_HEALTH];
  p->fit_flag = ((uint32_t)g[VOX_G_FLAGS] & VOX_G25_FIT_FLAG) ? 1u : 0u;
}

/* The engine's GPS/BDS record -> field values, as vox placed them (widths already applied).
 * Only the low byte of G24 reaches the engine (byte 121); bit 2 of G25 arrives as 0 or 1. */
static inline void vox_GpsEphemerisToFields(const vox_GpsEphemeris* r, double g[VOX_G_COUNT]) {
  int k;
  g[0] = 0.0;
  g[1] = (double)r->g1;
  g[2] = (double)r->g2;
  for (k = 0; k < 4; ++k)
    g[3 + k] = r->g3_g6[k];
  g[7] = r->g7;
  g[8] = r->g8;
  g[9] = r->g9;
  g[10] = r->g10;
  g[11] = r->g11;
  g[12] = r->g12;
  g[13] = r->g13;
  for (k = 0; k < 3; ++k)
    g[14 + k] = r->g14_g16[k];
  g[17] = r->g17;
  g[18] = r->g18;
  g[19] = r->g19;
  g[20] = r->g20;
  g[21] = r->g21;
  g[22] = (double)r->g22;
  g[23] = (double)r->g23;
  g[24] = (double)r->g24_byte;
  g[25] = r->g25_bit2 ? (double)VOX_G25_FIT_FLAG : 0.0;
}

/* Unpacks a GPS or BDS record of vox_GetNextEphemerisEx / vox_FindEphemerisEx. Returns 1, or
 * 0 (and leaves p alone) when the record belongs to another system. For tag-45 satellites
 * (GPS 33 to 37) health is already "0 = healthy" (see above). */
static inline int vox_GpsOrbitFromEphemeris(const vox_EphemerisData* rec, vox_GpsOrbitParams* p) {
  double g[VOX_G_COUNT];
  unsigned system = (rec->head.sat >> 8) & 7u;
  if (system != 0u && system != 2u) return 0;
  vox_GpsEphemerisToFields(&rec->gps, g);
  vox_GpsOrbitFromFields(g, rec->head.seconds, p);
  if (system == 2u) { /* BDS: byte 120 is C25 (AODC), not a flag bit */
    p->fit_flag = rec->gps.g25_bit2;
  }
  return 1;
}

/* Packs params into the record vox would hand out for a tag-13 record of GPS satellite
 * `number` (1 to 32): for tests and for engines that build records of their own. */
static inline void vox_GpsOrbitToEphemeris(const vox_GpsOrbitParams* p, unsigned number,
                                           vox_EphemerisData* rec) {
  double g[VOX_G_COUNT];
  int k;
  double t = (double)p->week * VOX_GPS_WEEK_SECONDS + p->toe;
  for (k = 0; k < 129; ++k)
    rec->bytes[k] = 0;
  vox_GpsOrbitToFields(p, g);
  rec->gps.seconds = (uint32_t)t;
  rec->gps.ms = (uint16_t)((t - (double)(uint32_t)t) * 1000.0 + 0.5);
  rec->gps.sat = (SatId)(number & 0xFFu);
  rec->gps.g1 = (uint32_t)g[1];
  rec->gps.g2 = (uint32_t)g[2];
  for (k = 0; k < 4; ++k)
    rec->gps.g3_g6[k] = (float)g[3 + k];
  rec->gps.g7 = (float)g[7];
  rec->gps.g8 = g[8];
  rec->gps.g9 = g[9];
  rec->gps.g10 = g[10];
  rec->gps.g11 = (float)g[11];
  rec->gps.g12 = (float)g[12];
  rec->gps.g13 = (float)g[13];
  for (k = 0; k < 3; ++k)
    rec->gps.g14_g16[k] = (float)g[14 + k];
  rec->gps.g17 = g[17];
  rec->gps.g18 = g[18];
  rec->gps.g19 = (float)g[19];
  rec->gps.g20 = g[20];
  rec->gps.g21 = (float)g[21];
  rec->gps.g22 = (uint8_t)g[22];
  rec->gps.g22_wide = (uint16_t)rec->gps.g22;
  rec->gps.g23 = (uint8_t)g[23];
  rec->gps.g25_bit2 = ((uint32_t)g[25] & VOX_G25_FIT_FLAG) ? 1u : 0u;
  rec->gps.g24_byte = (uint8_t)((uint32_t)g[24] & 0xFFu);
}

/* Rounds every value of p to the width its field has in the raw record, so that a
 * simulator can take as its truth exactly what an engine will read back. */
static inline void vox_GpsOrbitQuantize(vox_GpsOrbitParams* p) {
  vox_EphemerisData rec;
  uint32_t week = p->week;
  vox_GpsOrbitToEphemeris(p, 1u, &rec);
  vox_GpsOrbitFromEphemeris(&rec, p);
  p->week = week;
}

/* Unpacks a GALILEO record (tag 47) with the E-field table above; tgd and tgd2 receive the
 * two BGDs. Returns 1, or 0 for a record of another system. Note that GALILEO orbits are
 * evaluated with GALILEO's own gravitational constant, not VOX_GPS_MU. */
static inline int vox_GalileoOrbitFromEphemeris(const vox_EphemerisData* rec,
                                                vox_GpsOrbitParams* p) {
  const vox_GalileoEphemeris* r = &rec->galileo;
  if (((rec->head.sat >> 8) & 7u) != 3u) return 0;
  p->toe = (double)r->e1;
  p->toc = (double)r->e2;
  p->week = vox_GpsWeekOf(r->seconds, p->toe);
  p->af2 = r->e3_e6[0];
  p->af1 = r->e3_e6[1];
  p->tgd = r->e3_e6[2];
  p->tgd2 = r->e3_e6[3];
  p->af0 = r->e7;
  p->e = r->e8_e10[0];
  p->sqrt_a = r->e8_e10[1];
  p->m0 = r->e8_e10[2];
  p->delta_n = r->e11;
  p->omega_dot = r->e12;
  p->idot = r->e13;
  p->cuc = r->e14;
  p->cus = r->e15_e17[0];
  p->crc = r->e15_e17[1];
  p->crs = r->e15_e17[2];
  p->omega0 = r->e18;
  p->omega = r->e19;
  p->cic = r->e20;
  p->i0 = r->e21;
  p->cis = r->e22;
  p->iode = r->e23;
  p->ura = r->e24;
  p->health = r->e25;
  p->fit_flag = 0;
  return 1;
}

/* GLONASS (tag 14) fields of the engine's record. */
static inline double vox_GlonassTauN(const vox_EphemerisData* rec) {
  return rec->glonass.r1;
}
static inline double vox_GlonassGammaN(const vox_EphemerisData* rec) {
  return rec->glonass.r2;
}
static inline int vox_GlonassChannel(const vox_EphemerisData* rec) {
  return (int)(int8_t)rec->glonass.r3;
}
static inline unsigned vox_GlonassHealth(const vox_EphemerisData* rec) {
  return rec->glonass.r4;
}

#endif /* VOX_SDK_FIELDS_H */
