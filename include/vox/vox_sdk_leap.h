/* vox engine SDK: leap functions and records. */
#ifndef VOX_SDK_LEAP_H
#define VOX_SDK_LEAP_H

#include "vox_sdk_core.h"

#endif /* VOX_SDK_LEAP_H */
