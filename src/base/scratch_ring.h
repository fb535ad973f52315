// The per-thread scratch ring: a 16384-byte block per thread in which short-lived texts are
// built without touching the heap on every message. The block's first 4 bytes hold the
// offset of the next free byte (starting at 4); a request that does not fit makes the ring
// start over at offset 4, overwriting the oldest texts.
//
// Texts taken from the ring stay valid only until the ring wraps round: use them at once
// (format a message, write a line) and copy whatever must be kept.
//
// Threads: each thread has its own block, created on its first use and released when the
// thread ends, so no lock is involved. A pointer into a ring must not be handed to another
// thread for keeping.
#pragma once

#include <cstddef>
#include <cstdint>

namespace vox {

constexpr size_t kScratchRingBytes = 16384;
constexpr uint32_t kScratchRingFirstOffset = 4;
// The largest request the ring can satisfy.
constexpr size_t kScratchRingMaxTake = kScratchRingBytes - kScratchRingFirstOffset;

// n bytes of the calling thread's ring (not cleared). A request larger than the ring itself
// cannot be satisfied and yields null rather than memory past the block.
char* TakeFromRing(size_t n);

// The calling thread's block (created if needed), for code that builds into the ring in
// place, such as the short format.
uint8_t* ScratchRingBlock();
uint32_t ScratchRingOffset(const uint8_t* block);
void SetScratchRingOffset(uint8_t* block, uint32_t offset);

}  // namespace vox
