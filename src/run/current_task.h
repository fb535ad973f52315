// The current task: the TTask of the running job, or null when no job runs.
//
// The job thread sets it when the pipeline creates the task and clears it in the clean-up,
// after the engines have returned. Exported functions called by an engine read it without a
// lock: engine calls happen only while it is set. The full task is declared in run/task.h.
#pragma once

namespace vox {

struct TTask;

// The task of the running job; null when no job runs.
TTask* CurrentTask();

}  // namespace vox
