#include "base/short_text.h"

#include <cstdio>
#include <cstring>

#include "base/scratch_ring.h"
#include "platform/platform.h"

namespace vox {

namespace {

// The short format reserves room for this much formatted text in place, and wraps the ring
// first when fewer than kFormatRoom bytes are left.
constexpr size_t kFormatReserve = 998;
constexpr size_t kFormatRoom = 1000;
constexpr size_t kErrorTextBytes = 256;

}  // namespace

const char* ShortCopy(const char* text) {
  if (text == nullptr) text = "";
  const size_t length = strnlen(text, kShortTextMax);
  char* area = TakeFromRing(length + 2);
  area[0] = static_cast<char>(length);
  std::memcpy(area + 1, text, length);
  area[length + 1] = '\0';
  return area + 1;
}

const char* ShortFormatV(const char* format, va_list arguments) {
  uint8_t* block = ScratchRingBlock();
  uint32_t offset = ScratchRingOffset(block);
  if (kScratchRingBytes - offset < kFormatRoom) offset = kScratchRingFirstOffset;
  char* area = reinterpret_cast<char*>(block + offset);
  int written = format ? std::vsnprintf(area + 1, kFormatReserve + 1, format, arguments) : -1;
  if (written < 0) written = 0;
  const size_t length = static_cast<size_t>(written) < kShortTextMax ? written : kShortTextMax;
  area[0] = static_cast<char>(length);
  area[length + 1] = '\0';
  SetScratchRingOffset(block, static_cast<uint32_t>(offset + length + 2));
  return area + 1;
}

const char* ShortFormat(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  const char* text = ShortFormatV(format, arguments);
  va_end(arguments);
  return text;
}

const char* SystemErrorText(uint32_t code) {
  if (code == 0) return nullptr;
  const std::string text = platform::SystemErrorText(code);
  if (text.empty()) return nullptr;
  char* area = TakeFromRing(kErrorTextBytes);
  const size_t length = text.size() < kErrorTextBytes ? text.size() : kErrorTextBytes - 1;
  std::memcpy(area, text.data(), length);
  area[length] = '\0';
  return area;
}

const char* LastErrorText() {
  return SystemErrorText(platform::LastSystemError());
}

std::string LastErrorString() {
  const char* text = LastErrorText();
  return text ? std::string(text) : std::string();
}

}  // namespace vox
