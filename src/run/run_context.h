// TRunContext: the record of one run request, shared by the run call and the job thread.
//
// The run call creates it and takes the first reference for the job thread; the file-reading
// wrapper takes a second one for the pipeline; each holder drops its own when it returns, and
// the last drop frees the record. The variables are filled before the job thread starts and
// only read afterwards; the other fields are written by the job thread alone.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>

#include "job/job_text.h"

namespace vox {

struct TRunContext {
  std::atomic<uint32_t> references{0};
  std::string job_path;  // empty for a run from a job text
  std::string job_text;
  std::string job_name;  // the task's job name once parsed
  uint32_t cpu_count = 0;
  VarList variables;
  uint64_t window = 0;  // the control handle of this run

  void AddRef() { references.fetch_add(1, std::memory_order_relaxed); }
  // Drops one reference and frees the record with the last one.
  void Release() {
    if (references.fetch_sub(1, std::memory_order_acq_rel) == 1) delete this;
  }
};

}  // namespace vox
