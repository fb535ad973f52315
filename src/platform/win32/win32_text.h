// Text conversions shared by the win32 files: the platform interface speaks UTF-8, the
// system's wide functions UTF-16.
#pragma once

#include <string>
#include <string_view>

namespace vox::platform::win32 {

std::wstring WideFromUtf8(std::string_view utf8);
std::string Utf8FromWide(std::wstring_view wide);

}  // namespace vox::platform::win32
