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

}  // namespace voxtools
