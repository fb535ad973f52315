// Dilution of precision of a receiver's view of its satellites: how the geometry alone
// scales range errors into position errors (HDOP for the horizontal part).
#pragma once

#include <span>

#include "geodesy.h"

namespace voxeng {

// Horizontal DOP of a receiver (position and clock unknown) seeing the given satellites
// above `elevation_mask`; 0 when fewer than four remain or the geometry is degenerate.
double Hdop(const Vec3& receiver, std::span<const Vec3> satellites, double elevation_mask);

}  // namespace voxeng
