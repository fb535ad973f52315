// The engine's side of a job's threads: the thread writers behind vox_InitNewThread and
// vox_DeleteThread, and the two callbacks every vox_ThreadContext carries.
//
// Threads: the callbacks run on whichever thread the engine calls them from, concurrently;
// InitNewThread and DeleteThread on the thread that registers or releases an engine thread.
// The solution lock guards the worker progress sum, the registry of thread writers and the
// merge of a thread's file into the task's result file; a thread writer itself is written
// only by its own thread, so it needs no lock.
//
// Progress: the task's writer reports (done units * 100 + percent) / total units; thread
// writers add up into the worker progress sum, each counting its last percentage, and a
// released thread counts as 100. Either way the job progress only rises and stays below 100
// (99 is the end of a job).
#pragma once

#include <cstdint>

#include "vox/vox_sdk_core.h"

namespace vox {

struct TTask;

// Turns the context into one for a new engine thread: a thread writer on a new "VOX"
// temporary file, bit 6 in the flags, our callbacks; sets the calling thread's
// floating-point mode. Returns 1 (0 without a task or context).
uint32_t InitNewThread(TTask& task, vox_ThreadContext* context);
// Releases the context's thread writer: closes it, merges its records into the task's
// result file as one block, deletes its file and counts the thread as finished. Returns 0.
uint32_t DeleteThread(TTask& task, vox_ThreadContext* context);

uint32_t VOX_CALL ProgressProc(void* writer, int32_t percent);
uint32_t VOX_CALL MessageProc(void* writer, uint32_t kind, const char* text);

// The value both callbacks return: the engine flags with bit 31 set.
constexpr uint32_t CallbackResult(uint32_t engine_flags) {
  return engine_flags | 0x80000000u;
}

// The job progress for a report through the task's writer; -1 when there is none to report
// (no work units).
int64_t TaskWriterProgress(uint32_t done_units, uint32_t total_units, int32_t percent);

// Fills a context for an engine call on the job thread with the task's writer.
vox_ThreadContext MakeThreadContext(TTask& task, uint32_t flags, uint32_t id);

}  // namespace vox
