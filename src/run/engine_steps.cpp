// Until engine scheduling arrives, the raw filter step reports the raw filter as not loaded
// (with the messages a real run writes either way), so the engine step is never reached.
#include "run/engine_steps.h"

#include "platform/platform.h"
#include "run/run_state.h"
#include "run/task.h"

namespace vox {

namespace {
constexpr uint32_t kRawFilterMessage = 21;
constexpr uint32_t kRawFilterDoneMessage = 1079;
constexpr uint32_t kStepEndMessage = 32;
}  // namespace

bool RunRawFilterStep(TTask& task) {
  platform::SetEngineFloatingPointMode();
  task.result_file.WriteMessage("RawFilter", kRawFilterMessage);
  const bool loaded = false;
  task.result_file.WriteMessage("RawFilter - OK", kRawFilterDoneMessage);
  task.result_file.WriteMessage(nullptr, kStepEndMessage);
  return loaded;
}

bool RunEngineStep(TTask& task) {
  (void)task;
  return false;
}

void BreakCheck(TTask& task) {
  if (TheRun().break_flag.load() != 1) return;
  TEngine* engine = task.current_engine.load();
  if (engine != nullptr && engine->loaded()) engine->BreakProcess();
}

}  // namespace vox
