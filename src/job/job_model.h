// JobModel: what the parser makes of one job file, before anything is scanned. The run
// room's task owns one (or is one) for the whole job; raw, results and the exports read the
// items through it.
//
// Built by ParseJob on the job thread; read-only for engines afterwards except the item
// fields that items.h names.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "base/list.h"
#include "base/sat.h"
#include "base/time_ms.h"
#include "job/items.h"

namespace vox {

// The span of time the job covers; occupations are clamped to it.
struct JobWindow {
  TimeMs start{0, 0};
  TimeMs end = kOpenEnd;
};

struct JobModel {
  std::string job_name;
  // 0: raw filter only; 1: static; 2 and 3: the two kinematic kinds.
  uint32_t job_kind = 0;
  int32_t max_extra_bases = 2;
  std::string engine_path;         // completed; empty in a raw-filter-only job
  std::string static_engine_path;  // completed; only for multi-site kinematic jobs
  std::string raw_filter_path;     // completed
  bool raw_filter_only = false;
  bool multi_site = false;
  bool enable_reoccupations = false;
  int32_t result_version = 100;
  std::string result_path;  // completed (and made unique when the job asks for it)
  uint32_t thread_count = 1;
  // Control flag word handed to the engine: 4 and 2 from bits 0 and 1 of the job's key.
  uint32_t engine_flags = 4;
  uint32_t omit_count = 0;
  SatId omit_list[kSatIndexCount] = {};
  JobWindow window;

  // Items refer to each other by plain pointers that are never followed on destruction,
  // so the lists may be destroyed in any order.
  ItemList<TVectorItem> vectors;
  ItemList<TFanItem> fans;
  ItemList<TOccupItem> occupations;
  ItemList<TChainItem> files;
  ItemList<TPointItem> points;
  ItemList<TAntennItem> antennas;
  ItemList<TReceiverItem> receivers;

  // Job-level parameter blocks of the processing engine and of the static engine; null
  // when the engine wants none or none was loaded.
  std::unique_ptr<ParamBlock> engine_params;
  std::unique_ptr<ParamBlock> static_params;

  // Lookups by number: the plain number or the full identifier (the tag is or-ed in).
  TChainItem* FindFile(uint32_t number) const { return files.FindById(number | kFileTag); }
  TPointItem* FindPoint(uint32_t number) const { return points.FindById(number | kPointTag); }
  TOccupItem* FindOccup(uint32_t number) const { return occupations.FindById(number | kOccupTag); }
  TAntennItem* FindAntenna(uint32_t number) const {
    return antennas.FindById(number | kAntennaTag);
  }
  TReceiverItem* FindReceiver(uint32_t number) const {
    return receivers.FindById(number | kReceiverTag);
  }
  TVectorItem* FindVector(uint32_t number) const { return vectors.FindById(number | kVectorTag); }
  TFanItem* FindFan(uint32_t number) const { return fans.FindById(number | kFanTag); }
};

}  // namespace vox
