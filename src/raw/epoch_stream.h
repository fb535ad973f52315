// The epoch stream: an occupation's observations read again from its raw file, one epoch
// record and then one satellite record at a time, with code values converted to seconds on
// one time scale and the file's L2C and force-copy rules applied.
//
// The stream starts at the first epoch the scan found inside the occupation's span (its
// remembered file position and the time reference that governs it), so the scan results of
// the file item and the occupation must be in place before a stream is opened.
//
// The stream also owns the occupation's NMEA output; the exported adapter writes the
// sentences into it through the NMEA writer.
//
// Threads: a stream belongs to one engine thread between open and close and takes no locks;
// the items it reads are read-only while engines run (the navigation coordinates are read
// without the solution lock, as a plain copy). Leap seconds go through the leap table, which
// locks for itself.
#pragma once

#include <cstdint>
#include <memory>

#include "base/buf_file.h"
#include "base/sat.h"
#include "base/time_ms.h"
#include "job/items.h"
#include "raw/raw_records.h"
#include "raw/record_reader.h"
#include "vox/vox_sdk_epoch.h"

namespace vox {

// The raw-file time reference that dates the epochs after it.
struct EpochTimeReference {
  RawTime time;
  bool gps = false;  // time system GPS; else UTC-based
  uint32_t leap_seconds = 0;
};

class EpochStream {
 public:
  // Null when the occupation has no file or no epochs, when from lies after to (after
  // clamping to the span), or when the file or its time reference cannot be read.
  static std::unique_ptr<EpochStream> Open(TOccupItem& occupation, uint32_t interval_ms,
                                           const TimeMs* from, const TimeMs* to);
  ~EpochStream();
  EpochStream(const EpochStream&) = delete;
  EpochStream& operator=(const EpochStream&) = delete;

  // The first epoch at or after *wanted (the start when null), ignoring the interval.
  bool Find(const TimeMs* wanted, vox_EpochData& out);
  // The next epoch on the interval grid; only after an epoch was delivered.
  bool GetNext(vox_EpochData& out);
  // The next valid satellite of the delivered epoch.
  bool GetSatellite(vox_EpochSatData& out);

  // The NMEA output for navigation solutions: opened (created) at the occupation's NMEA path
  // with open_mode on the first call, then kept. Null when the occupation has no path or the
  // open failed, which stays so for the life of the stream.
  TBufFile* NavOutput(uint32_t open_mode);
  uint32_t& nav_sentence_counter() { return nav_counter_; }

  const TimeMs& start() const { return start_; }
  const TimeMs& end() const { return end_; }
  uint32_t interval() const { return interval_; }
  const EpochTimeReference& time_reference() const { return time_ref_; }

 private:
  EpochStream(TOccupItem& occupation, const TimeMs& start, const TimeMs& end, uint32_t interval_ms);

  bool Position();
  void TakeTimeReference(const TimeRefRecord& r);
  // The tag of the record read next (3 is taken as the time reference first); 0 at the end
  // of the data or when the file cannot be read.
  uint8_t ReadRecord();
  // Decodes the current epoch record's header; false when it is damaged.
  bool DecodeEpoch(TimeMs& time);
  void Deliver(const TimeMs& time, vox_EpochData& out);
  bool OnGrid(const TimeMs& time);
  // One satellite block at the cursor; false when the blocks ran out.
  bool ReadSatellite(vox_EpochSatData& out, bool& valid);
  void ApplyL2cRules(vox_EpochSatData& out) const;
  void ApplyForceCopy(vox_EpochSatData& out, SatSystem system) const;
  double CodeSeconds(double pseudorange, SatSystem system) const;

  enum class State { kReady, kDelivered };
  enum class NavState { kNotOpened, kOpened, kFailed };

  TOccupItem& occupation_;
  TChainItem& file_;
  TimeMs start_;
  TimeMs end_;
  State state_ = State::kReady;
  uint32_t interval_;
  uint32_t grid_base_ = 0;   // seconds
  int64_t next_wanted_ = 0;  // ms since the grid base

  TBufFile input_;
  RecordReader reader_;
  EpochTimeReference time_ref_;
  EpochTimeReference opening_time_ref_;  // the one governing the first epoch

  bool tag51_ = false;
  ByteSpan blocks_;  // the satellite blocks not yet read
  uint32_t blocks_left_ = 0;
  uint8_t sat_count_ = 0;

  TBufFile nav_output_;
  uint32_t nav_counter_ = 0;
  NavState nav_state_ = NavState::kNotOpened;
};

}  // namespace vox
