/* vox host API: run a job, steer it, learn how it ended. */
#ifndef VOX_HOST_H
#define VOX_HOST_H

#include "vox_defs.h"

#endif /* VOX_HOST_H */
