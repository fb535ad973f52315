// Temporary raw files for the raw room's tests: each test writes the bytes a RawWriter built
// and reads them back through the library's own file object.
#pragma once

#include <unistd.h>
#include <atomic>
#include <filesystem>
#include <string>

#include "raw_writer.h"

namespace vox::test {

class TempRawFile {
 public:
  explicit TempRawFile(const voxtools::RawWriter& w) : TempRawFile(w.bytes()) {}
  explicit TempRawFile(const std::vector<uint8_t>& bytes) {
    static std::atomic<int> counter{0};
    path_ =
        (std::filesystem::temp_directory_path() /
         ("vox_raw_test_" + std::to_string(::getpid()) + "_" + std::to_string(counter++) + ".bin"))
            .string();
    voxtools::RawWriter copy;
    copy.Bytes(bytes);
    copy.Save(path_);
  }
  ~TempRawFile() { std::filesystem::remove(path_); }
  TempRawFile(const TempRawFile&) = delete;
  TempRawFile& operator=(const TempRawFile&) = delete;
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

}  // namespace vox::test
