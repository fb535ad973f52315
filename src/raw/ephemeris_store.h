// The broadcast ephemeris store: one time-ordered list of TNavEphemItem per satellite index
// (149 lists), filled by the raw file scan and read by the engines' ephemeris streams.
//
// Threads: the store is filled on the job thread before any engine runs and only read while
// engines run, so it takes no lock. A stream cursor belongs to the engine thread that opened
// it, between its open and close calls.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "base/list.h"
#include "base/sat.h"
#include "raw/raw_records.h"
#include "vox/vox_sdk_ephemeris.h"

namespace vox {

// One stored ephemeris.
struct TNavEphemItem : Link<TNavEphemItem> {
  explicit TNavEphemItem(const vox_EphemerisData& d) : data(d) {}
  bool IsSame(const TNavEphemItem* other) const { return other == this; }
  vox_EphemerisData data;
};

class EphemerisStore {
 public:
  // Insert a decoded record (its value check already passed). Returns false when the record
  // is dropped: satellite out of range, an ephemeris of the same whole second already stored
  // (the first one stored wins), or an SBAS record that repeats a stored one without rates.
  bool InsertGps(const GpsEphemerisRecord& r, bool high_numbers /* tag 45 */);
  bool Insert(const BdsEphemerisRecord& r);
  bool Insert(const GlonassEphemerisRecord& r);
  bool Insert(const SbasEphemerisRecord& r);
  bool Insert(const GalileoEphemerisRecord& r);

  // The list of a satellite index (0 to 148), or null.
  const TNavEphemItem* head(unsigned index) const {
    return index < lists_.size() ? lists_[index].head() : nullptr;
  }
  size_t Count(unsigned index) const { return index < lists_.size() ? lists_[index].Count() : 0; }
  size_t Total() const;
  void Clear();

 private:
  bool Link(const vox_EphemerisData& d);
  std::array<ItemList<TNavEphemItem>, kSatIndexCount> lists_;
};

// ---- records

// The full records built from the raw records (times, satellite and unit conversions).
vox_EphemerisData MakeGpsEphemeris(const GpsEphemerisRecord& r, bool high_numbers);
vox_EphemerisData MakeBdsEphemeris(const BdsEphemerisRecord& r);
vox_EphemerisData MakeGlonassEphemeris(const GlonassEphemerisRecord& r);
vox_EphemerisData MakeSbasEphemeris(const SbasEphemerisRecord& r);
vox_EphemerisData MakeGalileoEphemeris(const GalileoEphemerisRecord& r);

// True for an SBAS ephemeris whose rate fields (S5 to S13) are all zero: valid at any time.
bool IsStaticSbas(const vox_EphemerisData& d);
// The validity window of an ephemeris in whole seconds, both ends inclusive.
struct EphemerisWindow {
  int64_t start;
  int64_t end;
};
EphemerisWindow ValidityWindow(const vox_EphemerisData& d);
bool ValidAt(const vox_EphemerisData& d, uint32_t seconds);

// The short record of a GPS or GLONASS ephemeris; false (out untouched) for other systems.
bool ToShortRecord(const vox_EphemerisData& d, vox_ShortEphemerisData* out);

// ---- streams (the exported ephemeris functions forward to these)

struct EphemerisCursor {
  SatId sat = 0;
  const TNavEphemItem* current = nullptr;
  bool pending = false;  // current has not been delivered yet
};

EphemerisCursor* OpenEphemerisStream(const EphemerisStore& store, SatId sat, const uint32_t* from,
                                     const uint32_t* to);
// Short satellite number: 1 to 127 name satellite index b - 1; 128 + n names GLONASS slot n.
EphemerisCursor* OpenEphemerisStreamShort(const EphemerisStore& store, uint8_t number,
                                          const uint32_t* from, const uint32_t* to);
int FindEphemeris(const EphemerisStore& store, EphemerisCursor* cursor, const uint32_t* time,
                  vox_EphemerisData* out);
int FindEphemerisShort(const EphemerisStore& store, EphemerisCursor* cursor, const uint32_t* time,
                       vox_ShortEphemerisData* out);
int GetNextEphemeris(EphemerisCursor* cursor, vox_EphemerisData* out);
int GetNextEphemerisShort(EphemerisCursor* cursor, vox_ShortEphemerisData* out);
int CloseEphemerisStream(EphemerisCursor* cursor);

}  // namespace vox
