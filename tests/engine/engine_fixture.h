// A scratch world for engine tests: a temporary folder holding an "engine" folder, so that the
// engine log is really written there, and a record file the test engines append to.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "base/engine_log.h"

namespace vox::testing {

class EngineFixture : public ::testing::Test {
 protected:
  void SetUp() override {
    const char* previous = std::getenv("TMPDIR");
    had_tmpdir_ = previous != nullptr;
    if (had_tmpdir_) previous_tmpdir_ = previous;
    scratch_ = std::filesystem::temp_directory_path() /
               ("vox_engine_test_" + std::to_string(std::random_device{}()) + "_" +
                ::testing::UnitTest::GetInstance()->current_test_info()->name());
    std::filesystem::remove_all(scratch_);
    std::filesystem::create_directories(scratch_ / "engine");
    ::setenv("TMPDIR", (scratch_.string() + "/").c_str(), 1);
    ::setenv("VOX_TEST_RECORD", RecordPath().c_str(), 1);
    ::unsetenv("VOX_TEST_BLOCK_SIZE");
    ::unsetenv("VOX_TEST_PARAM_NAMES");
    log_path_ = OpenEngineLog();
  }

  void TearDown() override {
    CloseEngineLog();
    if (had_tmpdir_) {
      ::setenv("TMPDIR", previous_tmpdir_.c_str(), 1);
    } else {
      ::unsetenv("TMPDIR");
    }
    ::unsetenv("VOX_TEST_RECORD");
    std::filesystem::remove_all(scratch_);
  }

  static std::string EngineFile(const std::string& name) {
    return std::string(VOX_TEST_ENGINE_DIR) + "/" + name;
  }
  std::string RecordPath() const { return (scratch_ / "record.txt").string(); }
  const std::filesystem::path& scratch() const { return scratch_; }

  // Closes the engine log and returns its lines; call once, at the end of a test.
  std::vector<std::string> LogLines() {
    CloseEngineLog();
    return ReadLines(log_path_);
  }
  std::vector<std::string> RecordLines() const { return ReadLines(RecordPath()); }

  static std::vector<std::string> ReadLines(const std::string& path) {
    std::ifstream in(path);
    std::vector<std::string> lines;
    for (std::string line; std::getline(in, line);)
      lines.push_back(line);
    return lines;
  }

 private:
  std::filesystem::path scratch_;
  std::string log_path_;
  std::string previous_tmpdir_;
  bool had_tmpdir_ = false;
};

}  // namespace vox::testing
