// Win32 implementation of platform.h: QuietFloatingPoint.
#include <float.h>

#include <cstring>

#include "platform/platform.h"

namespace vox::platform {

QuietFloatingPoint::QuietFloatingPoint() {
  const unsigned int control = _controlfp(0, 0);
  std::memcpy(saved_, &control, sizeof control);
  _clearfp();
  _controlfp(_MCW_EM, _MCW_EM);
}

QuietFloatingPoint::~QuietFloatingPoint() {
  unsigned int control;
  std::memcpy(&control, saved_, sizeof control);
  // Flags raised while quiet must not trap once the engine's mode is back.
  _clearfp();
  _controlfp(control, _MCW_EM);
}

}  // namespace vox::platform
