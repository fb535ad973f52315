#include "run/engine_call.h"

#include "base/engine_log.h"
#include "engine/engine.h"
#include "platform/platform.h"

namespace vox {

bool CallEngineGuarded(const TEngine& engine, const char* what, const std::function<void()>& call) {
  const platform::GuardReport report = platform::RunGuarded(call);
  if (report.outcome == platform::GuardOutcome::kReturned) return true;
  Trace("%s: %s failed: %s\n", engine.file_name().c_str(), what, report.description.c_str());
  return false;
}

}  // namespace vox
