// Whole jobs through voxrun with the probe engine (tests/engines/probe_engine.cpp) as the
// processing engine: running voxrun, and reading the probe's report.
#pragma once

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "support/process.h"
#include "support/scratch.h"

namespace vox::test {

#define PROBE_ENGINE_DIR VOX_TEST_ENGINE_DIR "/"

// The lines that start with prefix.
inline std::vector<std::string> WithPrefix(const std::vector<std::string>& lines,
                                           const std::string& prefix) {
  std::vector<std::string> out;
  std::copy_if(lines.begin(), lines.end(), std::back_inserter(out),
               [&](const std::string& l) { return l.rfind(prefix, 0) == 0; });
  return out;
}

// The value of "key=" in a report line ("" when absent); values end at a blank.
inline std::string Field(const std::string& line, const std::string& key) {
  const std::string marker = " " + key + "=";
  size_t at = line.find(marker);
  if (at == std::string::npos) return "";
  at += marker.size();
  return line.substr(at, line.find(' ', at) - at);
}

inline std::vector<uint8_t> FromHex(const std::string& hex) {
  std::vector<uint8_t> bytes;
  for (size_t i = 0; i + 1 < hex.size(); i += 2)
    bytes.push_back(static_cast<uint8_t>(std::stoul(hex.substr(i, 2), nullptr, 16)));
  return bytes;
}

// Runs a job written to job.txt of the scratch folder, with the schedule engine as raw filter
// and the probe as processing engine reporting to probe.txt; lines follow the job's own.
struct ProbeRun {
  int exit_code = -1;
  std::vector<std::string> report;
};
inline ProbeRun RunProbeJob(const ScratchDir& scratch, const std::string& name,
                            const std::string& lines) {
  const std::string job =
      WriteFile(scratch.File("job.txt"), JobText(name, scratch.File("job.res"),
                                                 "Type=1\nRawfiltPath=" PROBE_ENGINE_DIR
                                                 "test_schedule.eng\nEnginePath=" PROBE_ENGINE_DIR
                                                 "test_probe.eng\nProbeOut=" +
                                                     scratch.File("probe.txt") + "\n" + lines));
  ProbeRun run;
  run.exit_code = RunVoxrun(job);
  run.report = Lines(ReadFile(scratch.File("probe.txt")));
  return run;
}

}  // namespace vox::test
