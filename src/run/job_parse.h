// The pipeline's parse step: the prepared job text into the task's job model, paths
// completed against the job folder, engines loaded into the task. Job thread only.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vox {

struct TTask;

// False when the text is not a job (no [JOB] section) or an engine cannot be loaded. On
// success the task's result writer knows its path and result version.
bool ParseJobIntoTask(TTask& task, std::string_view text, const std::string& job_path,
                      uint32_t cpu_count);

}  // namespace vox
