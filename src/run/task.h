// TTask: everything of one job. The job thread creates it at the start of the pipeline and
// destroys it in the clean-up; while it exists it is the current task (run/current_task.h).
//
// Ownership: the task owns the job model (settings, item lists, parameter blocks), the
// engines, the satellite stores, the result file, the thread writers not yet released and
// the solution lock.
//
// Threads and locks:
// - The job thread builds the task (parser, data preparation) before any engine runs; the
//   model and the stores are read-only for engines afterwards, except the item fields that
//   job/items.h names.
// - The solution lock serialises the worker progress sum, the registry of thread writers and
//   their progress bookkeeping, and the writing of occupation and solution records.
// - done_units, total_units and result_file are used by the job thread (and by engine code
//   writing through the task's writer) without a lock.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <unordered_set>

#include "base/tlock.h"
#include "engine/job_engines.h"
#include "job/job_model.h"
#include "raw/ephemeris_store.h"
#include "raw/meteo_track.h"
#include "raw/precise_store.h"
#include "results/result_file.h"

namespace vox {

struct TTask {
  TTask();
  // Tears down in a fixed order: unreleased thread writers, the meteorological tracks, the lock,
  // the result file, the engines (static first) and their parameter blocks, the stores, then the
  // item lists.
  ~TTask();
  TTask(const TTask&) = delete;
  TTask& operator=(const TTask&) = delete;

  JobModel job;
  // The engines the parser loaded through this binder.
  std::unique_ptr<JobEngines> engines = std::make_unique<JobEngines>();
  // The engine being run; a break calls its _eng_BreakProcess from whichever thread calls
  // back. Set by the job thread; null outside engine calls.
  std::atomic<TEngine*> current_engine{nullptr};
  // Satellite stores and meteorological tracks, filled by the raw file scans of data
  // preparation and only read afterwards.
  EphemerisStore ephemerides;
  PreciseStore precise;
  MeteoTrackList meteo_tracks;

  uint32_t done_units = 0;
  uint32_t total_units = 0;
  TResultFile result_file;
  TLock solution_lock{"solution"};
  uint32_t worker_progress_sum = 0;  // under solution_lock

  // Thread writers handed out by vox_InitNewThread and not yet released (under
  // solution_lock). Lets the callbacks and vox_DeleteThread tell a writer of ours from a
  // stray pointer.
  std::unordered_set<const TResultFile*> thread_writers;

  uint32_t thread_count() const { return job.thread_count; }
  uint32_t engine_flags() const { return job.engine_flags; }
};

}  // namespace vox
