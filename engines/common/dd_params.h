// The parameter block of the differential engines (static and kinematic), as the job file
// sets it in [JOB] for all and in [VECTOR:n] / [FAN:n] for one:
//   ElevationMask  degrees above the horizon, 0 to 60 (default 15)
//   Interval       seconds between the epochs used, 0 for every epoch (default 0)
//   MinRatio       ratio the integer fix needs to be accepted, 1 to 100 (default 3)
// vox copies blocks byte for byte, so the block is plain data with a fixed layout.
#pragma once

#include <charconv>
#include <cstdint>
#include <cstring>

#include "vox/vox_engine.h"

namespace voxeng {

#pragma pack(push, 1)
struct VOX_PACKED DdParams {
  ParameterBlock head;
  float elevation_mask_deg;
  uint32_t interval_ms;
  float min_ratio;
};
#pragma pack(pop)

inline void InitDdParams(DdParams& p) {
  p.head.size = sizeof(DdParams);
  p.elevation_mask_deg = 15.0f;
  p.interval_ms = 0;
  p.min_ratio = 3.0f;
}

inline void EnumDdParams(vox_EnumParamCallback callback, void* context) {
  if (callback == nullptr) return;
  for (const char* name : {"ElevationMask", "Interval", "MinRatio"})
    callback(context, 0, name);
}

// Stores one value given as text; values out of range and unknown names are ignored.
inline bool SetDdParam(ParameterBlock* block, const char* name, const char* value) {
  if (block == nullptr || name == nullptr || value == nullptr) return false;
  if (block->allocated < sizeof(DdParams)) return false;
  auto* p = reinterpret_cast<DdParams*>(block);
  // Job values use the point whatever the host's locale.
  double v = 0;
  const char* end = value + std::strlen(value);
  if (std::from_chars(value, end, v).ec != std::errc()) return false;
  if (std::strcmp(name, "ElevationMask") == 0 && v >= 0 && v <= 60) {
    p->elevation_mask_deg = static_cast<float>(v);
  } else if (std::strcmp(name, "Interval") == 0 && v >= 0 && v <= 3600) {
    p->interval_ms = static_cast<uint32_t>(v * 1000.0 + 0.5);
  } else if (std::strcmp(name, "MinRatio") == 0 && v >= 1 && v <= 100) {
    p->min_ratio = static_cast<float>(v);
  } else {
    return false;
  }
  return true;
}

// The parameters of one item as vox copies them out of its block (or the defaults).
template <class Getter>
DdParams ItemDdParams(Getter get, uint32_t item_id) {
  DdParams p;
  std::memset(&p, 0, sizeof p);
  InitDdParams(p);
  DdParams copy = p;
  copy.head.size = 0;
  copy.head.allocated = sizeof(DdParams);
  if (get(item_id, &copy.head) && copy.head.size >= sizeof(DdParams)) p = copy;
  return p;
}

}  // namespace voxeng

// The four parameter-block exports of an engine whose parameters are DdParams (the static and
// the kinematic engine): one definition, expanded once at file scope in each engine.
#define VOXENG_EXPORT_DD_PARAMETERS()                                                           \
  VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetParamBlockSize(void) {                            \
    return sizeof(voxeng::DdParams);                                                            \
  }                                                                                             \
  VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_InitParamBlock(ParameterBlock* block) {              \
    if (block == nullptr || block->allocated < sizeof(voxeng::DdParams)) return 0;              \
    voxeng::InitDdParams(*reinterpret_cast<voxeng::DdParams*>(block));                          \
    return 1;                                                                                   \
  }                                                                                             \
  VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_EnumParamName(vox_EnumParamCallback callback,        \
                                                         void* context) {                       \
    voxeng::EnumDdParams(callback, context);                                                    \
    return 1;                                                                                   \
  }                                                                                             \
  VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_SetParam(ParameterBlock* block, const char* name,    \
                                                    const char* value) {                        \
    return voxeng::SetDdParam(block, name, value) ? 1 : 0;                                      \
  }
