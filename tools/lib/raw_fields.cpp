#include "raw_fields.h"

#include <cmath>

namespace voxtools {

RawStamp StampOfSeconds(double seconds) {
  const auto ms = static_cast<uint64_t>(std::llround(seconds * 1000.0));
  RawStamp s;
  s.day = static_cast<uint32_t>(ms / 86400000u);
  s.ms_of_day = static_cast<uint32_t>(ms % 86400000u);
  return s;
}

RawGpsEphemeris GpsEphemerisFromOrbit(const vox_GpsOrbitParams& p, unsigned gps_number,
                                      uint8_t* tag) {
  double g[VOX_G_COUNT];
  vox_GpsOrbitToFields(&p, g);
  RawGpsEphemeris r;
  const bool high = gps_number > 32;
  r.number = static_cast<uint8_t>(high ? gps_number - 32 : gps_number);
  r.time = StampOfSeconds(p.week * VOX_GPS_WEEK_SECONDS + p.toe);
  r.g1 = static_cast<uint32_t>(g[1]);
  r.g2 = static_cast<uint32_t>(g[2]);
  for (int k = 0; k < 5; ++k)
    r.g3_g7[k] = static_cast<float>(g[3 + k]);
  r.g8 = g[8];
  r.g9 = g[9];
  r.g10 = g[10];
  for (int k = 0; k < 6; ++k)
    r.g11_g16[k] = static_cast<float>(g[11 + k]);
  r.g17 = g[17];
  r.g18 = g[18];
  r.g19 = static_cast<float>(g[19]);
  r.g20 = g[20];
  r.g21 = static_cast<float>(g[21]);
  r.g22 = static_cast<uint8_t>(g[22]);
  r.g23 = static_cast<uint8_t>(g[23]);
  r.g24 = static_cast<uint16_t>(g[24]);
  // vox turns a tag-45 G24 of 1 into "0" for the engine and anything else into "1".
  if (high) r.g24 = p.health == 0 ? 1 : 0;
  r.g25 = static_cast<uint8_t>(g[25]);
  if (tag) *tag = high ? 45 : 13;
  return r;
}

RawGalileoEphemeris GalileoEphemerisFromOrbit(const vox_GpsOrbitParams& p, unsigned number) {
  RawGalileoEphemeris r;
  r.number = static_cast<uint8_t>(number);
  r.time = StampOfSeconds(p.week * VOX_GPS_WEEK_SECONDS + p.toe);
  r.e1 = static_cast<uint32_t>(p.toe);
  r.e2 = static_cast<uint32_t>(p.toc);
  const double small[] = {p.af2, p.af1, p.tgd, p.tgd2};
  for (int k = 0; k < 4; ++k)
    r.e3_e6[k] = static_cast<float>(small[k]);
  const double wide[] = {p.af0, p.e, p.sqrt_a, p.m0};
  for (int k = 0; k < 4; ++k)
    r.e7_e10[k] = wide[k];
  const double rates[] = {p.delta_n, p.omega_dot, p.idot, p.cuc, p.cus, p.crc, p.crs};
  for (int k = 0; k < 7; ++k)
    r.e11_e17[k] = static_cast<float>(rates[k]);
  r.e18 = p.omega0;
  r.e19 = p.omega;
  r.e20 = static_cast<float>(p.cic);
  r.e21 = p.i0;
  r.e22 = static_cast<float>(p.cis);
  r.e23 = static_cast<uint16_t>(p.iode);
  r.e24 = static_cast<uint8_t>(p.ura);
  r.e25 = static_cast<uint8_t>(p.health);
  return r;
}

}  // namespace voxtools
