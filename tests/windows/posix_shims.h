// Forced into every test program of the Windows build: the few POSIX calls the shared tests
// use to point the library at a scratch temporary folder. TMPDIR is the POSIX layer's
// temporary folder; the Windows layer takes it from TMP (and TEMP), so setting one sets all.
#pragma once
#ifdef __cplusplus
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <random>
#include <string>

// The temporary folder the program started with, put back when TMPDIR is unset.
inline const std::string& StartingTempFolder() {
  static const std::string folder = [] {
    const char* tmp = std::getenv("TMP");
    return std::string(tmp != nullptr ? tmp : "");
  }();
  return folder;
}

inline int setenv(const char* name, const char* value, int overwrite) {
  if (!overwrite && std::getenv(name) != nullptr) return 0;
  if (std::strcmp(name, "TMPDIR") == 0) {
    StartingTempFolder();
    _putenv_s("TMP", value);
    _putenv_s("TEMP", value);
  }
  _putenv_s(name, value);
  return 0;
}

// std::filesystem::path::c_str() gives wide characters on Windows.
inline int setenv(const char* name, const wchar_t* value, int overwrite) {
  return setenv(name, std::filesystem::path(value).string().c_str(), overwrite);
}

inline int unsetenv(const char* name) {
  if (std::strcmp(name, "TMPDIR") == 0 && !StartingTempFolder().empty()) {
    _putenv_s("TMP", StartingTempFolder().c_str());
    _putenv_s("TEMP", StartingTempFolder().c_str());
  }
  _putenv_s(name, "");
  return 0;
}

// Replaces the trailing XXXXXX of pattern by a unique name and creates that folder.
inline char* mkdtemp(char* pattern) {
  const size_t length = std::strlen(pattern);
  if (length < 6) return nullptr;
  std::random_device seed;
  for (int attempt = 0; attempt < 100; ++attempt) {
    std::string digits = std::to_string(seed() % 900000 + 100000);
    std::memcpy(pattern + length - 6, digits.data(), 6);
    std::error_code error;
    if (std::filesystem::create_directory(pattern, error)) return pattern;
  }
  return nullptr;
}
#endif
