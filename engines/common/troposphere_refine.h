// Two sites a few kilometres apart see nearly the same atmosphere, but not quite: their wet
// zenith delays differ by up to a centimetre, which a fixed baseline turns into a few
// centimetres of height. With the integer ambiguities known, the static rover position and
// that difference (one zenith delay for the session) can be estimated together.
#pragma once

#include <span>

#include "double_difference.h"

namespace voxeng {

// Re-solves a fixed static solution with a relative zenith delay of the rover; sol keeps its
// ambiguities and reference. True (and sol updated, zenith delay in m) when it solved.
bool RefineWithZenithDelay(std::span<const DdEpoch> epochs, const Vec3& base, BaselineSolution& sol,
                           const DdOptions& options, double& zenith);

}  // namespace voxeng
