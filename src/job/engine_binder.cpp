#include "job/engine_binder.h"

namespace vox {

std::string EngineParameterValue(const JobSection& section, std::string_view name) {
  std::string value = section.GetString(name);
  if (value.empty() || name != "StartPoint") return value;
  const int32_t number = ParseIntDigits(value);
  if (number == 0) return value;
  return std::to_string(static_cast<uint32_t>(number) | kPointTag);
}

}  // namespace vox
