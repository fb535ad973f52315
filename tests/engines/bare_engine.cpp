// The required functions exported without their leading underscores, and the path-taking
// initialisation (also without underscore), which records what it receives.
#include "test_engine.h"

VOX_ENGINE_EXPORT int32_t VOX_CALL eng_GetEngineVOXVersion(void) {
  return 22;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL eng_GetEngineDLLVersion(void) {
  return 1;
}
VOX_ENGINE_EXPORT const char* VOX_CALL eng_GetEngineInternalName(void) {
  return "bare";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL eng_GetEngineCapability(void) {
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL eng_InitEngineDLL(const char* vox_path) {
  test_engine::Record("init_dll %s", vox_path != nullptr ? vox_path : "(null)");
  return 0;
}
