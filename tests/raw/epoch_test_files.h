// Raw files for the epoch stream tests: written with the raw writer, scanned by the library's
// own scan into a file item and one occupation, exactly as data preparation would.
#pragma once

#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "job/items.h"
#include "raw/epoch_stream.h"
#include "raw/scan.h"
#include "raw_test_files.h"
#include "raw_writer.h"

namespace vox::test {

using voxtools::RawOrder;
using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;

// A day in March 2016 (17 leap seconds in the built-in table).
constexpr uint32_t kDay = 13204;
constexpr double kC = 299792458.0;

struct SignalValue {
  int slot;
  std::optional<double> code;
  std::optional<double> phase;
};

// The signal code (tag 51) or kind (tag 8) that fills a slot.
inline uint8_t SignalFor(uint8_t tag, char system, int slot) {
  if (tag == 8) {
    static const uint8_t kinds[5] = {2, 0, 3, 1, 0};
    return kinds[slot];
  }
  static const uint8_t kGps[5] = {16, 20, 32, 36, 82};
  static const uint8_t kGlonass[5] = {16, 17, 33, 34, 0};
  static const uint8_t kBds[5] = {33, 34, 113, 114, 97};
  static const uint8_t kGalileo[5] = {18, 81, 113, 65, 97};
  static const uint8_t kSbas[5] = {16, 0, 0, 0, 82};
  switch (system) {
    case 'R':
      return kGlonass[slot];
    case 'C':
      return kBds[slot];
    case 'E':
      return kGalileo[slot];
    case 'S':
      return kSbas[slot];
    default:
      return kGps[slot];
  }
}

inline RawSatellite Sat(uint8_t tag, char system, unsigned number,
                        const std::vector<SignalValue>& values, uint8_t b2 = 0, uint8_t b3 = 0) {
  RawSatellite s;
  s.code = tag == 8 ? voxtools::SatCode8(system, number) : voxtools::SatCode51(system, number);
  s.b2 = b2;
  s.b3 = b3;
  for (const SignalValue& v : values) {
    const uint8_t sig = SignalFor(tag, system, v.slot);
    s.signals.push_back(tag == 8 ? RawSignal::Tag8(sig, v.code, v.phase)
                                 : RawSignal::Tag51(sig, v.code, v.phase));
  }
  return s;
}

struct EpochSpec {
  uint32_t ms_of_day;
  std::vector<RawSatellite> sats;
};

// Header, one time reference at the start of kDay, the epochs, the end record.
inline RawWriter BuildFile(RawOrder order, const std::vector<EpochSpec>& epochs,
                           const char* system = "GPS", std::optional<uint32_t> leap = {},
                           uint8_t tag = 51) {
  RawWriter w(order);
  w.Header().TimeRef(system, {0, kDay}, {}, leap);
  for (const EpochSpec& e : epochs)
    w.Epoch(tag, e.ms_of_day, e.sats);
  w.EndOfData();
  return w;
}

// One GPS satellite with an L1C code, at every whole second in [from, to) of kDay.
inline std::vector<EpochSpec> Seconds(uint8_t tag, uint32_t from, uint32_t to) {
  std::vector<EpochSpec> epochs;
  for (uint32_t s = from; s < to; ++s)
    epochs.push_back({s * 1000, {Sat(tag, 'G', 1, {{0, 2.0e7 + s, {}}})}});
  return epochs;
}

inline TimeMs At(uint32_t second_of_day, uint16_t ms = 0) {
  return TimeMs{kDay * 86400 + second_of_day, ms};
}

// A scanned raw file with one occupation over it.
class ScannedFile {
 public:
  explicit ScannedFile(const RawWriter& w, bool smooth = false, TimeMs begin = {0, 0},
                       TimeMs end = kOpenEnd)
      : raw_(w), file(1, raw_.path(), false, smooth), occupation(1) {
    occupation.begin = begin;
    occupation.end = end;
    occupation.SetFile(&file);
    ScanSinks sinks;
    sinks.log.write = [](void*, const char*) {};
    status = ScanFile(file, sinks);
  }

  std::unique_ptr<EpochStream> Open(uint32_t interval = 0, const TimeMs* from = nullptr,
                                    const TimeMs* to = nullptr) {
    return EpochStream::Open(occupation, interval, from, to);
  }
  // Clears what the scan decided about L2C and force copies, so a test sets only its own.
  void ClearRules() {
    std::memset(file.force_copy, 0, sizeof file.force_copy);
    file.c2_usable_mask = file.c2_agreeing_mask = 0;
    file.c2_l2_offset = 0;
  }

 private:
  TempRawFile raw_;

 public:
  TChainItem file;
  TOccupItem occupation;
  int status = 0;
};

// A time as milliseconds, for comparing lists of times.
inline uint64_t Ms(const TimeMs& t) {
  return uint64_t{t.seconds} * 1000 + t.ms;
}

// Every epoch time a stream delivers from Find(null) on, in ms.
inline std::vector<uint64_t> Delivered(EpochStream& s) {
  std::vector<uint64_t> times;
  vox_EpochData e{};
  for (bool ok = s.Find(nullptr, e); ok; ok = s.GetNext(e))
    times.push_back(Ms({e.seconds, e.ms}));
  return times;
}

// The first satellite record of the first epoch.
inline std::optional<vox_EpochSatData> FirstSatellite(EpochStream& s, double fill = -1.0) {
  vox_EpochData e{};
  if (!s.Find(nullptr, e)) return std::nullopt;
  vox_EpochSatData d{};
  for (int i = 0; i < 10; ++i)
    d.values[i] = fill;
  if (!s.GetSatellite(d)) return std::nullopt;
  return d;
}

}  // namespace vox::test
