// Win32 implementation of platform.h: text conversions between the ANSI code page, UTF-8
// (the platform interface's paths) and UTF-16 (the system's wide functions).
#include <windows.h>

#include "platform/platform.h"
#include "platform/win32/win32_text.h"

namespace vox::platform {
namespace win32 {
namespace {

std::wstring WideFrom(UINT code_page, std::string_view text) {
  if (text.empty()) return {};
  const int length = static_cast<int>(text.size());
  int needed = MultiByteToWideChar(code_page, 0, text.data(), length, nullptr, 0);
  if (needed <= 0) return {};
  std::wstring wide(static_cast<size_t>(needed), L'\0');
  MultiByteToWideChar(code_page, 0, text.data(), length, wide.data(), needed);
  return wide;
}

// Characters the code page cannot hold become its default character ('?').
std::string BytesFrom(UINT code_page, std::wstring_view wide) {
  if (wide.empty()) return {};
  const int length = static_cast<int>(wide.size());
  int needed = WideCharToMultiByte(code_page, 0, wide.data(), length, nullptr, 0, nullptr, nullptr);
  if (needed <= 0) return {};
  std::string bytes(static_cast<size_t>(needed), '\0');
  WideCharToMultiByte(code_page, 0, wide.data(), length, bytes.data(), needed, nullptr, nullptr);
  return bytes;
}

}  // namespace

std::wstring WideFromUtf8(std::string_view utf8) {
  return WideFrom(CP_UTF8, utf8);
}

std::string Utf8FromWide(std::wstring_view wide) {
  return BytesFrom(CP_UTF8, wide);
}

}  // namespace win32

std::string PathFromAnsi(std::string_view ansi) {
  return win32::Utf8FromWide(win32::WideFrom(CP_ACP, ansi));
}

std::string AnsiFromPath(std::string_view path) {
  return win32::BytesFrom(CP_ACP, win32::WideFromUtf8(path));
}

std::string PathFromWide(const wchar_t* wide) {
  if (wide == nullptr) return {};
  return win32::Utf8FromWide(wide);
}

}  // namespace vox::platform
