// The part of the fault guard that is the same on every OS: a C++ exception leaving the
// guarded function becomes a report. (Each OS layer adds its own catch of processor faults.)
#pragma once

#include <functional>

#include "platform/platform.h"

namespace vox::platform {

// Runs fn; a C++ exception it throws is caught and described in the report.
GuardReport CallCatchingExceptions(const std::function<void()>& fn);

}  // namespace vox::platform
