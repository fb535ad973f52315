#include "engine/engine_params.h"

#include <cstdint>
#include <string>

#include "base/engine_log.h"
#include "engine/engine.h"
#include "job/engine_binder.h"

namespace vox {

namespace {

// The block's header stores its size in 16 bits; a larger block could not be copied whole.
constexpr uint32_t kLargestBlock = 0xFFFF;

struct FillContext {
  TEngine* engine;
  const JobSection* section;
  ParamBlock* block;
};

// Called by the engine from inside _eng_EnumParamName, so nothing may escape it.
uint32_t VOX_CALL OnParamName(void* context, uintptr_t /*unused*/, const char* name) {
  if (context == nullptr || name == nullptr) return 0;
  try {
    const auto& fill = *static_cast<const FillContext*>(context);
    const std::string value = EngineParameterValue(*fill.section, name);
    if (!value.empty()) fill.engine->SetParam(*fill.block, name, value.c_str());
  } catch (...) {
    // An exception must not unwind through the engine's frames; the parameter keeps its
    // default.
  }
  return 0;
}

}  // namespace

bool CreateParamBlock(std::unique_ptr<ParamBlock>& field, TEngine* engine) {
  field.reset();
  if (engine == nullptr || !engine->loaded()) return false;
  const uint32_t size = engine->GetParamBlockSize();
  if (size == 0) return false;
  if (size > kLargestBlock) {
    Trace("%s: parameter block of %u bytes refused\n", engine->file_name().c_str(), size);
    return false;
  }
  field = ParamBlock::Create(static_cast<uint16_t>(size));
  engine->InitParamBlock(*field);
  return true;
}

bool FillParams(TEngine* engine, const JobSection& section, ParamBlock* block) {
  if (engine == nullptr || !engine->loaded()) return false;
  if (block == nullptr) return true;
  FillContext context{engine, &section, block};
  engine->EnumParamName(&OnParamName, &context);
  return true;
}

}  // namespace vox
