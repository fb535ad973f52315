// POSIX implementation of platform.h: system.
#include "platform/platform.h"
