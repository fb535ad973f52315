// The scan of one file item: recognises a raw observation file or a precise orbit file, reads
// it once from start to end, fills the job's stores through the sinks given, records which
// epochs exist (for the file item and the occupations that use it) and, after a complete raw
// file, decides its epoch interval, GPS L2C rules and force-copy rules.
//
// Runs on the job thread during data preparation, before any engine exists; the sinks and
// items are not locked.
#pragma once

#include <bitset>
#include <cstdint>

#include "base/sat.h"
#include "job/items.h"
#include "raw/meteo_track.h"
#include "raw/raw_records.h"
#include "raw/scan_log.h"

namespace vox {

class EphemerisStore;
class PreciseStore;

enum ScanStatus : int {
  kScanCannotOpen = 1,
  kScanEndedEarly = 2,
  kScanNotUsable = 3,
  kScanComplete = 4,
};

// What tools want to know beyond the item fields (all optional).
struct ScanDetails {
  enum class Kind { kNone, kRaw, kPrecise } kind = Kind::kNone;
  ByteOrder order = ByteOrder::kLittle;
  std::bitset<kSatIndexCount> satellites_seen;  // valid satellites of epoch records
  uint32_t records_by_tag[256] = {};
  uint32_t ephemerides_stored = 0;
  uint32_t ephemerides_dropped = 0;
  uint32_t positions_stored = 0;
  uint32_t positions_dropped = 0;
  uint32_t stop_offset = 0;  // file offset where the walk ended
};

struct ScanSinks {
  EphemerisStore* ephemerides = nullptr;  // null: broadcast ephemerides are not kept
  PreciseStore* precise = nullptr;        // null: position samples are not kept
  MeteoTrackList* meteo = nullptr;        // null: meteorological records are not kept
  ScanLogSink log;                        // default: the engine log
  ScanDetails* details = nullptr;
};

// Scans file.path; returns a ScanStatus.
int ScanFile(TChainItem& file, const ScanSinks& sinks);

}  // namespace vox
