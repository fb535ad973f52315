// Builds the packed little-endian payloads of result records (and of any other packed
// record) field by field, so that no record is ever produced by casting a struct.
//
// A builder is a plain value owned by one thread.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "base/le.h"
#include "base/time_ms.h"

namespace vox {

class RecordBuilder {
 public:
  RecordBuilder() { bytes_.reserve(128); }

  RecordBuilder& U8(uint8_t v) { return Put(v); }
  RecordBuilder& U16(uint16_t v) { return Put(v); }
  RecordBuilder& U32(uint32_t v) { return Put(v); }
  RecordBuilder& I32(int32_t v) { return Put(v); }
  RecordBuilder& F32(float v) { return Put(v); }
  RecordBuilder& F64(double v) { return Put(v); }
  RecordBuilder& Bytes(const void* source, size_t count);
  RecordBuilder& Zeros(size_t count) {
    bytes_.resize(bytes_.size() + count, 0);
    return *this;
  }
  // A time as the result file stores it: u32 milliseconds of day, u32 day number.
  RecordBuilder& Time(const TimeMs& t) {
    const RawTime raw = ToRawTime(t);
    return U32(raw.ms_of_day).U32(raw.day);
  }
  // One length byte and the text without terminator, cut to at most `limit` (<= 255) bytes.
  RecordBuilder& CountedString(std::string_view text, size_t limit = 255);

  // Overwrites a u32 already laid down at `offset` (for fields known only later).
  void PatchU32(size_t offset, uint32_t v) { le::Store(bytes_.data() + offset, v); }

  const uint8_t* data() const { return bytes_.data(); }
  size_t size() const { return bytes_.size(); }
  std::span<const uint8_t> bytes() const { return bytes_; }

 private:
  template <typename T>
  RecordBuilder& Put(T v) {
    const size_t at = bytes_.size();
    bytes_.resize(at + sizeof(T));
    le::Store(bytes_.data() + at, v);
    return *this;
  }

  std::vector<uint8_t> bytes_;
};

inline RecordBuilder& RecordBuilder::Bytes(const void* source, size_t count) {
  if (count == 0) return *this;
  const auto* p = static_cast<const uint8_t*>(source);
  bytes_.insert(bytes_.end(), p, p + count);
  return *this;
}

inline RecordBuilder& RecordBuilder::CountedString(std::string_view text, size_t limit) {
  if (limit > 255) limit = 255;
  const size_t n = text.size() < limit ? text.size() : limit;
  U8(static_cast<uint8_t>(n));
  return Bytes(text.data(), n);
}

}  // namespace vox
