// Helpers shared by the tests: scratch folders, job files, an engine-log folder under a
// private TMPDIR, and a plain reader of result files.
//
// They use the standard library alone, so that tests linked with the shared library (the
// public API) and tests linked with the library's internals can both use them.
#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace vox::test {

// A new empty folder under the system's temporary folder, removed with everything in it when
// the object goes.
class ScratchDir {
 public:
  ScratchDir();
  ~ScratchDir();
  ScratchDir(const ScratchDir&) = delete;
  ScratchDir& operator=(const ScratchDir&) = delete;

  const std::filesystem::path& path() const { return path_; }
  // path() / name as a string.
  std::string File(const std::string& name) const;

 private:
  std::filesystem::path path_;
};

// Writes text to path exactly as given (no line-end conversion); returns path.
std::string WriteFile(const std::string& path, const std::string& text);
std::string ReadFile(const std::string& path);
// The lines of a text without their line ends (a CR before a line feed goes too).
std::vector<std::string> Lines(const std::string& text);
// The lines of the file at path (none when it cannot be read).
std::vector<std::string> FileLines(const std::string& path);

// A job file with one [JOB] section: Name, ResultPath and any extra lines ("Key=Value\n"...).
std::string JobText(const std::string& name, const std::string& result_path,
                    const std::string& extra_lines = "");

// Points TMPDIR at a folder of the scratch folder for the object's lifetime (restoring the
// previous value afterwards); with_engine_folder creates the "engine" folder in it, which
// switches the engine log on.
class TempDirEnv {
 public:
  TempDirEnv(const ScratchDir& scratch, bool with_engine_folder);
  ~TempDirEnv();
  TempDirEnv(const TempDirEnv&) = delete;
  TempDirEnv& operator=(const TempDirEnv&) = delete;

  const std::filesystem::path& temp_folder() const { return temp_; }
  std::filesystem::path engine_folder() const { return temp_ / "engine"; }
  // Paths of the engine log files ("OUT" prefix), oldest first by name of creation order.
  std::vector<std::string> EngineLogs() const;
  // Every engine log's text, in creation order.
  std::vector<std::string> EngineLogTexts() const;
  // Files in the temporary folder itself whose name starts with prefix.
  std::vector<std::string> TempFiles(const std::string& prefix) const;

 private:
  std::filesystem::path temp_;
  std::optional<std::string> previous_;
};

// One record of a result file.
struct ResultRecord {
  uint8_t kind = 0;
  std::vector<uint8_t> payload;
};
// Walks a result file's records; stops at the first record whose framing is broken.
std::vector<ResultRecord> ReadResultRecords(const std::string& path);
// The text of a message record (kind 29); empty for any other record.
std::string MessageText(const ResultRecord& record);

}  // namespace vox::test
