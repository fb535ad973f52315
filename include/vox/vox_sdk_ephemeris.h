/* vox engine SDK: ephemeris functions and records. */
#ifndef VOX_SDK_EPHEMERIS_H
#define VOX_SDK_EPHEMERIS_H

#include "vox_sdk_core.h"

#endif /* VOX_SDK_EPHEMERIS_H */
