// Captures the engine log of a test: points the temporary folder at a fresh folder holding
// an "engine" folder, so that the library's own log opening writes a file there, and reads
// that file back.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>
#include <string>

#include "base/engine_log.h"

namespace vox::testing {

class TraceCapture {
 public:
  TraceCapture() {
    const char* old = std::getenv("TMPDIR");
    had_old_ = old != nullptr;
    if (had_old_) old_ = old;
    folder_ = std::filesystem::temp_directory_path() /
              ("vox_job_trace_" + std::to_string(std::random_device{}()) + "_" +
               std::to_string(++count_));
    std::filesystem::create_directories(folder_ / "engine");
    ::setenv("TMPDIR", folder_.c_str(), 1);
    path_ = OpenEngineLog();
  }
  ~TraceCapture() {
    CloseEngineLog();
    if (had_old_) {
      ::setenv("TMPDIR", old_.c_str(), 1);
    } else {
      ::unsetenv("TMPDIR");
    }
    std::error_code ignored;
    std::filesystem::remove_all(folder_, ignored);
  }
  TraceCapture(const TraceCapture&) = delete;
  TraceCapture& operator=(const TraceCapture&) = delete;

  // Everything traced since the capture began (closes the log).
  std::string Text() {
    CloseEngineLog();
    std::ifstream in(path_);
    std::stringstream text;
    text << in.rdbuf();
    return text.str();
  }

 private:
  static inline int count_ = 0;
  std::filesystem::path folder_;
  std::string path_;
  std::string old_;
  bool had_old_ = false;
};

}  // namespace vox::testing
