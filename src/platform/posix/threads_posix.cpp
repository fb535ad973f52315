// POSIX implementation of platform.h: threads.
#include "platform/platform.h"
