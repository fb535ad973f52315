#include "job/parameter_assign.h"

#include <algorithm>
#include <cstring>

#include "base/le.h"

namespace vox {
namespace {

constexpr uint16_t kHeader = 4;

uint16_t Meaningful(const void* block) {
  return le::Load<uint16_t>(block);
}
uint16_t Allocated(const void* block) {
  return le::Load<uint16_t>(static_cast<const uint8_t*>(block) + 2);
}

}  // namespace

void AssignParameterBlock(void* destination, const void* source) {
  if (destination == nullptr || source == nullptr || destination == source) return;
  uint16_t count;
  if (Allocated(source) != 0) {
    // Never read past the source's own allocation, even when its meaningful size claims
    // more.
    const uint16_t available = std::min(Meaningful(source), Allocated(source));
    count = std::min(Allocated(destination), available);
    le::Store<uint16_t>(destination, count);
  } else {
    count = std::min(Meaningful(destination), Meaningful(source));
  }
  // A count inside the header has no payload to copy.
  if (count <= kHeader) return;
  std::memcpy(static_cast<uint8_t*>(destination) + kHeader,
              static_cast<const uint8_t*>(source) + kHeader, count - kHeader);
}

bool CompareParameterBlocks(const void* a, const void* b) {
  if (a == b) return true;
  if (a == nullptr || b == nullptr) return false;
  const uint16_t size_a = Meaningful(a);
  const uint16_t size_b = Meaningful(b);
  if (size_a == 0 || size_b == 0) return false;
  const uint16_t count = std::min(size_a, size_b);
  if (count <= kHeader) return true;
  return std::memcmp(static_cast<const uint8_t*>(a) + kHeader,
                     static_cast<const uint8_t*>(b) + kHeader, count - kHeader) == 0;
}

}  // namespace vox
