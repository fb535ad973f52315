// Little-endian readers and writers for packed records: every record that leaves or enters
// vox goes through these, never through a cast of file bytes.
#pragma once

#include <bit>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace vox::le {

template <typename T>
T ByteSwap(T value) {
  static_assert(std::is_trivially_copyable_v<T>);
  uint8_t bytes[sizeof(T)];
  std::memcpy(bytes, &value, sizeof(T));
  for (size_t i = 0; i < sizeof(T) / 2; ++i) std::swap(bytes[i], bytes[sizeof(T) - 1 - i]);
  std::memcpy(&value, bytes, sizeof(T));
  return value;
}

// Reads a T stored little-endian at p.
template <typename T>
T Load(const void* p) {
  T value;
  std::memcpy(&value, p, sizeof(T));
  if constexpr (std::endian::native == std::endian::big && sizeof(T) > 1) value = ByteSwap(value);
  return value;
}

// Stores value little-endian at p.
template <typename T>
void Store(void* p, T value) {
  if constexpr (std::endian::native == std::endian::big && sizeof(T) > 1) value = ByteSwap(value);
  std::memcpy(p, &value, sizeof(T));
}

// Reads a T stored big-endian at p.
template <typename T>
T LoadBig(const void* p) {
  T value;
  std::memcpy(&value, p, sizeof(T));
  if constexpr (std::endian::native == std::endian::little && sizeof(T) > 1) value = ByteSwap(value);
  return value;
}

template <typename T>
void StoreBig(void* p, T value) {
  if constexpr (std::endian::native == std::endian::little && sizeof(T) > 1) value = ByteSwap(value);
  std::memcpy(p, &value, sizeof(T));
}

}  // namespace vox::le
