/* vox engine SDK: the _eng_* functions an engine exports, the interface version and the
 * parameter block. (Filled in with engine loading.) */
#ifndef VOX_SDK_ENGINE_H
#define VOX_SDK_ENGINE_H

#include "vox_sdk_core.h"

#endif /* VOX_SDK_ENGINE_H */
