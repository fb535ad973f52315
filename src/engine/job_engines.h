// JobEngines: the engines of one job (the processing engine and, for multi-site kinematic
// jobs, the static engine), as the job parser loads them through the EngineBinder interface.
// The run room's TTask owns one and reaches the engines through it when it runs them.
//
// Job thread only, except that the engines themselves may be called from worker threads
// through counted calls (see engine.h) while the JobEngines object stays alive.
#pragma once

#include <memory>
#include <string>

#include "engine/engine.h"
#include "job/engine_binder.h"

namespace vox {

class JobEngines final : public EngineBinder {
 public:
  JobEngines() = default;
  // Destroys the engines, the static engine first (each writes its unload line when mapped).
  ~JobEngines() override;
  JobEngines(const JobEngines&) = delete;
  JobEngines& operator=(const JobEngines&) = delete;

  bool LoadEngine(EngineRole role, const std::string& path) override;
  std::unique_ptr<ParamBlock> CreateJobBlock(EngineRole role) override;
  bool FillParameters(EngineRole role, const JobSection& section, ParamBlock& block) override;

  // The engine of role, null when none was loaded (it may be present but not loaded()).
  TEngine* engine(EngineRole role) const { return Slot(role).get(); }
  TEngine* processing() const { return processing_.get(); }
  TEngine* static_engine() const { return static_.get(); }

 private:
  const std::unique_ptr<TEngine>& Slot(EngineRole role) const {
    return role == EngineRole::kStatic ? static_ : processing_;
  }
  std::unique_ptr<TEngine>& Slot(EngineRole role) {
    return role == EngineRole::kStatic ? static_ : processing_;
  }

  std::unique_ptr<TEngine> processing_;
  std::unique_ptr<TEngine> static_;
};

}  // namespace vox
