/* vox engine SDK: results functions and records. */
#ifndef VOX_SDK_RESULTS_H
#define VOX_SDK_RESULTS_H

#include "vox_sdk_core.h"

#endif /* VOX_SDK_RESULTS_H */
