// The job pipeline: what the job thread runs to turn one run request into a finished job and
// an exit code (run_state.h lists the codes). Job thread only.
#pragma once

#include <cstdint>
#include <string>

namespace vox {

struct TRunContext;

// Reads the job file of a path run, prepares its text (carriage returns removed, variables
// substituted) and runs the pipeline: exit code 5 when the file cannot be read or a "$(" is
// left open. Drops one reference to the context.
uint32_t ReadJobFileAndRun(TRunContext* context);

// Runs the prepared job text of the context. Drops one reference to the context.
uint32_t RunPipeline(TRunContext* context);

// The system's text for the calling thread's last error, one line, at most 255 bytes.
std::string LastErrorText();

}  // namespace vox
