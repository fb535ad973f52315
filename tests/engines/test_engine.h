// Shared helpers of the test engines: a line recorder the tests read back, and the four
// functions every engine must export.
#pragma once

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "vox/vox_engine.h"

namespace test_engine {

// Appends one formatted line to the file named by VOX_TEST_RECORD (nothing when unset), so
// that a test can see what vox handed to the engine.
inline void Record(const char* format, ...) {
  const char* path = std::getenv("VOX_TEST_RECORD");
  if (path == nullptr || *path == '\0') return;
  FILE* file = std::fopen(path, "ab");  // binary: the same LF line ends on every OS
  if (file == nullptr) return;
  va_list args;
  va_start(args, format);
  std::vfprintf(file, format, args);
  va_end(args);
  std::fputc('\n', file);
  std::fclose(file);
}

// An unsigned number from the environment, or fallback when unset.
inline unsigned long EnvNumber(const char* name, unsigned long fallback) {
  const char* text = std::getenv(name);
  return text != nullptr && *text != '\0' ? std::strtoul(text, nullptr, 10) : fallback;
}

}  // namespace test_engine

// The required functions, with their underscores, reporting the given interface version.
#define TEST_ENGINE_REQUIRED_FUNCTIONS(version)                             \
  VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {       \
    return version;                                                         \
  }                                                                         \
  VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {      \
    return 1;                                                               \
  }                                                                         \
  VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) { \
    return "test";                                                          \
  }                                                                         \
  VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {      \
    return 0;                                                               \
  }
