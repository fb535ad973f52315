// A CPU-bound raw filter for the scheduling benchmark: each occupation costs a fixed amount
// of arithmetic (VOX_BENCH_WORK iterations, default 20 million). When VOX_BENCH_CALLS names a
// file, every call appends one byte to it, so that the benchmark can tell whether it was
// called at all.
#include <cstdio>
#include <cstdlib>

#include "vox/vox_engine.h"

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  return VOX_ENGINE_INTERFACE_VERSION;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {
  return 1;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "bench";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessOccupation(vox_ThreadContext*) {
  if (const char* calls = std::getenv("VOX_BENCH_CALLS")) {
    if (FILE* f = std::fopen(calls, "a")) {
      std::fputc('.', f);
      std::fclose(f);
    }
  }
  const char* work = std::getenv("VOX_BENCH_WORK");
  const long n = work != nullptr ? std::atol(work) : 20000000L;
  volatile double x = 1.0;
  double y = x;
  for (long i = 0; i < n; ++i)
    y = y * 1.0000001 + 1e-9;
  x = y;
  return 1;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext*) {
  return 1;
}
