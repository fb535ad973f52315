// The raw filter run over the job's occupations: one _eng_ProcessOccupation call per
// occupation, each followed by the occupation's record (result kind 34).
//
// Threads: both functions run on the job thread. The multi-threaded form dispatches each
// occupation to a worker thread of its own (at most 32 at once); each worker writes through
// a thread writer registered with InitNewThread and released with DeleteThread on the job
// thread, so a worker's records reach the result file as one block when it is collected.
// Occupation records are written under the task's solution lock. The task's current engine
// is the raw filter for the whole run, so a break reaches it from any callback.
//
// A call that throws or faults loses its occupation's record and nothing else.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

#include "platform/platform.h"

namespace vox {

struct TTask;
struct TOccupItem;
class TEngine;
class TResultFile;

// At most this many workers run at once, whatever the job's thread count.
constexpr uint32_t kMaxRawFilterWorkers = 32;
// Stack of each worker thread. Engine code running there must fit in it.
constexpr size_t kRawFilterWorkerStack = 0x10000;

// Occupations one by one on the job thread, stopping at a break (checked before each).
// Always true.
bool RunRawFilterSingle(TTask& task, TEngine& raw_filter);
// How a worker thread is started; platform::StartThread but in tests.
using StartWorkerFn = std::unique_ptr<platform::Thread> (*)(platform::ThreadProc proc,
                                                            void* argument, size_t stack_bytes);

// Occupations on min(thread count, 32) worker threads; dispatch stops at a break, and every
// worker started is collected before it returns. An occupation whose worker cannot be started
// is not processed (an engine-log line says so). Always true.
bool RunRawFilterMulti(TTask& task, TEngine& raw_filter,
                       StartWorkerFn start_worker = platform::StartThread);

// Writes occupation's record to writer under the task's solution lock; true when written.
bool WriteOccupationRecordLocked(TTask& task, TResultFile& writer, const TOccupItem& occupation);

}  // namespace vox
