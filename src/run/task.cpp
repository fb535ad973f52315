#include "run/task.h"

#include "base/engine_log.h"
#include "platform/platform.h"

namespace vox {

TTask::TTask() = default;

TTask::~TTask() {
  done_units = 0;
  total_units = 0;
  // Writers the engine never released: their records can no longer be merged (the result
  // file is closed by now), but their temporary files must not be left behind.
  for (const TResultFile* writer : thread_writers) {
    Trace("thread writer not released: %p\n", static_cast<const void*>(writer));
    auto* owned = const_cast<TResultFile*>(writer);
    owned->Close();
    if (!owned->path().empty()) platform::RemoveFile(owned->path());
    delete owned;
  }
  thread_writers.clear();
  meteo_tracks.Clear();
  solution_lock.Close();
  result_file.Close();
  current_engine = nullptr;
  engines.reset();
  job.static_params.reset();
  job.engine_params.reset();
  precise.Clear();
  ephemerides.Clear();
  job.receivers.Clear();
  job.antennas.Clear();
  job.fans.Clear();
  job.vectors.Clear();
  job.occupations.Clear();
  job.points.Clear();
  job.files.Clear();
}

}  // namespace vox
