// POSIX implementation of platform.h: files.
#include "platform/platform.h"
