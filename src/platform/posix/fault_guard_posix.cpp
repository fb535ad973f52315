// POSIX implementation of platform.h: fault_guard.
#include "platform/platform.h"
