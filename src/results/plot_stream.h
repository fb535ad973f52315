// Plot streams: curves (residuals, biases and the like) that an engine leaves in the result
// file for the host to plot. A stream describes up to 1024 lines by index, name and options,
// then collects one value per line and epoch and writes each epoch as one record.
//
// Two record layouts exist, chosen by the writer's result version: vox_PlotStreamIm for
// versions below 101 (kinds 4 and 37), vox_PlotStreamEx from 101 on (kinds 53 and 54).
//
// Concurrency: a stream belongs to the engine thread that opened it and writes through the
// writer it was opened on; it takes no lock. It must be closed before its writer is.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "base/time_ms.h"
#include "results/result_file.h"

namespace vox {

constexpr uint32_t kPlotLineCount = 1024;
constexpr uint32_t kPlotNoEpoch = 0xFFFFFFFF;
constexpr uint32_t kPlotTimeLine = 1;  // the line whose values are the epoch times

// Line flag bits.
constexpr uint16_t kPlotOptionM = 0x210;
constexpr uint16_t kPlotOptionC = 0x20;
constexpr uint16_t kPlotPair = 0x100;
constexpr uint16_t kPlotCodeSignal = 0x400;
constexpr uint16_t kPlotRawMode = 0x4000;
// Signal combinations (bits 0 to 2).
constexpr uint16_t kPlotFirstFrequency = 1;
constexpr uint16_t kPlotSecondFrequency = 2;
constexpr uint16_t kPlotPlusCombination = 3;
constexpr uint16_t kPlotMinusCombination = 4;
constexpr uint16_t kPlotIonoFree = 5;
constexpr uint16_t kPlotThirdFrequency = 6;

// Satellite codes of a line: number in bits 0 to 5, group in bits 6 to 9.
constexpr uint16_t kPlotGroupS = 64, kPlotGroupR = 128, kPlotGroupJ = 192, kPlotGroupE = 256,
                   kPlotGroupC = 320;

struct PlotLine {
  uint16_t flags = 0;
  uint16_t sat_a = 0;
  uint16_t sat_b = 0;
  std::string name;
};

// Sets a line's flags and satellites from its name (the satellite part and the signal part)
// as SetLine does for a mode of 0 or 1.
void ParsePlotLineName(PlotLine& line, const std::string& name);

class vox_PlotStream {
 public:
  virtual ~vox_PlotStream() = default;
  vox_PlotStream(const vox_PlotStream&) = delete;
  vox_PlotStream& operator=(const vox_PlotStream&) = delete;

  // Describes line `index` (0 to 1023). Line 1 is the time line and stays as it is. Returns
  // 0 for an index out of range, else 1.
  int SetLine(uint32_t index, uint32_t mode, const char* name, const char* options);
  // Writes line `index`'s description record. Always 0, as engines expect.
  int CreatePlot(uint32_t index);
  // One value of line `index` at epoch number `epoch`; on line 1 the value is the epoch's
  // time in seconds since the GPS time origin. A new epoch number flushes the last one.
  int SendData(uint32_t index, uint32_t epoch, double value);
  // Writes the epoch being collected, if any (also at close).
  virtual void FlushEpoch() = 0;

  uint16_t stream_id() const { return stream_id_; }
  const PlotLine& line(uint32_t index) const { return lines_.at(index); }
  uint16_t value_count() const { return value_count_; }
  const TResultFile& writer() const { return *writer_; }

 protected:
  // Takes the next stream id from the writer's plot counter.
  vox_PlotStream(TResultFile& writer, size_t entry_bytes);

  virtual void WriteLineDescription(uint32_t index) = 0;
  virtual void AddValue(uint32_t index, double value) = 0;

  // Shared flush: heads the buffer with time, id and count and writes it as `kind`.
  void FlushAs(uint8_t kind);
  // Room for one more entry of the current epoch (and counts it); null when it is full.
  uint8_t* NextEntry();

  TResultFile* writer_;
  uint32_t current_epoch_ = kPlotNoEpoch;
  std::array<PlotLine, kPlotLineCount> lines_;
  RawTime epoch_time_;
  uint16_t stream_id_;
  uint16_t value_count_ = 0;
  size_t entry_bytes_;
  std::vector<uint8_t> buffer_;
};

// Result version 101 and above: entries are (line index, value).
class vox_PlotStreamEx final : public vox_PlotStream {
 public:
  explicit vox_PlotStreamEx(TResultFile& writer) : vox_PlotStream(writer, 6) {}
  ~vox_PlotStreamEx() override = default;
  void FlushEpoch() override;

 protected:
  void WriteLineDescription(uint32_t index) override;
  void AddValue(uint32_t index, double value) override;
};

// Result version 100 and below: entries are (line flags, satellite bytes, value); lines
// whose satellite codes do not fit a byte are left out.
class vox_PlotStreamIm final : public vox_PlotStream {
 public:
  explicit vox_PlotStreamIm(TResultFile& writer) : vox_PlotStream(writer, 8) {}
  ~vox_PlotStreamIm() override = default;
  void FlushEpoch() override;

 protected:
  void WriteLineDescription(uint32_t index) override;
  void AddValue(uint32_t index, double value) override;
};

// A new stream on `writer`, of the variant its result version asks for; null when memory
// is short.
std::unique_ptr<vox_PlotStream> OpenPlotStream(TResultFile& writer);
// Flushes and destroys the stream (null: nothing). Returns 1.
int ClosePlotStream(vox_PlotStream* stream);

}  // namespace vox
