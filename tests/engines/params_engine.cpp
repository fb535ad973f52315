// A complete engine that records every call vox makes into the file named by
// VOX_TEST_RECORD. Its parameter block size comes from VOX_TEST_BLOCK_SIZE (default 16)
// and the names it enumerates from VOX_TEST_PARAM_NAMES (comma list; default
// "StartPoint,Mode,Empty,Missing").
#include <string>

#include "test_engine.h"

using test_engine::Record;

TEST_ENGINE_REQUIRED_FUNCTIONS(VOX_ENGINE_INTERFACE_VERSION)

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_InitEngine(void* vox_module) {
  Record("init_engine %s", vox_module != nullptr ? static_cast<const char*>(vox_module) : "");
  return 0;
}

// Must never be called: _eng_InitEngine takes precedence.
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_InitEngineDLL(const char* vox_path) {
  Record("init_dll %s", vox_path);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetParamBlockSize(void) {
  return static_cast<uint32_t>(test_engine::EnvNumber("VOX_TEST_BLOCK_SIZE", 16));
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_InitParamBlock(ParameterBlock* block) {
  Record("init_block %u %u", block->size, block->allocated);
  block->size = block->allocated;
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_EnumParamName(vox_EnumParamCallback callback,
                                                       void* context) {
  Record("enum");
  const char* list = std::getenv("VOX_TEST_PARAM_NAMES");
  std::string names = list != nullptr ? list : "StartPoint,Mode,Empty,Missing";
  size_t begin = 0;
  while (begin <= names.size()) {
    size_t end = names.find(',', begin);
    if (end == std::string::npos) end = names.size();
    const std::string name = names.substr(begin, end - begin);
    if (callback(context, 0, name.c_str()) != 0) Record("callback returned non-zero");
    begin = end + 1;
  }
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_SetParam(ParameterBlock* block, const char* name,
                                                  const char* value) {
  Record("set %u %s=%s", block->allocated, name, value);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  Record("group %u", context->id);
  return 7;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  Record("break");
  return 5;
}
