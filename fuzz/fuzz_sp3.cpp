// The precise orbit reader: any bytes as a file, recognised by its first line and read into
// a position store, which is then walked for every satellite.
#include <cstdint>

#include "base/buf_file.h"
#include "fuzz_file.h"
#include "raw/precise_store.h"
#include "raw/sp3_reader.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static voxfuzz::InputFile input("orbit.sp3");
  if (!input.Write(data, size)) return 0;

  vox::TBufFile file;
  if (!file.OpenRead(input.path())) return 0;
  vox::IsPreciseOrbitFile(file);  // the scan's test; the reader starts over from the start
  vox::PreciseStore store;
  vox::ReadPreciseOrbitFile(file, store);
  // Every list must be in time order and end where the store says it ends.
  for (unsigned index = 0; index < vox::kSatIndexCount; ++index) {
    const vox::PreciseSample* last = nullptr;
    uint32_t count = 0;
    for (const vox::PreciseSample* s = store.first(index); s != nullptr; s = s->next) {
      if (last != nullptr && !(last->time.seconds < s->time.seconds)) __builtin_trap();
      last = s;
      ++count;
    }
    if (count != store.count(index) || last != store.last(index)) __builtin_trap();
    store.OpenIndex(index, 0, 0xFFFFFFFFu);
  }
  return 0;
}
