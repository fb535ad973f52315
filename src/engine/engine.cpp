#include "engine/engine.h"

#include <cstdio>
#include <string_view>

#include "base/engine_log.h"
#include "base/xmsg.h"
#include "job/items.h"
#include "platform/platform.h"

namespace vox {

namespace {

constexpr const char* kCannotLoad = "CANNOT_LOAD_DLL";
constexpr const char* kUnknownError = "UNKNOWN_ERROR";
constexpr const char* kObsolete = "OBSOLETE";
constexpr const char* kUnexpectedVersion = "UNEXPECTED_VERSION";

// This library's own path, computed once; its address doubles as the module instance that
// engines receive, so it must outlive every engine.
const std::string& OwnPath() {
  static const std::string path = platform::OwnModulePath();
  return path;
}

// The file name as the byte text our log lines carry.
std::string LogName(const std::string& file_name) {
  return platform::AnsiFromPath(file_name);
}

// The reason for a failure that did not come with a text of its own.
std::string LastErrorOr(const char* fallback) {
  std::string text = platform::SystemErrorText(platform::LastSystemError());
  return text.empty() ? fallback : text;
}

template <typename Fn>
Fn As(void* address) {
  return reinterpret_cast<Fn>(address);
}

}  // namespace

void* EngineModuleInstance() {
  return const_cast<char*>(OwnPath().c_str());
}

std::unique_ptr<TEngine> TEngine::Load(const std::string& path) {
  std::unique_ptr<TEngine> engine(new TEngine(path));
  try {
    engine->Open();
  } catch (const xmsg& failure) {
    engine->ReportFailure(failure.text());
  } catch (...) {
    // Whatever the engine threw, the system's last error is the best reason we have.
    engine->ReportFailure(LastErrorOr(kUnknownError));
  }
  return engine;
}

TEngine::~TEngine() {
  if (library_ == nullptr) return;
  try {
    Message(0, (LogName(file_name_) + ": unload").c_str());
  } catch (...) {
    // Losing the log line must not keep the library mapped.
  }
  platform::UnloadLibrary(library_);
}

void TEngine::Open() {
  library_ = platform::LoadLibrary(file_name_);
  if (library_ == nullptr) {
    std::string reason = platform::LastLibraryError();
    throw xmsg(reason.empty() ? kCannotLoad : reason);
  }
  ResolveTable();
  CheckRequiredFunctions();
  InitialiseEngine();
  CheckVersion();
  Message(0, (LogName(file_name_) + ": load").c_str());
  loaded_ = true;
}

void* TEngine::Resolve(const char* name) const {
  // Libraries may export each name with or without its underscore; the bare form wins.
  std::string_view full(name);
  if (full.starts_with('_')) {
    if (void* address = platform::ResolveSymbol(library_, name + 1)) return address;
  }
  return platform::ResolveSymbol(library_, name);
}

void TEngine::ResolveTable() {
  init_engine_ = Resolve(kInitEngineName);
  init_engine_dll_ = Resolve(kInitEngineDllName);
  for (size_t i = 0; i < kEngineFunctionCount; ++i)
    table_[i] = Resolve(kEngineFunctionNames[i]);
}

void TEngine::CheckRequiredFunctions() const {
  for (EngineFunction f : kRequiredEngineFunctions) {
    if (function(f) != nullptr) continue;
    char text[96];
    std::snprintf(text, sizeof text, "INVALID_ENGINE %s", EngineFunctionName(f) + 1);
    throw xmsg(text);
  }
}

void TEngine::InitialiseEngine() const {
  if (init_engine_ != nullptr) {
    As<vox_eng_InitEngine>(init_engine_)(EngineModuleInstance());
  } else if (init_engine_dll_ != nullptr) {
    const std::string path = platform::AnsiFromPath(OwnPath());
    As<vox_eng_InitEngineDLL>(init_engine_dll_)(path.c_str());
  }
}

void TEngine::CheckVersion() const {
  const int32_t version =
      As<vox_eng_GetEngineVOXVersion>(function(EngineFunction::kGetEngineVOXVersion))();
  if (version < VOX_ENGINE_INTERFACE_VERSION) throw xmsg(kObsolete);
  if (version > VOX_ENGINE_INTERFACE_VERSION) throw xmsg(kUnexpectedVersion);
}

void TEngine::ReportFailure(const std::string& error) const {
  const std::string name = LogName(file_name_);
  Message(0, ("EXCEPTION: " + name + ": " + error).c_str());
  Message(0, (name + ": " + error).c_str());
}

template <typename Fn, typename... Args>
uint32_t TEngine::CountedCall(EngineFunction f, Args... args) {
  EngineRef hold(this);
  if (!loaded_) return 0;
  Fn fn = As<Fn>(function(f));
  if (fn == nullptr) return 0;
  return static_cast<uint32_t>(fn(args...));
}

uint32_t TEngine::GetParamBlockSize() {
  return CountedCall<vox_eng_GetParamBlockSize>(EngineFunction::kGetParamBlockSize);
}

uint32_t TEngine::InitParamBlock(ParamBlock& block) {
  auto* header = reinterpret_cast<ParameterBlock*>(block.data());
  return CountedCall<vox_eng_InitParamBlock>(EngineFunction::kInitParamBlock, header);
}

uint32_t TEngine::EnumParamName(vox_EnumParamCallback callback, void* context) {
  return CountedCall<vox_eng_EnumParamName>(EngineFunction::kEnumParamName, callback, context);
}

uint32_t TEngine::SetParam(ParamBlock& block, const char* name, const char* value) {
  auto* header = reinterpret_cast<ParameterBlock*>(block.data());
  return CountedCall<vox_eng_SetParam>(EngineFunction::kSetParam, header, name, value);
}

uint32_t TEngine::ProcessGroup(vox_ThreadContext* context) {
  return CountedCall<vox_eng_ProcessGroup>(EngineFunction::kProcessGroup, context);
}

uint32_t TEngine::ProcessGroupMT(vox_ThreadContext* context) {
  return CountedCall<vox_eng_ProcessGroupMT>(EngineFunction::kProcessGroupMT, context);
}

uint32_t TEngine::ProcessOccupation(vox_ThreadContext* context) {
  return CountedCall<vox_eng_ProcessOccupation>(EngineFunction::kProcessOccupation, context);
}

uint32_t TEngine::BreakProcess() {
  return CountedCall<vox_eng_BreakProcess>(EngineFunction::kBreakProcess);
}

bool LoadEngineInto(std::unique_ptr<TEngine>& holder, const std::string& path) {
  holder.reset();
  holder = TEngine::Load(path);
  return holder != nullptr;
}

}  // namespace vox
