// Copying and comparing engine parameter blocks as engines ask for them: a block starts with
// its meaningful size and its allocated size (u16 each, header included); the bytes after
// the 4-byte header are the engine's. A caller's block may leave the allocated size 0.
//
// Pure functions on the caller's memory; any thread.
#pragma once

#include <cstdint>

namespace vox {

// Copies the source's payload into the destination. With a source whose allocated size is
// set, min(destination allocated, source meaningful) bytes are taken and become the
// destination's meaningful size; with a source of allocated size 0, min(both meaningful
// sizes) bytes are taken and the destination's header is kept. Null or identical blocks:
// nothing happens.
void AssignParameterBlock(void* destination, const void* source);

// True for the same block (two null pointers included), or when the payloads agree over the smaller
// meaningful size; false for a null block or one of meaningful size 0.
bool CompareParameterBlocks(const void* a, const void* b);

}  // namespace vox
