// Until the raw room's scanning arrives there is nothing to scan: preparation only sets the
// work units.
#include "run/data_preparation.h"

#include "run/task.h"

namespace vox {

bool PrepareData(TTask& task) {
  task.done_units = 0;
  task.total_units = static_cast<uint32_t>(task.job.occupations.Count() + task.job.vectors.Count() +
                                           task.job.fans.Count());
  return true;
}

}  // namespace vox
