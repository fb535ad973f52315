// The host's run functions and control channel.
#include <cstring>
#include <string>
#include <vector>

#include "platform/platform.h"
#include "run/control_channel.h"
#include "run/run_calls.h"
#include "run/run_state.h"
#include "vox/vox_host.h"

namespace {

vox_ControlHandle ToHandle(uint64_t window) {
  return reinterpret_cast<vox_ControlHandle>(static_cast<uintptr_t>(window));
}
uint64_t FromHandle(vox_ControlHandle handle) {
  return reinterpret_cast<uintptr_t>(handle);
}

std::string FromAnsi(const char* path) {
  return path != nullptr ? vox::platform::PathFromAnsi(path) : std::string();
}
std::string FromWide(const wchar_t* path) {
  return path != nullptr ? vox::platform::PathFromWide(path) : std::string();
}

uint32_t CopyOut(const std::string& text, char* buffer, uint32_t capacity) {
  if (buffer != nullptr && capacity > 0) {
    const size_t n = text.size() < capacity - 1 ? text.size() : capacity - 1;
    std::memcpy(buffer, text.data(), n);
    buffer[n] = '\0';
  }
  return static_cast<uint32_t>(text.size());
}

}  // namespace

extern "C" {

VOX_API vox_ControlHandle RunProcessW(const wchar_t* job_path) {
  return ToHandle(vox::RunJobFile(FromWide(job_path), {}, false));
}

VOX_API vox_ControlHandle RunProcess(const char* job_path) {
  return ToHandle(vox::RunJobFile(FromAnsi(job_path), {}, false));
}

VOX_API uint32_t RunProcessAndWaitW(const wchar_t* job_path) {
  return static_cast<uint32_t>(vox::RunJobFile(FromWide(job_path), {}, true));
}

VOX_API uint32_t RunProcessAndWait(const char* job_path) {
  return static_cast<uint32_t>(vox::RunJobFile(FromAnsi(job_path), {}, true));
}

VOX_API vox_ControlHandle RunProcessWithVariables(const char* job_path,
                                                  const char* const* variables, uint32_t count) {
  std::vector<std::string> list;
  for (uint32_t i = 0; variables != nullptr && i < count; ++i)
    if (variables[i] != nullptr) list.emplace_back(variables[i]);
  return ToHandle(vox::RunJobFile(FromAnsi(job_path), list, false));
}

VOX_API uint32_t SendEngineControl(vox_ControlHandle handle, uint32_t command, uintptr_t argument) {
  return vox::SendControlCommand(FromHandle(handle), command, argument);
}

VOX_API uint32_t GetEngineControlTitle(vox_ControlHandle handle, char* buffer, uint32_t capacity) {
  return static_cast<uint32_t>(vox::GetControlWindowTitle(FromHandle(handle), buffer, capacity));
}

VOX_API uint32_t GetEngineJobName(char* buffer, uint32_t capacity) {
  return CopyOut(vox::LastJobLabels().name, buffer, capacity);
}

VOX_API uint32_t GetEngineResultPath(char* buffer, uint32_t capacity) {
  return CopyOut(vox::LastJobLabels().result_path, buffer, capacity);
}

}  // extern "C"

VOX_API vox_ControlHandle RunMultiSiteTask(const char* job_text) {
  return ToHandle(vox::RunJobText(job_text));
}
