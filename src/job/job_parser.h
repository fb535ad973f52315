// The job parser: the prepared job text into a JobModel, loading the engines through an
// EngineBinder on the way and reading the [LEAP_SEC] section into the process-wide table
// last. Lenient by design: missing numbered sections, bad numbers and references to missing
// items are traced or skipped, and the job goes on with what was accepted.
//
// Job thread only.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "job/engine_binder.h"
#include "job/job_model.h"

namespace vox {

struct JobParseInput {
  // The job file's folder with its separator ("./" for a job given as text).
  std::string job_folder = "./";
  // This library's own file (platform::OwnModulePath()); bare engine names are taken in its
  // folder.
  std::string module_path;
  // The CPU count the caller passed to the run: the default of NumCPUs.
  uint32_t cpu_count = 1;
};

// False only when there is no [JOB] section or an engine cannot be loaded; the model then
// holds whatever was read before.
bool ParseJob(std::string_view text, const JobParseInput& input, EngineBinder& binder,
              JobModel& model);

}  // namespace vox
