#include "job/job_paths.h"

#include "platform/platform.h"

namespace vox {

namespace {

bool IsSeparator(char c) {
  return c == '\\' || c == '/';
}

bool IsLetter(char c) {
  return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
}

bool HasDrive(const std::string& path) {
  return path.size() >= 2 && IsLetter(path[0]) && path[1] == ':';
}

std::string FolderOf(const std::string& path) {
  const size_t last = path.find_last_of("\\/");
  return last == std::string::npos ? std::string("./") : path.substr(0, last + 1);
}

}  // namespace

std::string JobFolderOf(const std::string& job_path) {
  return FolderOf(job_path);
}

std::string ResolveJobPath(const std::string& path, const std::string& job_folder) {
  if (path.empty()) return path;
  if (path[0] == '/') return path;                                          // POSIX absolute
  if (path.size() >= 2 && path[0] == '\\' && path[1] == '\\') return path;  // network path
  if (path[0] == '\\') {
    if (HasDrive(job_folder)) return job_folder.substr(0, 2) + path;
    return job_folder + path;
  }
  if (HasDrive(path) && path.size() >= 3 && IsSeparator(path[2])) return path;
  return job_folder + path;
}

std::string ResolveModulePath(const std::string& path, const std::string& module_path) {
  if (path.find_first_of("\\/") != std::string::npos) return path;
  return FolderOf(module_path) + path;
}

void AutoIncrementResultPath(std::string& result_path, std::string& job_name) {
  if (result_path.empty() || !platform::FileExists(result_path)) return;
  // Only a dot of the file name counts: one in a folder name ("./", "run.1/") would send
  // the result into a folder that does not exist.
  const size_t name_start = result_path.find_last_of("\\/") + 1;  // npos + 1 == 0
  size_t split = result_path.rfind('.');
  if (split == std::string::npos || split < name_start) split = result_path.size();

  const std::string head = result_path.substr(0, split);
  const std::string tail = result_path.substr(split);
  for (int n = 0; n < 1000; ++n) {
    std::string candidate = head + "_" + std::to_string(n) + tail;
    if (!platform::FileExists(candidate)) {
      result_path = std::move(candidate);
      job_name += "(" + std::to_string(n) + ")";
      return;
    }
  }
}

}  // namespace vox
