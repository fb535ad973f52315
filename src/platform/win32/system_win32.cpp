// Win32 implementation of platform.h: clock, system errors and the floating-point mode.
#include <windows.h>

#include <float.h>
#include <time.h>

#include "platform/platform.h"

namespace vox::platform {

// ---------------------------------------------------------------- clock

LocalDateTime LocalClock() {
  SYSTEMTIME t;
  GetLocalTime(&t);
  return {t.wYear, t.wMonth, t.wDay, t.wHour, t.wMinute, t.wSecond};
}

UtcDateTime UtcClock() {
  SYSTEMTIME t;
  GetSystemTime(&t);
  return {t.wYear, t.wMonth, t.wDay, t.wHour, t.wMinute, t.wSecond};
}

long TimeZoneSeconds() {
  _tzset();
  return _timezone;
}

// ---------------------------------------------------------------- errors

uint32_t LastSystemError() {
  return GetLastError();
}

void SetLastSystemError(uint32_t code) {
  SetLastError(code);
}

std::string SystemErrorText(uint32_t code) {
  if (code == 0) return {};
  // The system's own table, insert sequences left alone, line breaks turned into blanks.
  char buffer[256];
  DWORD length = FormatMessageA(
      FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS | FORMAT_MESSAGE_MAX_WIDTH_MASK,
      nullptr, code, 0, buffer, sizeof buffer, nullptr);
  if (length == 0) return {};
  std::string text(buffer, length);
  for (char& c : text) {
    if (c == '\n' || c == '\r') c = ' ';
  }
  while (!text.empty() && text.back() == ' ')
    text.pop_back();
  return text;
}

// ---------------------------------------------------------------- floating point

namespace {
// Masked: denormal operand, underflow, inexact. Unmasked: invalid, division by zero,
// overflow.
constexpr unsigned kEngineMode = _EM_DENORMAL | _EM_UNDERFLOW | _EM_INEXACT;  // 0x80003
constexpr unsigned kExceptionMask = _MCW_EM;                                  // 0x8001F
}  // namespace

void SetEngineFloatingPointMode() {
  // Clear pending flags first: unmasking an exception whose flag is already raised would
  // trap at the next floating-point instruction, far from its cause.
  _clearfp();
  _controlfp(kEngineMode, kExceptionMask);
}

void RestoreDefaultFloatingPointMode() {
  _clearfp();
  _controlfp(kExceptionMask, kExceptionMask);
}

}  // namespace vox::platform
