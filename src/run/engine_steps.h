// The engine steps of the pipeline: the raw filter run over the occupations and the group
// call of the processing engine, and the break check the callbacks run.
//
// Job thread only, except BreakCheck, which runs on any thread that calls back into the
// library while an engine runs.
#pragma once

namespace vox {

struct TTask;

// Runs the raw filter over every occupation; true when the raw filter library was loaded and
// run. Writes "RawFilter", "RawFilter - OK" and an empty closing message to the result file
// either way.
bool RunRawFilterStep(TTask& task);
// Hands the job to the processing engine (after the static engine for multi-site kinematic
// jobs); true when the engine's group call succeeded.
bool RunEngineStep(TTask& task);
// With a break requested, asks the engine being run to stop (again at every call).
void BreakCheck(TTask& task);

}  // namespace vox
