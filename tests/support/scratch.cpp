#include "support/scratch.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <sstream>

#ifdef _WIN32
#include <random>
#endif

namespace fs = std::filesystem;

namespace vox::test {

namespace {

#ifdef _WIN32
// Windows has no mkdtemp and no setenv, and takes its temporary folder from TMP and TEMP.
fs::path MakeUniqueFolder() {
  std::random_device seed;
  for (int attempt = 0; attempt < 100; ++attempt) {
    fs::path candidate = fs::temp_directory_path() / ("vox-test-" + std::to_string(seed()));
    if (fs::create_directory(candidate)) return candidate;
  }
  throw std::runtime_error("no unique scratch folder");
}
void SetTempFolder(const char* value) {
  _putenv_s("TMP", value != nullptr ? value : "");
  _putenv_s("TEMP", value != nullptr ? value : "");
}
const char* kTempVariable = "TMP";
#else
fs::path MakeUniqueFolder() {
  std::string pattern = (fs::temp_directory_path() / "vox-test-XXXXXX").string();
  if (mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
  return pattern;
}
void SetTempFolder(const char* value) {
  if (value != nullptr)
    setenv("TMPDIR", value, 1);
  else
    unsetenv("TMPDIR");
}
const char* kTempVariable = "TMPDIR";
#endif

}  // namespace

ScratchDir::ScratchDir() : path_(MakeUniqueFolder()) {}

ScratchDir::~ScratchDir() {
  std::error_code ignored;
  fs::remove_all(path_, ignored);
}

std::string ScratchDir::File(const std::string& name) const {
  return (path_ / name).string();
}

std::string WriteFile(const std::string& path, const std::string& text) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out << text;
  return path;
}

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) {
    if (!line.empty() && line.back() == '\r') line.pop_back();
    lines.push_back(line);
  }
  return lines;
}

std::vector<std::string> FileLines(const std::string& path) {
  return Lines(ReadFile(path));
}

std::string JobText(const std::string& name, const std::string& result_path,
                    const std::string& extra_lines) {
  return "[JOB]\nName=" + name + "\nResultPath=" + result_path + "\n" + extra_lines;
}

TempDirEnv::TempDirEnv(const ScratchDir& scratch, bool with_engine_folder)
    : temp_(scratch.path() / "tmp") {
  fs::create_directories(temp_);
  if (with_engine_folder) fs::create_directories(temp_ / "engine");
  if (const char* old = std::getenv(kTempVariable)) previous_ = old;
  SetTempFolder(temp_.string().c_str());
}

TempDirEnv::~TempDirEnv() {
  SetTempFolder(previous_ ? previous_->c_str() : nullptr);
}

namespace {

std::vector<std::string> FilesWithPrefix(const fs::path& folder, const std::string& prefix) {
  std::vector<std::pair<fs::file_time_type, std::string>> found;
  std::error_code error;
  for (const auto& entry : fs::directory_iterator(folder, error)) {
    const std::string name = entry.path().filename().string();
    if (entry.is_regular_file() && name.rfind(prefix, 0) == 0)
      found.emplace_back(entry.last_write_time(), entry.path().string());
  }
  std::sort(found.begin(), found.end());
  std::vector<std::string> paths;
  for (auto& f : found)
    paths.push_back(std::move(f.second));
  return paths;
}

}  // namespace

std::vector<std::string> TempDirEnv::EngineLogs() const {
  return FilesWithPrefix(engine_folder(), "OUT");
}

std::vector<std::string> TempDirEnv::EngineLogTexts() const {
  std::vector<std::string> texts;
  for (const std::string& path : EngineLogs()) {
    texts.push_back(ReadFile(path));
#ifdef _WIN32
    // The engine log is a text file: Windows writes each line feed as CR LF.
    std::erase(texts.back(), '\r');
#endif
  }
  return texts;
}

std::vector<std::string> TempDirEnv::TempFiles(const std::string& prefix) const {
  return FilesWithPrefix(temp_, prefix);
}

std::vector<ResultRecord> ReadResultRecords(const std::string& path) {
  const std::string bytes = ReadFile(path);
  const auto* data = reinterpret_cast<const uint8_t*>(bytes.data());
  std::vector<ResultRecord> records;
  size_t at = 0;
  while (bytes.size() - at >= 5) {
    const size_t length = static_cast<size_t>(data[at + 1] | (data[at + 2] << 8));
    if (length < 5 || length > bytes.size() - at) break;
    if (static_cast<size_t>(data[at + length - 2] | (data[at + length - 1] << 8)) != length) break;
    records.push_back({data[at], std::vector<uint8_t>(data + at + 3, data + at + length - 2)});
    at += length;
  }
  return records;
}

std::string MessageText(const ResultRecord& record) {
  if (record.kind != 29 || record.payload.size() < 9) return {};
  const size_t n = record.payload[8];
  if (record.payload.size() < 9 + n) return {};
  return std::string(record.payload.begin() + 9, record.payload.begin() + 9 + n);
}

}  // namespace vox::test
