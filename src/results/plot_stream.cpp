#include "results/plot_stream.h"

#include <cmath>
#include <cstring>
#include <initializer_list>
#include <new>
#include <string_view>

#include "base/le.h"
#include "results/plot_description.h"

namespace vox {
namespace {

constexpr size_t kEpochHead = 12;  // ms of day, day, stream id, count

bool IsDigit(char c) {
  return c >= '0' && c <= '9';
}

uint16_t GroupOf(char c) {
  switch (c) {
    case 'C':
      return kPlotGroupC;
    case 'E':
      return kPlotGroupE;
    case 'S':
      return kPlotGroupS;
    case 'J':
      return kPlotGroupJ;
    case 'R':
      return kPlotGroupR;
    default:
      return 0;
  }
}

bool ContainsAny(std::string_view s, std::initializer_list<std::string_view> parts) {
  for (std::string_view p : parts) {
    if (s.find(p) != std::string_view::npos) return true;
  }
  return false;
}

bool EqualsAny(std::string_view s, std::initializer_list<std::string_view> names) {
  for (std::string_view n : names) {
    if (s == n) return true;
  }
  return false;
}

// The signal part of a line name decides the combination and the code-signal mark.
uint16_t SignalFlags(std::string_view s) {
  uint16_t flags = 0;
  if (ContainsAny(s, {"CA", "C2", "C/A", "L2C", "B1I", "B2I", "E1B", "E5I", "L5I"})) {
    flags |= kPlotCodeSignal;
  }
  if (EqualsAny(s, {"CA", "C/A", "L1", "PL1", "B1I", "B1Q", "E1B", "E1C"})) {
    return flags | kPlotFirstFrequency;
  }
  if (EqualsAny(s, {"L2", "C2", "PL2", "L2C", "B2I", "B2Q"})) {
    return flags | kPlotSecondFrequency;
  }
  if (EqualsAny(s, {"L5", "L5I", "L5Q", "E5AI", "E5AQ", "E5BI", "E5BQ", "E5AB"})) {
    return flags | kPlotThirdFrequency;
  }
  if (ContainsAny(s, {"-L2", "-C2", "-L5"})) return flags | kPlotMinusCombination;
  if (ContainsAny(s, {"+L2", "+C2"})) return flags | kPlotPlusCombination;
  if (ContainsAny(s, {"IonoFree"})) return flags | kPlotIonoFree;
  return flags;
}

// Seconds to (ms of day, day); values that no u32 pair can hold give zeros rather than an
// undefined conversion.
RawTime EpochTime(double seconds) {
  const double ms = std::nearbyint(seconds * 1000.0);
  if (!std::isfinite(ms) || std::fabs(ms) > 9.0e18) return RawTime{};
  const double day = std::floor(ms / 86400000.0);
  const auto ms_of_day = static_cast<int64_t>(ms - day * 86400000.0);
  return RawTime{static_cast<uint32_t>(ms_of_day),
                 static_cast<uint32_t>(static_cast<int64_t>(day))};
}

}  // namespace

void ParsePlotLineName(PlotLine& line, const std::string& name) {
  const size_t n = name.size();
  int state = 1;
  int digits = 0;
  uint16_t group = 0;
  uint16_t number = 0;
  size_t at = 0;
  for (; at < n; ++at) {
    const char c = name[at];
    bool stop = false;
    switch (state) {
      case 1:  // a satellite letter followed by two digits
        if (at + 2 >= n || !IsDigit(name[at + 1]) || !IsDigit(name[at + 2])) return;
        group = GroupOf(c);
        number = 0;
        state = 2;
        break;
      case 2:
        if (!IsDigit(c)) return;
        number = static_cast<uint16_t>(number * 10 + (c - '0'));
        ++digits;
        if (digits == 2) {
          line.sat_a = group | number;
          state = 3;
        } else if (digits == 4) {
          line.flags |= kPlotPair;
          line.sat_b = group | number;
          state = 4;
        }
        break;
      case 3:
        if (c == '-') {
          state = 1;
        } else {
          state = 4;
          stop = c != ' ';
        }
        break;
      default:
        stop = c != ' ';
        break;
    }
    if (stop) break;
  }
  if (at >= n) return;
  line.flags |= SignalFlags(std::string_view(name).substr(at));
}

vox_PlotStream::vox_PlotStream(TResultFile& writer, size_t entry_bytes)
    : writer_(&writer),
      stream_id_(static_cast<uint16_t>(++writer.plot_counter)),
      entry_bytes_(entry_bytes),
      buffer_(kEpochHead + kPlotLineCount * entry_bytes, 0) {}

int vox_PlotStream::SetLine(uint32_t index, uint32_t mode, const char* name, const char* options) {
  if (index >= kPlotLineCount) return 0;
  if (index == kPlotTimeLine) return 1;
  PlotLine& line = lines_[index];
  if (options != nullptr) {
    if (options[0] == 'm') line.flags |= kPlotOptionM;
    if (options[0] == 'c') line.flags |= kPlotOptionC;
  }
  if (name == nullptr) return 1;
  line.name = name;
  if (mode > 1) {
    line.flags = static_cast<uint16_t>(index | kPlotRawMode);
    return 1;
  }
  ParsePlotLineName(line, line.name);
  return 1;
}

int vox_PlotStream::CreatePlot(uint32_t index) {
  if (index < kPlotLineCount) WriteLineDescription(index);
  return 0;
}

int vox_PlotStream::SendData(uint32_t index, uint32_t epoch, double value) {
  if (epoch != current_epoch_) {
    FlushEpoch();
    current_epoch_ = epoch;
  }
  if (index == kPlotTimeLine) {
    epoch_time_ = EpochTime(value);
  } else if (index < kPlotLineCount) {
    AddValue(index, value);
  }
  return 1;
}

uint8_t* vox_PlotStream::NextEntry() {
  if (value_count_ >= kPlotLineCount) return nullptr;
  uint8_t* entry = buffer_.data() + kEpochHead + value_count_ * entry_bytes_;
  ++value_count_;
  return entry;
}

void vox_PlotStream::FlushAs(uint8_t kind) {
  if (current_epoch_ == kPlotNoEpoch) {
    value_count_ = 0;
    return;
  }
  uint8_t* head = buffer_.data();
  le::Store<uint32_t>(head, epoch_time_.ms_of_day);
  le::Store<uint32_t>(head + 4, epoch_time_.day);
  le::Store<uint16_t>(head + 8, stream_id_);
  le::Store<uint16_t>(head + 10, value_count_);
  writer_->WriteRecord(kind, head, kEpochHead + value_count_ * entry_bytes_);
  value_count_ = 0;
}

void vox_PlotStreamEx::FlushEpoch() {
  FlushAs(kKindPlotEpochV101);
}

void vox_PlotStreamEx::AddValue(uint32_t index, double value) {
  uint8_t* entry = NextEntry();
  if (entry == nullptr) return;
  le::Store<uint16_t>(entry, static_cast<uint16_t>(index));
  le::Store<float>(entry + 2, static_cast<float>(value));
}

void vox_PlotStreamEx::WriteLineDescription(uint32_t index) {
  const PlotLine& line = lines_[index];
  PlotLineDescEx d{};
  d.stream_id = stream_id_;
  d.flags = line.flags;
  d.sat_a = line.sat_a;
  d.sat_b = line.sat_b;
  d.index = static_cast<uint16_t>(index);
  std::strncpy(d.name, line.name.c_str(), kPlotNameMax);
  writer_->WriteRecord(kKindPlotLineV101, &d, sizeof d);
}

void vox_PlotStreamIm::FlushEpoch() {
  FlushAs(kKindPlotEpochV100);
}

void vox_PlotStreamIm::AddValue(uint32_t index, double value) {
  const PlotLine& line = lines_[index];
  if (line.sat_a > 255 || line.sat_b > 255) return;
  uint8_t* entry = NextEntry();
  if (entry == nullptr) return;
  le::Store<uint16_t>(entry, line.flags);
  entry[2] = static_cast<uint8_t>(line.sat_a);
  entry[3] = static_cast<uint8_t>(line.sat_b);
  le::Store<float>(entry + 4, static_cast<float>(value));
}

void vox_PlotStreamIm::WriteLineDescription(uint32_t index) {
  PlotLineDescIm d{};
  d.index = static_cast<uint16_t>(index);
  d.value = 3;
  std::strncpy(d.name, lines_[index].name.c_str(), kPlotNameMax);
  writer_->WriteRecord(kKindPlotLineV100, &d, sizeof d);
}

std::unique_ptr<vox_PlotStream> OpenPlotStream(TResultFile& writer) {
  try {
    if (writer.result_version < 101) return std::make_unique<vox_PlotStreamIm>(writer);
    return std::make_unique<vox_PlotStreamEx>(writer);
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

int ClosePlotStream(vox_PlotStream* stream) {
  if (stream == nullptr) return 1;
  stream->FlushEpoch();
  delete stream;
  return 1;
}

}  // namespace vox
