/* The host header must stay usable from C: this file is compiled as C99. */
#include "vox/vox_host.h"

uint32_t PingFromC(vox_ControlHandle handle) {
  return SendEngineControl(handle, VOX_CMD_PING, 0);
}
