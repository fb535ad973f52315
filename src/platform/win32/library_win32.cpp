// Win32 implementation of platform.h: dynamic libraries, the path of this module and the
// library's load notifications.
#include <windows.h>
// The interface's own LoadLibrary, not the system's macro for LoadLibraryA/W.
#undef LoadLibrary

#include "platform/platform.h"
#include "platform/win32/win32_text.h"

namespace vox::platform {
namespace {

// The loader's text of the last failed load on this thread.
thread_local std::string t_last_library_error;

// An address inside this module.
void ModuleAnchor() {}

}  // namespace

// The module instance: saved at process attach when this code is a DLL, found from an
// address inside it otherwise (a program that links the library's objects statically).
HINSTANCE g_module_instance = nullptr;

HINSTANCE OwnModuleInstance() {
  if (g_module_instance != nullptr) return g_module_instance;
  HMODULE module = nullptr;
  GetModuleHandleExW(
      GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
      reinterpret_cast<LPCWSTR>(&ModuleAnchor), &module);
  return module;
}

Library* LoadLibrary(const std::string& path) {
  SetLastError(0);
  HMODULE module = LoadLibraryW(win32::WideFromUtf8(path).c_str());
  if (module == nullptr) {
    const DWORD error = GetLastError();
    t_last_library_error = SystemErrorText(error);
    // Keep the code for the caller's own error text.
    SetLastError(error);
    return nullptr;
  }
  return reinterpret_cast<Library*>(module);
}

void* ResolveSymbol(Library* library, const char* name) {
  if (library == nullptr || name == nullptr) return nullptr;
  return reinterpret_cast<void*>(GetProcAddress(reinterpret_cast<HMODULE>(library), name));
}

void UnloadLibrary(Library* library) {
  if (library != nullptr) FreeLibrary(reinterpret_cast<HMODULE>(library));
}

std::string LastLibraryError() {
  return t_last_library_error;
}

std::string OwnModulePath() {
  std::wstring buffer(MAX_PATH, L'\0');
  for (;;) {
    DWORD length =
        GetModuleFileNameW(OwnModuleInstance(), buffer.data(), static_cast<DWORD>(buffer.size()));
    if (length == 0) return {};
    if (length < buffer.size()) {
      buffer.resize(length);
      return win32::Utf8FromWide(buffer);
    }
    buffer.resize(buffer.size() * 2);  // cut short: try a larger buffer
  }
}

}  // namespace vox::platform
