// The module the loader tests load, resolve and unload.
#include <cstring>
#include <string>

#include "platform/platform.h"

extern "C" __attribute__((visibility("default"))) int test_module_answer() {
  return 42;
}

// Copies this module's own path into buffer; returns its length.
extern "C" __attribute__((visibility("default"))) size_t test_module_path(char* buffer,
                                                                          size_t size) {
  std::string path = vox::platform::OwnModulePath();
  if (size > 0) {
    size_t count = path.size() < size - 1 ? path.size() : size - 1;
    memcpy(buffer, path.data(), count);
    buffer[count] = 0;
  }
  return path.size();
}
