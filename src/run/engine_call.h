// Engine calls under the fault guard: an engine function that throws or faults costs its own
// call, never the process. Usable on any thread that runs engine code.
#pragma once

#include <cstdint>
#include <functional>

namespace vox {

class TEngine;

// Runs call (one _eng_* function of engine, named by what for the engine log) under the
// fault guard. True when it returned; on an exception or a fault it writes one engine-log
// line and yields false, and whatever the call would have produced is lost.
bool CallEngineGuarded(const TEngine& engine, const char* what, const std::function<void()>& call);

}  // namespace vox
