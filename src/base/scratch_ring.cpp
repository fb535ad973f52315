#include "base/scratch_ring.h"

#include <cstring>
#include <memory>

namespace vox {

namespace {

// Owns the calling thread's block; the thread_local destructor releases it when the thread
// ends, whether the thread was started by the library, an engine or the host.
struct RingHolder {
  std::unique_ptr<uint8_t[]> block;
};
thread_local RingHolder t_ring;

}  // namespace

uint32_t ScratchRingOffset(const uint8_t* block) {
  uint32_t offset;
  std::memcpy(&offset, block, sizeof offset);
  return offset;
}

void SetScratchRingOffset(uint8_t* block, uint32_t offset) {
  std::memcpy(block, &offset, sizeof offset);
}

uint8_t* ScratchRingBlock() {
  if (!t_ring.block) {
    t_ring.block = std::make_unique<uint8_t[]>(kScratchRingBytes);
    SetScratchRingOffset(t_ring.block.get(), kScratchRingFirstOffset);
  }
  return t_ring.block.get();
}

char* TakeFromRing(size_t n) {
  if (n > kScratchRingMaxTake) return nullptr;
  uint8_t* block = ScratchRingBlock();
  uint32_t offset = ScratchRingOffset(block);
  if (offset + n > kScratchRingBytes) offset = kScratchRingFirstOffset;
  SetScratchRingOffset(block, static_cast<uint32_t>(offset + n));
  return reinterpret_cast<char*>(block + offset);
}

}  // namespace vox
