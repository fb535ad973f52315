// The epoch stream over a scanned file: any bytes scanned as one occupation's raw file, then
// read again through the stream: the first epoch, every epoch on the grid with all its
// satellites, and a find in the middle of the span. The grid interval comes from the input's
// length, so the corpus exercises plain and thinned reading alike.
#include <cstdint>
#include <memory>

#include "fuzz_file.h"
#include "job/items.h"
#include "raw/epoch_stream.h"
#include "raw/scan.h"

namespace {

void ReadAll(vox::EpochStream& stream, bool from_find) {
  vox_EpochData epoch{};
  vox_EpochSatData sat{};
  bool have = from_find;
  // Bounded: a stream over a file of n bytes cannot honestly deliver more than n epochs.
  for (int guard = 0; guard < 100000; ++guard) {
    if (!have && !stream.GetNext(epoch)) return;
    have = false;
    for (int s = 0; s < 256 && stream.GetSatellite(sat); ++s) {
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static voxfuzz::InputFile input("epochs.bin");
  if (!input.Write(data, size)) return 0;

  vox::TChainItem file(1, input.path(), false, size % 2 == 1);
  vox::TOccupItem occupation(1);
  occupation.SetFile(&file);
  vox::ScanSinks sinks;
  sinks.log.write = [](void*, const char*) {};
  if (vox::ScanFile(file, sinks) == vox::kScanCannotOpen) return 0;

  static const uint32_t kIntervals[] = {0, 1000, 5000, 30000, 250};
  const uint32_t interval = kIntervals[size % 5];
  std::unique_ptr<vox::EpochStream> stream =
      vox::EpochStream::Open(occupation, interval, nullptr, nullptr);
  if (!stream) return 0;
  vox_EpochData first{};
  if (stream->Find(nullptr, first)) ReadAll(*stream, true);

  // A find half-way through the span, then the rest from there.
  const TimeMs start = stream->start(), end = stream->end();
  const uint64_t middle_ms =
      (uint64_t{start.seconds} * 1000 + start.ms + uint64_t{end.seconds} * 1000 + end.ms) / 2;
  const TimeMs wanted{static_cast<uint32_t>(middle_ms / 1000),
                      static_cast<uint16_t>(middle_ms % 1000)};
  vox_EpochData found{};
  if (stream->Find(&wanted, found)) ReadAll(*stream, true);
  return 0;
}
