// A small job built directly from items, for the tests of the engine-facing records.
#pragma once

#include <string>

#include "job/job_model.h"

namespace vox::testing {

// Three points, two antennas, one receiver, two raw files and three occupations:
// occupations 1 and 2 on point 1 (files 1 and 2), occupation 3 on point 2 (file 1).
inline void BuildStreamJob(JobModel& job) {
  for (uint32_t n = 1; n <= 3; ++n) {
    auto* p = job.points.Append(new TPointItem(n));
    p->name = "P" + std::to_string(n);
  }
  auto* a1 = job.antennas.Append(new TAntennItem(1));
  a1->l2_up = 0.1;
  a1->l2_east = 0.2;
  a1->l2_north = 0.3;
  a1->pattern_mask = 0x3;
  for (int i = 0; i < kPatternValues; ++i) {
    a1->patterns[0][i] = 1.0f + i;
    a1->patterns[1][i] = 100.0f + i;
  }
  auto* a2 = job.antennas.Append(new TAntennItem(2));
  a2->pattern_mask = 0x10;  // only slot 4
  a2->patterns[4][0] = 44.0f;
  auto* r = job.receivers.Append(new TReceiverItem(1));
  r->name = "Rx";
  r->vendor = "Acme";
  r->serial = "SN1";
  for (uint32_t n = 1; n <= 2; ++n) {
    auto* f = job.files.Append(
        new TChainItem(n, "/data/site" + std::to_string(n) + ".raw", false, false));
    f->epoch_interval_ms = 1000;
    f->max_satellites = 12;
    f->first_epoch = {1000, 0};
    f->last_epoch = {5000, 0};
  }
  for (uint32_t n = 1; n <= 3; ++n) {
    auto* o = job.occupations.Append(new TOccupItem(n));
    o->name = "O" + std::to_string(n);
    o->first_epoch = {1000 + n, 0};
    o->last_epoch = {2000 + n, 500};
    o->epoch_count = 10 * n;
    o->SetFile(job.FindFile(n == 2 ? 2 : 1));
    o->SetPoint(job.FindPoint(n == 3 ? 2 : 1));
  }
}

}  // namespace vox::testing
