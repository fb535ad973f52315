#include "engine/job_engines.h"

#include "engine/engine_params.h"

namespace vox {

JobEngines::~JobEngines() {
  static_.reset();
  processing_.reset();
}

bool JobEngines::LoadEngine(EngineRole role, const std::string& path) {
  std::unique_ptr<TEngine>& slot = Slot(role);
  LoadEngineInto(slot, path);
  return slot->loaded();
}

std::unique_ptr<ParamBlock> JobEngines::CreateJobBlock(EngineRole role) {
  std::unique_ptr<ParamBlock> block;
  CreateParamBlock(block, engine(role));
  return block;
}

bool JobEngines::FillParameters(EngineRole role, const JobSection& section, ParamBlock& block) {
  return FillParams(engine(role), section, &block);
}

}  // namespace vox
