// The engine's plot stream functions. None of them writes a trace line.
#include <memory>

#include "platform/platform.h"
#include "results/plot_stream.h"
#include "run/current_task.h"
#include "run/task.h"
#include "vox/vox_sdk_results.h"

namespace {

vox::vox_PlotStream* StreamOf(vox_PlotStream* stream) {
  return reinterpret_cast<vox::vox_PlotStream*>(stream);
}

}  // namespace

extern "C" {

VOX_API vox_PlotStream* VOX_CALL vox_OpenPlotStreamEx(void* writer) {
  vox::TResultFile* w = static_cast<vox::TResultFile*>(writer);
  if (w == nullptr) {
    vox::TTask* task = vox::CurrentTask();
    if (task == nullptr) return nullptr;
    w = &task->result_file;
  }
  return reinterpret_cast<vox_PlotStream*>(vox::OpenPlotStream(*w).release());
}

VOX_API vox_PlotStream* VOX_CALL vox_OpenPlotStream(void) {
  return vox_OpenPlotStreamEx(nullptr);
}

VOX_API int32_t VOX_CALL vox_SetLine(vox_PlotStream* stream, int32_t index, uint32_t mode,
                                     uint32_t /*unused*/, const char* name, const char* options) {
  if (stream == nullptr) return 0;
  return StreamOf(stream)->SetLine(static_cast<uint32_t>(index), mode, name, options);
}

VOX_API int32_t VOX_CALL vox_CreatePlot(vox_PlotStream* stream, uint32_t /*unused*/, int32_t index,
                                        uint32_t /*unused2*/) {
  if (stream == nullptr) return 0;
  return StreamOf(stream)->CreatePlot(static_cast<uint32_t>(index));
}

VOX_API int32_t VOX_CALL vox_SendData(vox_PlotStream* stream, int32_t index, uint32_t epoch,
                                      double value) {
  const vox::platform::QuietFloatingPoint quiet;
  if (stream == nullptr) return 0;
  return StreamOf(stream)->SendData(static_cast<uint32_t>(index), epoch, value);
}

VOX_API int32_t VOX_CALL vox_ClosePlotStream(vox_PlotStream* stream) {
  const vox::platform::QuietFloatingPoint quiet;
  return vox::ClosePlotStream(StreamOf(stream));
}

}  // extern "C"
