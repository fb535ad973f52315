// Scanning a RawWriter's bytes as a file item, with the stores and the log lines collected.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "job/items.h"
#include "raw/ephemeris_store.h"
#include "raw/meteo_track.h"
#include "raw/precise_store.h"
#include "raw/scan.h"
#include "raw_test_files.h"

namespace vox::test {

struct ScanRun {
  std::unique_ptr<TChainItem> file;
  std::vector<std::unique_ptr<TOccupItem>> occupations;
  EphemerisStore ephemerides;
  PreciseStore precise;
  MeteoTrackList meteo;
  ScanDetails details;
  std::string log;
  int status = 0;

  static void Collect(void* context, const char* text) {
    *static_cast<std::string*>(context) += text;
  }

  // Occupation windows to link to the file before the scan: (begin, end) pairs.
  void Run(const std::string& path, const std::vector<std::pair<TimeMs, TimeMs>>& windows = {}) {
    file = std::make_unique<TChainItem>(1, path, false, false);
    for (size_t i = 0; i < windows.size(); ++i) {
      auto occ = std::make_unique<TOccupItem>(static_cast<uint32_t>(i + 1));
      occ->begin = windows[i].first;
      occ->end = windows[i].second;
      occ->SetFile(file.get());
      occupations.push_back(std::move(occ));
    }
    ScanSinks sinks;
    sinks.ephemerides = &ephemerides;
    sinks.precise = &precise;
    sinks.meteo = &meteo;
    sinks.log = {&ScanRun::Collect, &log};
    sinks.details = &details;
    status = ScanFile(*file, sinks);
  }
  void Run(const voxtools::RawWriter& w,
           const std::vector<std::pair<TimeMs, TimeMs>>& windows = {}) {
    TempRawFile f(w);
    Run(f.path(), windows);
  }
};

}  // namespace vox::test
