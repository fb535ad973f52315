#include "run/data_preparation.h"

#include "raw/preparation_listing.h"
#include "raw/scan.h"
#include "raw/vector_fusing.h"
#include "run/task.h"

namespace vox {

bool PrepareData(TTask& task) {
  JobModel& job = task.job;
  if (job.multi_site) FuseVectors(job.vectors);

  ScanSinks sinks;
  sinks.ephemerides = &task.ephemerides;
  sinks.precise = &task.precise;
  sinks.meteo = &task.meteo_tracks;
  // Every file is scanned even after one has failed, so that the listing and the engine log
  // show the whole job.
  bool usable = true;
  for (TChainItem* file = job.files.head(); file != nullptr; file = file->next) {
    const int status = ScanFile(*file, sinks);
    if (status == kScanCannotOpen || status == kScanNotUsable) usable = false;
  }
  WritePreparationListing(task.ephemerides, task.precise, job.occupations, job.vectors);

  task.done_units = 0;
  task.total_units =
      static_cast<uint32_t>(job.occupations.Count() + job.vectors.Count() + job.fans.Count());
  return usable;
}

}  // namespace vox
