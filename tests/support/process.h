// Running the project's programs from POSIX tests: a program with its exit status, or a
// shell command with its output. (The Windows test build runs its programs from scripts.)
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace vox::test {

// Runs program with the arguments and the extra environment variables, its standard output
// discarded; returns its exit status, or -1 when it did not exit normally.
int RunProgram(const std::string& program, const std::vector<std::string>& arguments,
               const std::vector<std::pair<std::string, std::string>>& environment = {});

// Runs a shell command and returns what it printed; status receives its wait status.
std::string RunCommand(const std::string& command, int& status);

#ifdef VOX_VOXRUN
// voxrun on a job file; its exit status is the job's exit code.
inline int RunVoxrun(const std::string& job) {
  return RunProgram(VOX_VOXRUN, {job});
}
#endif

}  // namespace vox::test
