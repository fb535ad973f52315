// POSIX implementation of platform.h: library.
#include "platform/platform.h"
