// The rules of raw records that do not depend on byte order: the value windows that decoded
// numbers must pass, the two satellite codes, and the tables that sort signals into slots.
#pragma once

#include <cmath>
#include <cstdint>

#include "base/sat.h"
#include "raw/raw_records.h"

namespace vox {

// Zero always passes; otherwise the value must be finite and normal with a magnitude from
// 2^lo up to but not including 2^hi. Values outside the window are garbage from a receiver
// that lost lock, so they are treated as absent rather than passed on.
constexpr double Pow2(int e) {
  double v = 1.0;
  for (; e > 0; --e)
    v *= 2.0;
  for (; e < 0; ++e)
    v /= 2.0;
  return v;
}
// The window's ends are powers of two, exact in both float widths; comparing the magnitude
// with them also rejects NaN, infinities and subnormals (which lie below the lower end).
template <int kLo, int kHi>
inline bool InWindow(double v) {
  static_assert(kLo >= -1000 && kHi < 1000);
  constexpr double lo = Pow2(kLo), hi = Pow2(kHi);
  if (v == 0.0) return true;
  const double a = std::fabs(v);
  return a >= lo && a < hi;
}
template <int kLo, int kHi>
inline bool InWindowF(float v) {
  static_assert(kLo >= -126 && kHi < 128);
  constexpr float lo = static_cast<float>(Pow2(kLo)), hi = static_cast<float>(Pow2(kHi));
  if (v == 0.0f) return true;
  const float a = std::fabs(v);
  return a >= lo && a < hi;
}
inline bool CodeValueOk(double v) {
  return InWindow<-50, 28>(v);
}
inline bool PhaseValueOk(double v) {
  return InWindow<-50, 44>(v);
}
inline bool Float32ValueOk(float v) {
  return InWindowF<-33, 21>(v);
}

// Satellite codes. One byte: bits 0-5 number, bits 6-7 group. Two bytes: bits 0-5 number,
// bits 6-9 group. Groups: 0 GPS, 1 SBAS, 2 GLONASS, 3 GPS number + 32, 4 GALILEO, 5 BDS.
struct DecodedSat {
  SatId sat = 0;
  uint8_t group = 0;
  bool valid = false;
};
inline DecodedSat DecodeSatCode(uint16_t code, bool two_byte) {
  const unsigned n = code & 63u;
  const unsigned g = two_byte ? (code >> 6) & 15u : (code >> 6) & 3u;
  DecodedSat d;
  d.group = static_cast<uint8_t>(g);
  switch (g) {
    case 0:
      d.sat = MakeSatId(SatSystem::kGps, n);
      break;
    case 1:
      d.sat = MakeSatId(SatSystem::kSbas, n);
      break;
    case 2:
      d.sat = MakeSatId(SatSystem::kGlonass, n);
      break;
    case 3:
      d.sat = MakeSatId(SatSystem::kGps, n + 32);
      break;
    case 4:
      d.sat = MakeSatId(SatSystem::kGalileo, n);
      break;
    case 5:
      d.sat = MakeSatId(SatSystem::kBds, n);
      break;
    default:
      return d;
  }
  d.valid = IsValidSatId(d.sat);
  return d;
}

// Slot of a tag-51 signal code s (0-127) for a satellite of the given code group, or kNoSlot.
SignalSlot Slot51(uint8_t group, uint8_t signal_code);
namespace detail {
extern const uint8_t (&kSlot51Table)[6][128];
}
inline SignalSlot Slot51Fast(uint8_t group, uint8_t signal_code) {
  return group < 6 && signal_code < 128
             ? static_cast<SignalSlot>(detail::kSlot51Table[group][signal_code])
             : kNoSlot;
}

// Slot of a tag-8 signal kind k = (flags >> 3) & 3. The scan's signal masks and the epoch
// stream's values read the kind through different tables (kinds 1 and 3 differ); both are
// kept as they are because stored files and engines rely on each.
SignalSlot Slot8ForMask(unsigned kind);
SignalSlot Slot8ForValues(unsigned kind);
inline unsigned Kind8(uint16_t flags) {
  return (flags >> 3) & 3u;
}

}  // namespace vox
