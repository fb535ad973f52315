// TEngine: one loaded engine library, its table of _eng_* functions and its use count.
//
// An engine is loaded from a completed path (the job room's ResolveModulePath has already
// put bare names beside this library). Loading never throws: every failure, including an
// exception raised by the engine's own initialisation or version function, leaves an engine
// whose loaded() is false, after two lines in the engine log. A library that was mapped but
// failed a check stays mapped until its TEngine is destroyed, which writes "<file>: unload".
//
// Threads: loading and destruction happen on the job thread. The counted calls may come from
// the job thread and from the run room's worker threads at once; the use count is atomic but
// is bookkeeping only, it never decides the engine's lifetime (its owner does).
//
// The counted calls do not catch what an engine throws: the run room calls the processing
// functions under its own guard.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include "engine/engine_functions.h"
#include "vox/vox_sdk_engine.h"

namespace vox {

class ParamBlock;

namespace platform {
struct Library;
}

class TEngine {
 public:
  // Creates a TEngine for path and tries to load it (see the header comment). Never null.
  static std::unique_ptr<TEngine> Load(const std::string& path);
  ~TEngine();
  TEngine(const TEngine&) = delete;
  TEngine& operator=(const TEngine&) = delete;

  // Loaded, and every check passed: the engine may be called.
  bool loaded() const { return loaded_; }
  // The library is mapped (loaded() or not).
  bool mapped() const { return library_ != nullptr; }
  const std::string& file_name() const { return file_name_; }
  uint32_t use_count() const { return use_count_.load(std::memory_order_relaxed); }

  void AddRef() { use_count_.fetch_add(1, std::memory_order_relaxed); }
  void Release() { use_count_.fetch_sub(1, std::memory_order_relaxed); }

  // The resolved address of a table function, null when the library does not export it.
  void* function(EngineFunction f) const { return table_[static_cast<size_t>(f)]; }
  // True when the engine is loaded and exports f.
  bool Exports(EngineFunction f) const { return loaded_ && function(f) != nullptr; }

  // Counted calls: each holds a reference for its duration and yields 0 when the engine is
  // not loaded or does not export the function.
  uint32_t GetParamBlockSize();
  uint32_t InitParamBlock(ParamBlock& block);
  uint32_t EnumParamName(vox_EnumParamCallback callback, void* context);
  uint32_t SetParam(ParamBlock& block, const char* name, const char* value);
  uint32_t ProcessGroup(vox_ThreadContext* context);
  uint32_t ProcessGroupMT(vox_ThreadContext* context);
  uint32_t ProcessOccupation(vox_ThreadContext* context);
  uint32_t BreakProcess();

 private:
  explicit TEngine(std::string path) : file_name_(std::move(path)) {}

  // Maps the library, resolves the table, checks it, initialises the engine and checks its
  // version; throws xmsg with the failure text.
  void Open();
  void ResolveTable();
  void CheckRequiredFunctions() const;
  void InitialiseEngine() const;
  void CheckVersion() const;
  void ReportFailure(const std::string& error) const;
  void* Resolve(const char* name) const;

  template <typename Fn, typename... Args>
  uint32_t CountedCall(EngineFunction f, Args... args);

  platform::Library* library_ = nullptr;  // the module handle; null when loading failed
  std::atomic<uint32_t> use_count_{1};
  bool loaded_ = false;
  std::string file_name_;
  std::array<void*, kEngineFunctionCount> table_{};
  void* init_engine_ = nullptr;
  void* init_engine_dll_ = nullptr;
};

// Holds a counted reference to an engine for the life of the object (no-op for null).
class EngineRef {
 public:
  explicit EngineRef(TEngine* engine) : engine_(engine) {
    if (engine_) engine_->AddRef();
  }
  ~EngineRef() {
    if (engine_) engine_->Release();
  }
  EngineRef(const EngineRef&) = delete;
  EngineRef& operator=(const EngineRef&) = delete;

  TEngine* get() const { return engine_; }
  TEngine* operator->() const { return engine_; }
  bool loaded() const { return engine_ && engine_->loaded(); }

 private:
  TEngine* engine_;
};

// Load into holder: destroys the engine the holder has (with its unload line), then loads a
// new one from path and stores it. True when a TEngine was created, which is always; its
// loaded() tells whether it is usable.
bool LoadEngineInto(std::unique_ptr<TEngine>& holder, const std::string& path);

// What _eng_InitEngine receives: an opaque handle of this library, stable for the life of
// the process. On POSIX it is the address of this library's own path as a zero-terminated
// string (there is no module instance to hand over).
void* EngineModuleInstance();

}  // namespace vox
