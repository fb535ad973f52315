#include "base/engine_log.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

namespace vox {
namespace {

namespace fs = std::filesystem;

// Points TMPDIR at a fresh folder for the test and restores it afterwards.
class EngineLogTest : public ::testing::Test {
 protected:
  void SetUp() override {
    const char* old = std::getenv("TMPDIR");
    had_tmpdir_ = old != nullptr;
    if (old) old_tmpdir_ = old;
    root_ = fs::temp_directory_path() /
            ("vox_engine_log_" + std::to_string(::testing::UnitTest::GetInstance()->random_seed()) +
             "_" + ::testing::UnitTest::GetInstance()->current_test_info()->name());
    fs::remove_all(root_);
    fs::create_directories(root_);
    setenv("TMPDIR", root_.c_str(), 1);
  }
  void TearDown() override {
    CloseEngineLog();
    SetMessagePump(nullptr);
    if (had_tmpdir_)
      setenv("TMPDIR", old_tmpdir_.c_str(), 1);
    else
      unsetenv("TMPDIR");
    fs::remove_all(root_);
  }

  std::vector<fs::path> FilesUnder(const fs::path& folder) const {
    std::vector<fs::path> files;
    for (const auto& entry : fs::recursive_directory_iterator(folder))
      if (entry.is_regular_file()) files.push_back(entry.path());
    return files;
  }

  static std::string Read(const fs::path& path) {
    std::ifstream in(path, std::ios::binary);
    std::stringstream text;
    text << in.rdbuf();
    std::string bytes = text.str();
#ifdef _WIN32
    // The log is a text file: on Windows every line feed reaches the file as CR LF.
    EXPECT_EQ(bytes.find("\r\r"), std::string::npos);
    std::erase(bytes, '\r');
#endif
    return bytes;
  }

  fs::path root_;
  std::string old_tmpdir_;
  bool had_tmpdir_ = false;
};

TEST_F(EngineLogTest, WithoutEngineFolderNothingIsCreatedAndTracingWorks) {
  const std::string path = OpenEngineLog();
  EXPECT_FALSE(path.empty());
  EXPECT_FALSE(fs::exists(root_ / "engine"));
  Trace("open vector stream\n");
  Trace(nullptr);
  EXPECT_EQ(Message(0, "hello"), 1);
  CloseEngineLog();
  EXPECT_TRUE(FilesUnder(root_).empty());
  Trace("after close %d\n", 1);  // a no-op, not a crash
  EXPECT_FALSE(EngineLogIsOpen());
}

TEST_F(EngineLogTest, EachOpenCreatesOneOutFileWithTheTracedText) {
  fs::create_directory(root_ / "engine");
  const std::string first = OpenEngineLog();
  EXPECT_TRUE(EngineLogIsOpen());
  Trace("line %d\n", 1);
  int pumped = 0;
  static int* counter = nullptr;
  counter = &pumped;
  SetMessagePump([] { ++*counter; });
  Message(2, "a message");
  EXPECT_EQ(pumped, 1);

  const std::string second = OpenEngineLog();  // closes the first
  Trace("second log");
  CloseEngineLog();

  EXPECT_NE(first, second);
  const auto files = FilesUnder(root_ / "engine");
  ASSERT_EQ(files.size(), 2u);
  for (const auto& file : files) {
    EXPECT_EQ(file.filename().string().rfind("OUT", 0), 0u) << file;
    EXPECT_EQ(file.extension(), ".tmp");
  }
  EXPECT_EQ(Read(first), "line 1\na message\n");
  EXPECT_EQ(Read(second), "second log");
}

TEST_F(EngineLogTest, SideLogLeavesTheRunningLogAlone) {
  fs::create_directory(root_ / "engine");
  const std::string running = OpenEngineLog();
  std::string side_path;
  FILE* side = OpenSideLog(&side_path);
  ASSERT_NE(side, nullptr);
  std::fputs("Program is busy\n", side);
  std::fclose(side);
  Trace("still running\n");
  CloseEngineLog();
  EXPECT_NE(side_path, running);
  EXPECT_EQ(Read(side_path), "Program is busy\n");
  EXPECT_EQ(Read(running), "still running\n");
  EXPECT_EQ(FilesUnder(root_ / "engine").size(), 2u);
}

TEST_F(EngineLogTest, ReplacingTheLogWhileThreadsTraceLosesNoWholeLine) {
  fs::create_directory(root_ / "engine");
  std::vector<std::string> paths{OpenEngineLog()};
  std::atomic<bool> stop{false};
  std::vector<std::thread> writers;
  for (int t = 0; t < 3; ++t)
    writers.emplace_back([&stop, t] {
      while (!stop.load())
        Trace("thread %d writes a line\n", t);
    });
  for (int i = 0; i < 20; ++i)
    paths.push_back(OpenEngineLog());
  stop = true;
  for (auto& w : writers)
    w.join();
  CloseEngineLog();
  for (const auto& path : paths) {
    std::istringstream lines(Read(path));
    for (std::string line; std::getline(lines, line);)
      ASSERT_EQ(line.rfind("thread ", 0), 0u) << path << ": " << line;
  }
}

}  // namespace
}  // namespace vox
