// The fuzz targets hand most of their input to readers that open files by path, so each input
// goes through a file of its own process (in memory where /dev/shm exists), rewritten for
// every input.
#pragma once

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <string>

namespace voxfuzz {

class InputFile {
 public:
  explicit InputFile(const char* name) {
    const char* folder = access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp";
    path_ = std::string(folder) + "/vox_fuzz_" + std::to_string(getpid()) + "_" + name;
  }
  ~InputFile() { std::remove(path_.c_str()); }
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  // Replaces the file's content; false when it cannot be written (the input is then skipped).
  bool Write(const uint8_t* data, size_t size) const {
    FILE* f = std::fopen(path_.c_str(), "wb");
    if (f == nullptr) return false;
    const bool ok = size == 0 || std::fwrite(data, 1, size, f) == size;
    return std::fclose(f) == 0 && ok;
  }
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

}  // namespace voxfuzz
