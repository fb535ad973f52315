/* vox engine SDK: everything an engine author needs, and nothing else.
 *
 * An engine is a shared library that exports the _eng_* functions declared in
 * vox_sdk_engine.h and calls back into vox through the vox_* functions declared in the
 * family headers below. Include this one header. */
#ifndef VOX_ENGINE_H
#define VOX_ENGINE_H

#include "vox_defs.h"
#include "vox_sdk_core.h"
#include "vox_sdk_engine.h"
#include "vox_sdk_leap.h"
#include "vox_sdk_ephemeris.h"
#include "vox_sdk_epoch.h"
#include "vox_sdk_meteo.h"
#include "vox_sdk_results.h"
#include "vox_sdk_inert.h"
#include "vox_sdk_streams.h"
#include "vox_sdk_fields.h"

#endif /* VOX_ENGINE_H */
