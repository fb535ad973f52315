// Dual-frequency combinations of GPS L1 and L2 observables.
#pragma once

#include "vox/vox_sdk_fields.h"

namespace voxeng {

inline constexpr double kL1Wavelength = VOX_SPEED_OF_LIGHT / VOX_GPS_L1_HZ;  // ~0.1903 m
inline constexpr double kL2Wavelength = VOX_SPEED_OF_LIGHT / VOX_GPS_L2_HZ;  // ~0.2442 m
// gamma = (f1/f2)^2: the L2 ionospheric delay is gamma times that of L1.
inline constexpr double kGamma = (VOX_GPS_L1_HZ / VOX_GPS_L2_HZ) * (VOX_GPS_L1_HZ / VOX_GPS_L2_HZ);

// Ionosphere-free combination of two ranges in metres (code, or phase scaled to metres).
inline double IonoFree(double l1_m, double l2_m) {
  return (kGamma * l1_m - l2_m) / (kGamma - 1.0);
}
// The L1 ionospheric delay seen in the difference of two code ranges (m).
inline double IonoL1FromCodes(double p1, double p2) {
  return (p2 - p1) / (kGamma - 1.0);
}
// Wide-lane wavelength (~0.862 m) and the Melbourne-Wuebbena combination in wide-lane cycles:
// its mean over a pass is the wide-lane ambiguity N1 - N2.
inline constexpr double kWideLaneWavelength = VOX_SPEED_OF_LIGHT / (VOX_GPS_L1_HZ - VOX_GPS_L2_HZ);
inline double MelbourneWuebbena(double p1, double p2, double phi1_cycles, double phi2_cycles) {
  const double f1 = VOX_GPS_L1_HZ, f2 = VOX_GPS_L2_HZ;
  const double narrow_code = (f1 * p1 + f2 * p2) / (f1 + f2);
  return phi1_cycles - phi2_cycles - narrow_code / kWideLaneWavelength;
}

}  // namespace voxeng
