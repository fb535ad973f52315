// The probe engine's report: a text file written line by line. Threads write through the same
// file; each line is one stdio call, which stdio locks.
#pragma once

#include <cstdarg>
#include <cstdio>

namespace probe {

class Output {
 public:
  explicit Output(const char* path) : file_(*path != '\0' ? std::fopen(path, "w") : nullptr) {}
  ~Output() {
    if (file_ != nullptr) std::fclose(file_);
  }
  Output(const Output&) = delete;
  Output& operator=(const Output&) = delete;

  void Line(const char* format, ...)
#if defined(__GNUC__)
      __attribute__((format(printf, 2, 3)))
#endif
  {
    if (file_ == nullptr) return;
    char text[2048];
    va_list args;
    va_start(args, format);
    std::vsnprintf(text, sizeof(text), format, args);
    va_end(args);
    std::fprintf(file_, "%s\n", text);
    std::fflush(file_);
  }

 private:
  FILE* file_;
};

}  // namespace probe
