// Building the engine's full ephemeris records from the decoded raw records, and the short
// records from the full ones.
#include <cstring>

#include "raw/ephemeris_store.h"

namespace vox {

namespace {

vox_EphemerisData Blank(const RawTime& t, SatId sat) {
  vox_EphemerisData d;
  std::memset(&d, 0, sizeof d);
  const TimeMs time = ToTimeMs(t);
  d.head.seconds = time.seconds;
  d.head.ms = time.ms;
  d.head.sat = sat;
  return d;
}

template <typename R>
void FillKepler(vox_GpsEphemeris& g, const R& r) {
  // GPS and BDS share the layout; R is GpsEphemerisRecord or a BDS record mapped to it.
  for (int i = 0; i < 4; ++i)
    g.g3_g6[i] = r.f3_7[i];
  g.g7 = r.f3_7[4];
  g.g8 = r.d8, g.g9 = r.d9, g.g10 = r.d10;
  g.g11 = r.f11_16[0];
  g.g12 = r.f11_16[1];
  g.g13 = r.f11_16[2];
  for (int i = 0; i < 3; ++i)
    g.g14_g16[i] = r.f11_16[3 + i];
  g.g17 = r.d17, g.g18 = r.d18, g.g19 = r.f19, g.g20 = r.d20, g.g21 = r.f21;
  g.g1 = r.u1, g.g2 = r.u2;
  g.g22_wide = r.b22;
  g.g22 = r.b22;
  g.g23 = r.b23;
}

struct KeplerView {
  const float* f3_7;
  double d8, d9, d10;
  const float* f11_16;
  double d17, d18;
  float f19;
  double d20;
  float f21;
  uint32_t u1, u2;
  uint8_t b22, b23;
};

}  // namespace

vox_EphemerisData MakeGpsEphemeris(const GpsEphemerisRecord& r, bool high_numbers) {
  const unsigned number = high_numbers ? r.number + 32u : r.number;
  vox_EphemerisData d = Blank(r.time, MakeSatId(SatSystem::kGps, number));
  const KeplerView v{r.g3_g7, r.g8,  r.g9,  r.g10, r.g11_g16, r.g17, r.g18,
                     r.g19,   r.g20, r.g21, r.g1,  r.g2,      r.g22, r.g23};
  FillKepler(d.gps, v);
  d.gps.g25_bit2 = (r.g25 >> 2) & 1;
  d.gps.g24_byte = high_numbers ? (r.g24 == 1 ? 0 : 1) : static_cast<uint8_t>(r.g24 & 0xFF);
  return d;
}

vox_EphemerisData MakeBdsEphemeris(const BdsEphemerisRecord& r) {
  vox_EphemerisData d = Blank(r.time, MakeSatId(SatSystem::kBds, r.number));
  const KeplerView v{r.c3_c7, r.c8,  r.c9,  r.c10, r.c11_c16, r.c17, r.c18,
                     r.c19,   r.c20, r.c21, r.c1,  r.c2,      r.c22, r.c23};
  FillKepler(d.gps, v);
  d.gps.g25_bit2 = r.c25;
  d.gps.g24_byte = r.c24;
  return d;
}

vox_EphemerisData MakeGlonassEphemeris(const GlonassEphemerisRecord& r) {
  vox_EphemerisData d = Blank(r.time, MakeSatId(SatSystem::kGlonass, r.slot));
  vox_GlonassEphemeris& g = d.glonass;
  g.r1 = r.r1;
  g.r2 = r.r2;
  for (int i = 0; i < 3; ++i) {
    g.position[i] = r.position[i] * 1000.0;
    g.velocity[i] = static_cast<double>(r.velocity[i]) * 1000.0;
    g.acceleration[i] = r.acceleration[i] * 1000.0f;
  }
  g.r4 = r.r4;
  g.r3 = r.r3;
  return d;
}

vox_EphemerisData MakeSbasEphemeris(const SbasEphemerisRecord& r) {
  // The time is the reference time of day placed on the reception day, taking the nearer day
  // when the reference lies across midnight from the reception.
  const int64_t t = static_cast<int64_t>(ToTimeMs(r.time).seconds);
  int64_t diff = t % 86400 - static_cast<int64_t>(r.reference_seconds);
  if (diff >= 43200) diff -= 86400;
  if (diff < -43200) diff += 86400;
  vox_EphemerisData d = Blank(RawTime{}, MakeSatId(SatSystem::kSbas, r.number));
  d.head.seconds = static_cast<uint32_t>(t - diff);
  d.head.ms = 0;
  vox_SbasEphemeris& s = d.sbas;
  s.s12 = r.s6_s13[6];
  s.s13 = r.s6_s13[7];
  for (int i = 0; i < 3; ++i)
    s.s3_s5[i] = r.s3_s5[i];
  for (int i = 0; i < 6; ++i)
    s.s6_s11[i] = r.s6_s13[i];
  s.s1 = r.s1;
  s.s2 = r.s2;
  return d;
}

vox_EphemerisData MakeGalileoEphemeris(const GalileoEphemerisRecord& r) {
  vox_EphemerisData d = Blank(r.time, MakeSatId(SatSystem::kGalileo, r.number));
  vox_GalileoEphemeris& e = d.galileo;
  for (int i = 0; i < 4; ++i)
    e.e3_e6[i] = r.e3_e6[i];
  e.e7 = r.e7_e10[0];
  for (int i = 0; i < 3; ++i)
    e.e8_e10[i] = r.e7_e10[1 + i];
  e.e11 = r.e11_e17[0];
  e.e12 = r.e11_e17[1];
  e.e13 = r.e11_e17[2];
  e.e14 = r.e11_e17[3];
  for (int i = 0; i < 3; ++i)
    e.e15_e17[i] = r.e11_e17[4 + i];
  e.e18 = r.e18, e.e19 = r.e19, e.e20 = r.e20, e.e21 = r.e21, e.e22 = r.e22;
  e.e1 = r.e1, e.e2 = r.e2;
  e.e23 = r.e23, e.e24 = r.e24, e.e25 = r.e25;
  return d;
}

bool ToShortRecord(const vox_EphemerisData& d, vox_ShortEphemerisData* out) {
  const SatSystem system = SystemOf(d.head.sat);
  if (system != SatSystem::kGps && system != SatSystem::kGlonass) return false;
  const uint8_t* f = d.bytes;
  uint8_t* s = out->bytes;
  auto copy = [&](size_t to, size_t from, size_t n) { std::memcpy(s + to, f + from, n); };
  const bool gps = system == SatSystem::kGps;
  s[0] = static_cast<uint8_t>(gps ? NumberOf(d.head.sat) : 128 + NumberOf(d.head.sat));
  copy(1, 0, 4);
  copy(5, 4, 2);
  s[7] = gps ? f[121] : f[77];
  copy(8, 8, 8);
  if (gps) {
    copy(16, 16, 8);
    copy(24, 104, 4);
    copy(28, 24, 24);
    copy(52, 48, 24);
    copy(76, 72, 24);
    copy(100, 96, 8);
    copy(108, 108, 10);
    copy(118, 118, 3);
  } else {
    copy(16, 16, 60);
    s[76] = f[76];
  }
  return true;
}

}  // namespace vox
