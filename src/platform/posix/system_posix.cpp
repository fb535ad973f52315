// POSIX implementation of platform.h: clock, system errors, text conversion and the
// floating-point mode.
#include <cerrno>
#include <cfenv>
#include <cstring>
#include <ctime>

#if defined(__x86_64__) || defined(__i386__)
#include <xmmintrin.h>
#define VOX_X86 1
#endif

#include "platform/platform.h"

namespace vox::platform {

// ---------------------------------------------------------------- clock

LocalDateTime LocalClock() {
  time_t now = time(nullptr);
  tm parts{};
  localtime_r(&now, &parts);
  return {parts.tm_year + 1900, parts.tm_mon + 1, parts.tm_mday,
          parts.tm_hour,        parts.tm_min,     parts.tm_sec};
}

UtcDateTime UtcClock() {
  time_t now = time(nullptr);
  tm parts{};
  gmtime_r(&now, &parts);
  return {parts.tm_year + 1900, parts.tm_mon + 1, parts.tm_mday,
          parts.tm_hour,        parts.tm_min,     parts.tm_sec};
}

long TimeZoneSeconds() {
  tzset();
  return timezone;
}

// ---------------------------------------------------------------- errors

uint32_t LastSystemError() {
  return static_cast<uint32_t>(errno);
}

void SetLastSystemError(uint32_t code) {
  errno = static_cast<int>(code);
}

std::string SystemErrorText(uint32_t code) {
  if (code == 0 || code > INT32_MAX) return {};
#if defined(__GLIBC__) && (__GLIBC__ > 2 || (__GLIBC__ == 2 && __GLIBC_MINOR__ >= 32))
  // Null for a code the C library does not know, where strerror would make up a text.
  const char* found = strerrordesc_np(static_cast<int>(code));
  if (found == nullptr) return {};
  std::string text = found;
#else
  char buffer[256];
  std::string text = strerror_r(static_cast<int>(code), buffer, sizeof buffer);
  if (text.rfind("Unknown error", 0) == 0) return {};
#endif
  for (char& c : text) {
    if (c == '\n' || c == '\r') c = ' ';
  }
  while (!text.empty() && text.back() == ' ')
    text.pop_back();
  return text;
}

// ---------------------------------------------------------------- text conversion

std::string PathFromAnsi(std::string_view ansi) {
  return std::string(ansi);
}

std::string AnsiFromPath(std::string_view path) {
  return std::string(path);
}

std::string PathFromWide(const wchar_t* wide) {
  std::string out;
  if (wide == nullptr) return out;
  for (; *wide != 0; ++wide) {
    auto c = static_cast<uint32_t>(*wide);
    if (c < 0x80) {
      out += static_cast<char>(c);
    } else if (c < 0x800) {
      out += static_cast<char>(0xC0 | (c >> 6));
      out += static_cast<char>(0x80 | (c & 0x3F));
    } else if (c >= 0xD800 && c <= 0xDFFF) {
      out += '?';  // a lone surrogate half names no character
    } else if (c < 0x10000) {
      out += static_cast<char>(0xE0 | (c >> 12));
      out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out += static_cast<char>(0x80 | (c & 0x3F));
    } else if (c <= 0x10FFFF) {
      out += static_cast<char>(0xF0 | (c >> 18));
      out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
      out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out += static_cast<char>(0x80 | (c & 0x3F));
    } else {
      out += '?';
    }
  }
  return out;
}

// ---------------------------------------------------------------- floating point

namespace {

#ifdef VOX_X86
constexpr unsigned kMxcsrDenormalMask = 0x0100;
constexpr unsigned short kX87DenormalMask = 0x0002;

void MaskDenormalException() {
  _mm_setcsr(_mm_getcsr() | kMxcsrDenormalMask);
  unsigned short control;
  __asm__ volatile("fnstcw %0" : "=m"(control));
  control |= kX87DenormalMask;
  __asm__ volatile("fldcw %0" : : "m"(control));
}
#endif

}  // namespace

void SetEngineFloatingPointMode() {
  // Clear pending flags first: unmasking an exception whose flag is already raised would
  // trap at the next floating-point instruction, far from its cause.
  feclearexcept(FE_ALL_EXCEPT);
#ifdef __GLIBC__
  fedisableexcept(FE_UNDERFLOW | FE_INEXACT);
  // Some processors cannot trap; they keep running with all exceptions masked.
  feenableexcept(FE_INVALID | FE_DIVBYZERO | FE_OVERFLOW);
#endif
#ifdef VOX_X86
  MaskDenormalException();
#endif
}

void RestoreDefaultFloatingPointMode() {
  feclearexcept(FE_ALL_EXCEPT);
#ifdef __GLIBC__
  fedisableexcept(FE_ALL_EXCEPT);
#endif
#ifdef VOX_X86
  MaskDenormalException();
#endif
}

}  // namespace vox::platform
