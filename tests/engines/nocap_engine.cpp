// Lacks _eng_GetEngineCapability and _eng_GetEngineDLLVersion: vox must refuse it, naming
// the capability function, which it checks first.
#include "test_engine.h"

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  return 22;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "nocap";
}
