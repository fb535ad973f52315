// Where the scan's report lines go: the engine log by default, or a sink of the caller's
// (tests and tools collect them).
#pragma once

namespace vox {

struct ScanLogSink {
  void (*write)(void* context, const char* text) = nullptr;
  void* context = nullptr;
};

// printf-style; writes to the sink, or with vox::Trace when the sink has no function.
void ScanLogf(const ScanLogSink& sink, const char* format, ...)
#if defined(__GNUC__)
    __attribute__((format(printf, 2, 3)))
#endif
    ;

}  // namespace vox
