// The run calls behind the exported entry points: the common prologue (fresh engine log,
// busy refusal, control window, reset, run context, job thread with a 1 MiB stack) and the
// thread epilogue (exit code stored, host told with code 7).
//
// Busy: a run counts as busy from the moment a call passes the check until its job thread
// has stored the exit code, so two calls racing from two host threads, or a call made
// before the previous job thread has finished, can never start a second job. A refused call
// writes "Program is busy\n" to an engine log file of its own and leaves the running job's
// log alone.
//
// Threads: called on host threads; the job thread they start runs the pipeline.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace vox {

// Starts the job file at path (a UTF-8 path) with run variables "NAME=VALUE". Returns the
// control handle, 0 when refused; with wait set, waits for the job thread to end and
// returns 1 (0 when refused or when the thread could not be started).
uint64_t RunJobFile(const std::string& path, const std::vector<std::string>& variables, bool wait);
// Starts a job from its text (carriage returns are removed; no variables, relative paths
// against "./"). Returns the control handle, 0 when refused.
uint64_t RunJobText(const char* text);

// Writes text to an engine log file of its own (a new "OUT" file when the "engine" folder
// exists, else nowhere), without touching the engine log that is open.
void WriteOwnEngineLog(const char* text);

}  // namespace vox
