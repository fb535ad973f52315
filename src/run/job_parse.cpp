#include "run/job_parse.h"

#include "job/job_parser.h"
#include "job/job_paths.h"
#include "platform/platform.h"
#include "run/task.h"

namespace vox {

bool ParseJobIntoTask(TTask& task, std::string_view text, const std::string& job_path,
                      uint32_t cpu_count) {
  JobParseInput input;
  input.job_folder = JobFolderOf(job_path);
  input.module_path = platform::OwnModulePath();
  input.cpu_count = cpu_count;
  if (!ParseJob(text, input, *task.engines, task.job)) return false;
  task.result_file.set_path(task.job.result_path);
  task.result_file.result_version = static_cast<uint32_t>(task.job.result_version);
  return true;
}

}  // namespace vox
