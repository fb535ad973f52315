// Text fields of the records handed to engines: fixed arrays that hold at most one byte less
// than their size, and a terminating zero.
#pragma once

#include <cstddef>
#include <cstring>
#include <string_view>

namespace vox {

// Copies text into out, cut to N - 1 bytes, and zero-fills the rest.
template <size_t N>
void CopyRecordText(char (&out)[N], std::string_view text) {
  const size_t n = text.size() < N - 1 ? text.size() : N - 1;
  std::memcpy(out, text.data(), n);
  std::memset(out + n, 0, N - n);
}

}  // namespace vox

namespace vox {

// Copies size bytes into a record at a field's offset. Fields of packed records may sit at
// any address, so arrays wider than a byte are written through their offset rather than
// through a (possibly misaligned) pointer to the field.
template <typename Record>
void StoreAt(Record& record, size_t offset, const void* bytes, size_t size) {
  std::memcpy(reinterpret_cast<unsigned char*>(&record) + offset, bytes, size);
}

}  // namespace vox
