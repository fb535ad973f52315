// Small helpers shared by the result room's tests.
#pragma once

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "base/le.h"

namespace vox::test {

inline std::vector<uint8_t> ReadBytes(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

inline void WriteBytes(const std::string& path, const std::vector<uint8_t>& bytes) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out.write(reinterpret_cast<const char*>(bytes.data()),
            static_cast<std::streamsize>(bytes.size()));
}

// A fresh path in the test's temporary folder, removed again by the fixture's owner.
inline std::string TempPath(const std::string& name) {
  const auto* info = testing::UnitTest::GetInstance()->current_test_info();
  std::filesystem::path dir = std::filesystem::temp_directory_path() / "vox_results_tests";
  std::filesystem::create_directories(dir);
  return (dir / (std::string(info->test_suite_name()) + "_" + info->name() + "_" + name)).string();
}

// One framed record found in a file's bytes.
struct RawRecord {
  uint8_t kind;
  std::vector<uint8_t> payload;
};

// Splits well-formed file bytes into records; fails the test on a framing error.
inline std::vector<RawRecord> SplitRecords(const std::vector<uint8_t>& bytes) {
  std::vector<RawRecord> out;
  size_t at = 0;
  while (at < bytes.size()) {
    if (bytes.size() - at < 5) {
      ADD_FAILURE() << "trailing bytes at " << at;
      break;
    }
    const uint16_t length = le::Load<uint16_t>(&bytes[at + 1]);
    if (length < 5 || length > bytes.size() - at ||
        le::Load<uint16_t>(&bytes[at + length - 2]) != length) {
      ADD_FAILURE() << "bad framing at " << at;
      break;
    }
    out.push_back({bytes[at], {bytes.begin() + at + 3, bytes.begin() + at + length - 2}});
    at += length;
  }
  return out;
}

template <typename T>
T At(const std::vector<uint8_t>& payload, size_t offset) {
  EXPECT_LE(offset + sizeof(T), payload.size());
  if (offset + sizeof(T) > payload.size()) return T{};
  return le::Load<T>(payload.data() + offset);
}

}  // namespace vox::test
