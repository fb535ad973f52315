// The library's load and unload notifications (only when it is built as a DLL).
//
// Process attach saves the module instance, which names the control window's class and
// finds engines beside the library. The per-thread scratch texts need no work here: their
// slots release each thread's block when the thread ends (see ThreadLocalSlot and the C++
// runtime's thread_local destructors), in a DLL and in a program linking the objects alike.
#include <windows.h>

namespace vox::platform {
extern HINSTANCE g_module_instance;
}

extern "C" BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID /*reserved*/) {
  if (reason == DLL_PROCESS_ATTACH) vox::platform::g_module_instance = instance;
  return TRUE;
}
