// Its version function throws a foreign exception; vox must survive it and refuse the
// engine. errno is cleared first so that the system has no error text to offer.
#include <cerrno>
#include <stdexcept>

#include "test_engine.h"

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  errno = 0;
  throw std::runtime_error("version unknown");
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {
  return 1;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "throw";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {
  return 0;
}
