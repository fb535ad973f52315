#include "raw/scan_rules.h"

#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <string>

#include "base/engine_log.h"
#include "base/sat.h"
#include "raw/raw_records.h"

namespace vox {

void ScanLogf(const ScanLogSink& sink, const char* format, ...) {
  char text[512];
  va_list args;
  va_start(args, format);
  std::vsnprintf(text, sizeof text, format, args);
  va_end(args);
  if (sink.write != nullptr)
    sink.write(sink.context, text);
  else
    Trace("%s", text);
}

// ---- interval table

void IntervalTable::Add(const TimeMs& t) {
  if (previous_.seconds != 0) {
    const int64_t diff = (static_cast<int64_t>(t.seconds) - previous_.seconds) * 1000 +
                         (static_cast<int64_t>(t.ms) - previous_.ms);
    if (diff >= 2 && diff <= 3599999) {
      const auto interval = static_cast<uint32_t>(diff);
      bool found = false;
      for (Entry& e : entries_) {
        if (e.interval == interval) {
          ++e.count;
          found = true;
          break;
        }
      }
      if (!found && entries_.size() < kCapacity) entries_.push_back({interval, 1});
      ++total_;
    }
  }
  previous_ = t;
}

uint32_t IntervalTable::Interval() const {
  const Entry* best = nullptr;
  for (const Entry& e : entries_)
    if (best == nullptr || e.count > best->count) best = &e;
  return best ? best->interval : 0;
}

// ---- C2-L2

void C2Histogram::Add(double fraction) {
  int bin = static_cast<int>(12.0 * fraction);
  if (bin < 0) bin = 0;
  if (bin > 11) bin = 11;  // a fraction a hair below 1 may round up to 12
  sum[bin] += fraction;
  ++count[bin];
}

void C2Histogram::Select(int& best, int& second) const {
  best = count[0] <= count[1] ? 1 : 0;
  second = 1 - best;
  for (int b = 2; b < 12; ++b) {
    if (count[b] > count[best]) {
      second = best;
      best = b;
    } else if (count[b] > count[second]) {
      second = b;
    }
  }
}

bool C2Histogram::Decisive(int& best) const {
  int second = 0;
  Select(best, second);
  return 2ull * count[best] > 3ull * count[second];
}

void C2Collector::Add(unsigned gps_number, double l2c_phase, double l2p_phase) {
  const double d = l2c_phase - l2p_phase + 1.0 / 24.0;
  const double f = d - std::floor(d);
  file.Add(f);
  if (gps_number >= 1 && gps_number <= 32) satellite[gps_number - 1].Add(f);
}

void DecideC2(const C2Collector& c2, TChainItem& file, const ScanLogSink& log) {
  int best = 0;
  if (!c2.file.Decisive(best)) {
    ScanLogf(log, "GPS C2 disabled\n");
    file.c2_usable_mask = 0;
    file.c2_agreeing_mask = 0;
    return;
  }
  file.c2_l2_offset = best / 12.0;
  ScanLogf(log, "GPS C2-L2: %f %f\n", c2.file.Mean(best), file.c2_l2_offset);
  file.c2_usable_mask = c2.working_l2c_mask;
  file.c2_agreeing_mask = 0;
  for (unsigned n = 1; n <= 32; ++n) {
    const C2Histogram& h = c2.satellite[n - 1];
    int sat_best = 0;
    if (!h.Decisive(sat_best)) continue;
    const double offset = sat_best / 12.0;
    ScanLogf(log, "G%02u C2-L2: %f %f\n", n, h.Mean(sat_best), offset);
    if (offset == file.c2_l2_offset) file.c2_agreeing_mask |= 1u << (n - 1);
  }
  file.c2_usable_mask &= file.c2_agreeing_mask;
}

// ---- signal report and force-copy rules

namespace {

// Force-copy groups in the item, in their fixed order.
enum ForceCopyGroup {
  kL1ToCaCode = 0,
  kL1ToCaPhase = 1,
  kCaToL1Code = 2,
  kCaToL1Phase = 3,
  kL2cToL2pCode = 4,
  kL2cToL2pPhase = 5,
};

struct CopyRule {
  bool (*applies)(uint32_t mask);
  uint32_t bit;
  ForceCopyGroup group;
  const char* message;
};

constexpr uint32_t kL2Code = CodeBit(kL2C) | CodeBit(kL2P);
constexpr uint32_t kL2Phase = PhaseBit(kL2C) | PhaseBit(kL2P);

const CopyRule kRules[] = {
    {[](uint32_t m) { return (m & kL2Code) && (m & CodeBit(kL1P)) && !(m & CodeBit(kL1C)); },
     CodeBit(kL1C), kL1ToCaCode, "%s: force_copy_L1_to_CA_code\n"},
    {[](uint32_t m) { return (m & kL2Code) && (m & CodeBit(kL1C)) && !(m & CodeBit(kL1P)); },
     CodeBit(kL1P), kCaToL1Code, "%s: force_copy_CA_to_L1_code\n"},
    {[](uint32_t m) { return (m & kL2Phase) && (m & PhaseBit(kL1P)) && !(m & PhaseBit(kL1C)); },
     PhaseBit(kL1C), kL1ToCaPhase, "%s: force_copy_L1_to_CA_phase\n"},
    {[](uint32_t m) { return (m & kL2Phase) && (m & PhaseBit(kL1C)) && !(m & PhaseBit(kL1P)); },
     PhaseBit(kL1P), kCaToL1Phase, "%s: force_copy_CA_to_L1_phase\n"},
    {[](uint32_t m) { return (m & PhaseBit(kL2C)) && !(m & PhaseBit(kL2P)); }, PhaseBit(kL2P),
     kL2cToL2pPhase, "%s: force_copy_L2C_to_L2P_phase\n"},
    {[](uint32_t m) { return (m & CodeBit(kL2C)) && !(m & CodeBit(kL2P)); }, CodeBit(kL2P),
     kL2cToL2pCode, "%s: force_copy_L2C_to_L2P_code\n"},
};

}  // namespace

void ReportSignalsAndForceCopy(TChainItem& file, const ScanLogSink& log) {
  for (int s = 0; s < kSystemCount; ++s) {
    const auto system = static_cast<SatSystem>(s);
    const char* name = SystemName(system);
    std::string line = std::string(name) + ":";
    for (int bit = 0; bit < 10; ++bit)
      if (file.signal_masks[s] & (1u << bit)) line += std::string(" ") + SignalMaskBitName(bit);
    line += "\n";
    ScanLogf(log, "%s", line.c_str());
    if (system == SatSystem::kBds) continue;
    for (const CopyRule& rule : kRules) {
      if (!rule.applies(file.signal_masks[s])) continue;
      file.signal_masks[s] |= rule.bit;
      file.force_copy[rule.group][s] = 1;
      ScanLogf(log, rule.message, name);
    }
  }
}

}  // namespace vox
