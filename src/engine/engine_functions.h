// The names an engine library exports, in the order of TEngine's function table.
#pragma once

#include <array>
#include <cstddef>

namespace vox {

// Index into TEngine's function table. The order is fixed: hosts' tools list the table in
// this order, and the required-function check walks it by name.
enum class EngineFunction : size_t {
  kGetEngineVOXVersion,
  kGetEngineDLLVersion,
  kGetEngineInternalName,
  kGetEngineCapability,
  kGetEngineDescription,
  kEditParamBlock,
  kGetParamBlockSize,
  kInitParamBlock,
  kBreakProcess,
  kProcessVector,
  kProcessGroup,
  kProcessGroupMT,
  kProcessOccupation,
  kEditOccupation,
  kViewVectorResult,
  kGetParam,
  kSetParam,
  kEnumParamName,
  kEphemerisCalculator,
};

inline constexpr size_t kEngineFunctionCount = 19;

// Exported names, indexed by EngineFunction.
inline constexpr std::array<const char*, kEngineFunctionCount> kEngineFunctionNames = {
    "_eng_GetEngineVOXVersion",
    "_eng_GetEngineDLLVersion",
    "_eng_GetEngineInternalName",
    "_eng_GetEngineCapability",
    "_eng_GetEngineDescription",
    "_eng_EditParamBlock",
    "_eng_GetParamBlockSize",
    "_eng_InitParamBlock",
    "_eng_BreakProcess",
    "_eng_ProcessVector",
    "_eng_ProcessGroup",
    "_eng_ProcessGroupMT",
    "_eng_ProcessOccupation",
    "_eng_EditOccupation",
    "_eng_ViewVectorResult",
    "_eng_GetParam",
    "_eng_SetParam",
    "_eng_EnumParamName",
    "_eng_EphemerisCalculator",
};

// Used only while loading, so they live outside the table.
inline constexpr const char* kInitEngineName = "_eng_InitEngine";
inline constexpr const char* kInitEngineDllName = "_eng_InitEngineDLL";

// Loading fails at the first of these that the library does not export, in this order.
inline constexpr std::array<EngineFunction, 4> kRequiredEngineFunctions = {
    EngineFunction::kGetEngineCapability,
    EngineFunction::kGetEngineInternalName,
    EngineFunction::kGetEngineVOXVersion,
    EngineFunction::kGetEngineDLLVersion,
};

constexpr const char* EngineFunctionName(EngineFunction f) {
  return kEngineFunctionNames[static_cast<size_t>(f)];
}

}  // namespace vox
