// The decisions the scan takes at the end of a complete file: the epoch interval, whether the
// GPS L2C phase is usable and with which offset, the signal report and the force-copy rules.
#pragma once

#include <cstdint>
#include <vector>

#include "base/time_ms.h"
#include "job/items.h"
#include "raw/scan_log.h"

namespace vox {

// The window check of a 64-bit float (see InWindow in signal_rules.h) on its bit pattern:
// zero of either sign passes, else the biased exponent must lie from 1023 + lo up to but not
// including 1023 + hi (this also rejects subnormals, infinities and NaN). Same answer as
// InWindow<kLo, kHi> for every pattern, without float compares, so the scan's walk can fold
// the result into the flags without branches.
template <int kLo, int kHi>
constexpr bool InWindowBits(uint64_t bits) {
  static_assert(kLo > -1023 && kHi < 1024 && kLo < kHi);
  const uint64_t exponent = (bits >> 52) & 0x7FF;
  return (bits << 1) == 0 ||
         exponent - static_cast<uint64_t>(1023 + kLo) < static_cast<uint64_t>(kHi - kLo);
}
constexpr bool CodeBitsOk(uint64_t bits) {
  return InWindowBits<-50, 28>(bits);
}
constexpr bool PhaseBitsOk(uint64_t bits) {
  return InWindowBits<-50, 44>(bits);
}

// The spacings of consecutive epochs: at most 100 distinct intervals with their counts.
class IntervalTable {
 public:
  static constexpr size_t kCapacity = 100;
  // Counts the spacing from the previous epoch (2 ms to 3599999 ms; anything else, or the
  // first epoch, is not counted).
  void Add(const TimeMs& t);
  // The most frequent interval; the first one seen among equal counts; 0 with none.
  uint32_t Interval() const;
  size_t size() const { return entries_.size(); }

 private:
  struct Entry {
    uint32_t interval;
    uint32_t count;
  };
  std::vector<Entry> entries_;
  uint32_t total_ = 0;
  TimeMs previous_{0, 0};
};

// Twelve bins of the fractional L2C-minus-L2P phase offset, each with a count and a sum.
struct C2Histogram {
  uint32_t count[12] = {};
  double sum[12] = {};
  void Add(double fraction);
  // The bins with the largest and second largest counts.
  void Select(int& best, int& second) const;
  // The best bin stands out: 2 * count(best) > 3 * count(second).
  bool Decisive(int& best) const;
  double Mean(int bin) const { return count[bin] ? sum[bin] / count[bin] : 0.0; }
};

// The fractional part of L2C - L2P + 1/24 of one satellite's epoch, into the file's and the
// satellite's histograms (satellites 1 to 32).
struct C2Collector {
  C2Histogram file;
  C2Histogram satellite[32];
  uint32_t working_l2c_mask = 0;  // bit n - 1: GPS n had an L2C phase
  void Add(unsigned gps_number, double l2c_phase, double l2p_phase);
};

// Sets the item's C2 usable and agreeing masks and offset, logging the decision.
void DecideC2(const C2Collector& c2, TChainItem& file, const ScanLogSink& log);

// Logs each system's signal mask and applies the force-copy rules (never to BDS).
void ReportSignalsAndForceCopy(TChainItem& file, const ScanLogSink& log);

}  // namespace vox
