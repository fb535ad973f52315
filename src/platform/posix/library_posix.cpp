// POSIX implementation of platform.h: dynamic libraries and the path of this module.
#include <dlfcn.h>
#include <limits.h>
#include <link.h>
#include <stdlib.h>
#include <unistd.h>

#include "platform/platform.h"

namespace vox::platform {
namespace {

// The loader's text of the last failed load on this thread.
thread_local std::string t_last_library_error;

std::string RealPath(const char* path) {
  char resolved[PATH_MAX];
  if (path != nullptr && realpath(path, resolved) != nullptr) return resolved;
  return path != nullptr ? path : "";
}

[[maybe_unused]] std::string ExecutablePath() {
  char buffer[PATH_MAX];
  ssize_t length = readlink("/proc/self/exe", buffer, sizeof buffer - 1);
  if (length <= 0) return {};
  return std::string(buffer, static_cast<size_t>(length));
}

// An address inside this module.
void ModuleAnchor() {}

}  // namespace

Library* LoadLibrary(const std::string& path) {
  // Local binding keeps an engine's symbols from resolving another engine's.
  void* handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    const char* text = dlerror();
    t_last_library_error = text != nullptr ? text : "cannot load " + path;
    return nullptr;
  }
  return static_cast<Library*>(handle);
}

void* ResolveSymbol(Library* library, const char* name) {
  if (library == nullptr || name == nullptr) return nullptr;
  return dlsym(library, name);
}

void UnloadLibrary(Library* library) {
  if (library != nullptr) dlclose(library);
}

std::string LastLibraryError() {
  return t_last_library_error;
}

std::string OwnModulePath() {
  Dl_info info{};
  void* anchor = reinterpret_cast<void*>(&ModuleAnchor);
#ifdef __GLIBC__
  link_map* map = nullptr;
  if (dladdr1(anchor, &info, reinterpret_cast<void**>(&map), RTLD_DL_LINKMAP) == 0) return {};
  // The main program's entry has an empty name; the loader would report argv[0] for it,
  // which may be relative to a folder we have since left.
  if (map != nullptr && (map->l_name == nullptr || map->l_name[0] == '\0')) {
    return ExecutablePath();
  }
#else
  if (dladdr(anchor, &info) == 0) return {};
#endif
  return RealPath(info.dli_fname);
}

}  // namespace vox::platform
