// An engine that misbehaves on request, for the whole-job fault tests. The job's [JOB]
// section chooses with FaultMode:
//   throw  - the group call throws a C++ exception;
//   crash  - the group call writes through a null pointer;
//   hang   - the group call reports progress and never returns until _eng_BreakProcess;
//   write  - the group call writes FaultWrites messages of 200 bytes, then returns.
// FaultRecord names a file to which the engine appends "entered" when its group call starts,
// so that a test can tell an engine that misbehaved from one that was never called.
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>
#include <thread>

#include "test_engine.h"

namespace {

#pragma pack(push, 1)
struct FaultBlock {
  ParameterBlock header;
  char mode[16];
  char record[256];
  int32_t writes;
};
#pragma pack(pop)

std::atomic<bool> g_break{false};

void SetText(char* field, size_t capacity, const char* value) {
  std::snprintf(field, capacity, "%s", value);
}

// A real access fault, also in a build with the undefined-behaviour checker, which would
// otherwise stop the process at the null store before the fault happens.
#if defined(__GNUC__)
__attribute__((noinline, no_sanitize_undefined))
#endif
void WriteThroughNull() {
  volatile int* nowhere = nullptr;
  *nowhere = 1;
}

}  // namespace

TEST_ENGINE_REQUIRED_FUNCTIONS(VOX_ENGINE_INTERFACE_VERSION)

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetParamBlockSize(void) {
  return sizeof(FaultBlock);
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_InitParamBlock(ParameterBlock* block) {
  block->size = block->allocated;
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_EnumParamName(vox_EnumParamCallback callback,
                                                       void* context) {
  for (const char* name : {"FaultMode", "FaultRecord", "FaultWrites"})
    callback(context, 0, name);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_SetParam(ParameterBlock* header, const char* name,
                                                  const char* value) {
  if (header->allocated < sizeof(FaultBlock)) return 0;
  FaultBlock* block = reinterpret_cast<FaultBlock*>(header);
  if (std::strcmp(name, "FaultMode") == 0) SetText(block->mode, sizeof block->mode, value);
  if (std::strcmp(name, "FaultRecord") == 0) SetText(block->record, sizeof block->record, value);
  if (std::strcmp(name, "FaultWrites") == 0) block->writes = std::atoi(value);
  return 0;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_BreakProcess(void) {
  g_break.store(true);
  return 0;
}

// As the job's raw filter it does nothing, so that the pipeline goes on to the engine step.
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessOccupation(vox_ThreadContext*) {
  return 1;
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  g_break.store(false);
  FaultBlock block;
  std::memset(&block, 0, sizeof block);
  block.header.allocated = sizeof block;
  vox_GetSolutionProperty(0, &block.header);
  if (block.record[0] != '\0') {
    if (FILE* f = std::fopen(block.record, "a")) {
      std::fputs("entered\n", f);
      std::fclose(f);
    }
  }
  const std::string mode = block.mode;
  context->message(context->writer, 1, "fault engine: start");

  if (mode == "throw") throw std::runtime_error("fault engine: asked to throw");
  if (mode == "crash") WriteThroughNull();
  if (mode == "hang") {
    // Bounded only so that a broken break cannot hold the test suite for ever.
    const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(60);
    for (int percent = 0; !g_break.load() && std::chrono::steady_clock::now() < give_up;) {
      context->progress(context->writer, percent < 90 ? ++percent : percent);
      std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    context->message(context->writer, 1,
                     g_break.load() ? "fault engine: broken" : "fault engine: gave up");
    return 0;
  }
  if (mode == "write") {
    char text[201];
    for (int i = 0; i < block.writes; ++i) {
      std::snprintf(text, sizeof text, "%-199d|", i);
      context->message(context->writer, 1, text);
    }
  }
  context->message(context->writer, 1, "fault engine: end");
  return 0;
}
