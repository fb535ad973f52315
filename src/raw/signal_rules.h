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
inline bool InWindow(double v, int lo, int hi) {
  if (v == 0.0) return true;
  if (!std::isnormal(v)) return false;
  const double a = std::fabs(v);
  return a >= std::ldexp(1.0, lo) && a < std::ldexp(1.0, hi);
}
inline bool InWindowF(float v, int lo, int hi) {
  if (v == 0.0f) return true;
  if (!std::isnormal(v)) return false;
  const float a = std::fabs(v);
  return a >= std::ldexp(1.0f, lo) && a < std::ldexp(1.0f, hi);
}
inline bool CodeValueOk(double v) {
  return InWindow(v, -50, 28);
}
inline bool PhaseValueOk(double v) {
  return InWindow(v, -50, 44);
}
inline bool Float32ValueOk(float v) {
  return InWindowF(v, -33, 21);
}

// Satellite codes. One byte: bits 0-5 number, bits 6-7 group. Two bytes: bits 0-5 number,
// bits 6-9 group. Groups: 0 GPS, 1 SBAS, 2 GLONASS, 3 GPS number + 32, 4 GALILEO, 5 BDS.
struct DecodedSat {
  SatId sat = 0;
  uint8_t group = 0;
  bool valid = false;
};
DecodedSat DecodeSatCode(uint16_t code, bool two_byte);

// Slot of a tag-51 signal code s (0-127) for a satellite of the given code group, or kNoSlot.
SignalSlot Slot51(uint8_t group, uint8_t signal_code);

// Slot of a tag-8 signal kind k = (flags >> 3) & 3. The scan's signal masks and the epoch
// stream's values read the kind through different tables (kinds 1 and 3 differ); both are
// kept as they are because stored files and engines rely on each.
SignalSlot Slot8ForMask(unsigned kind);
SignalSlot Slot8ForValues(unsigned kind);
inline unsigned Kind8(uint16_t flags) {
  return (flags >> 3) & 3u;
}

}  // namespace vox
