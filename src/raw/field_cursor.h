// Reading fields out of a record body in one byte order.
//
// Byte order is a policy type, so that every record decoder is written once (raw_codec.h)
// and compiled twice, once per order. The cursor is bounded by the span it was given: a read
// past the end yields zero and marks the cursor as overrun, so a short or damaged record can
// never make a decoder read outside its buffer.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>

#include "base/le.h"
#include "base/time_ms.h"

namespace vox {

struct LittleEndianOrder {
  template <typename T>
  static T Load(const uint8_t* p) {
    return le::Load<T>(p);
  }
  template <typename T>
  static void Store(uint8_t* p, T v) {
    le::Store<T>(p, v);
  }
};

struct BigEndianOrder {
  template <typename T>
  static T Load(const uint8_t* p) {
    return le::LoadBig<T>(p);
  }
  template <typename T>
  static void Store(uint8_t* p, T v) {
    le::StoreBig<T>(p, v);
  }
};

using ByteSpan = std::span<const uint8_t>;

template <typename Order>
class FieldCursor {
 public:
  explicit FieldCursor(ByteSpan bytes)
      : begin_(bytes.data()), p_(bytes.data()), end_(bytes.data() + bytes.size()) {}

  template <typename T>
  T Get() {
    if (static_cast<size_t>(end_ - p_) < sizeof(T)) {
      p_ = end_;
      overrun_ = true;
      return T{};
    }
    const T v = Order::template Load<T>(p_);
    p_ += sizeof(T);
    return v;
  }
  uint8_t U8() { return Get<uint8_t>(); }
  uint16_t U16() { return Get<uint16_t>(); }
  int16_t I16() { return Get<int16_t>(); }
  uint32_t U32() { return Get<uint32_t>(); }
  float F32() { return Get<float>(); }
  double F64() { return Get<double>(); }
  RawTime Time() {
    RawTime t;
    t.ms_of_day = U32();
    t.day = U32();
    return t;
  }
  template <typename T, size_t N>
  void Array(T (&out)[N]) {
    for (T& v : out)
      v = Get<T>();
  }

  // A length-prefixed string into a field of the given capacity: keeps at most capacity - 1
  // characters, terminates them, and always moves past all N characters of the field.
  void String(char* out, size_t capacity) {
    const size_t n = U8();
    const size_t avail = static_cast<size_t>(end_ - p_);
    const size_t present = n < avail ? n : avail;
    const size_t keep = present < capacity - 1 ? present : capacity - 1;
    std::memcpy(out, p_, keep);
    out[keep] = '\0';
    if (n > avail) overrun_ = true;
    p_ += present;
  }
  template <size_t N>
  void String(char (&out)[N]) {
    String(out, N);
  }

  void Skip(size_t n) {
    if (static_cast<size_t>(end_ - p_) < n) {
      p_ = end_;
      overrun_ = true;
      return;
    }
    p_ += n;
  }

  size_t consumed() const { return static_cast<size_t>(p_ - begin_); }
  size_t remaining() const { return static_cast<size_t>(end_ - p_); }
  bool overrun() const { return overrun_; }
  // Bytes consumed, or 0 when the span was too short for what was read.
  size_t Result() const { return overrun_ ? 0 : consumed(); }

 private:
  const uint8_t* begin_;
  const uint8_t* p_;
  const uint8_t* end_;
  bool overrun_ = false;
};

}  // namespace vox
