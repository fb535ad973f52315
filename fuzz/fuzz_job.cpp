// The job text: carriage returns removed, run variables substituted (with variables that
// refer to each other) and the result parsed into a job model through a binder that loads
// nothing but answers like an engine with a parameter block. The process-wide leap-second
// table is reset for every input so that inputs do not depend on each other.
#include <cstdint>
#include <memory>
#include <string>

#include "job/engine_binder.h"
#include "job/job_model.h"
#include "job/job_parser.h"
#include "job/job_text.h"
#include "job/leap_seconds.h"

namespace {

class FakeBinder : public vox::EngineBinder {
 public:
  bool LoadEngine(vox::EngineRole, const std::string& path) override {
    return !path.empty() && path.back() != '/';
  }
  std::unique_ptr<vox::ParamBlock> CreateJobBlock(vox::EngineRole) override {
    return vox::ParamBlock::Create(64);
  }
  bool FillParameters(vox::EngineRole, const vox::JobSection& section, vox::ParamBlock&) override {
    for (const char* name : {"Elevation", "StartPoint", "Mask", "Interval"})
      vox::EngineParameterValue(section, name);
    return true;
  }
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::string text(reinterpret_cast<const char*>(data), size);
  vox::VarList vars;
  vars.Add("ROOT=/nonexistent/vox-fuzz");
  vars.Add("NAME=$(ROOT)/job");
  vars.Add("EMPTY");
  vox::RemoveCarriageReturns(text);
  vox::SubstituteVariables(text, vars);

  vox::ResetLeapTableForTesting();
  vox::JobParseInput in;
  in.job_folder = "/nonexistent/vox-fuzz/";
  in.module_path = "/nonexistent/vox-fuzz/lib/libvox.so";
  in.cpu_count = 2;
  FakeBinder binder;
  vox::JobModel model;
  vox::ParseJob(text, in, binder, model);
  return 0;
}
