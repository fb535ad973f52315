// What every benchmark shares: timing, and the one line per figure that scripts/bench.sh
// gathers into the table. Each figure is measured side by side with its reference in the
// same run, rounds interleaved, so that the machine's noise moves both alike.
#pragma once

#include <time.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

namespace voxbench {

using Clock = std::chrono::steady_clock;

inline double Seconds(Clock::duration d) {
  return std::chrono::duration<double>(d).count();
}

template <typename F>
double Time(F&& f) {
  const auto start = Clock::now();
  f();
  return Seconds(Clock::now() - start);
}

// CPU time of the calling thread. Single-threaded figures are taken in it, so that other
// processes sharing the machine do not count against the code measured (a short reference
// fits in one time slice, a longer measurement does not, which would skew their ratio).
inline double ThreadCpuSeconds() {
  timespec t{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &t);
  return static_cast<double>(t.tv_sec) + t.tv_nsec * 1e-9;
}

// CPU time of the whole process (all threads).
inline double ProcessCpuSeconds() {
  timespec t{};
  clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &t);
  return static_cast<double>(t.tv_sec) + t.tv_nsec * 1e-9;
}

inline double Median(std::vector<double> v) {
  if (v.empty()) return 0;
  std::sort(v.begin(), v.end());
  const size_t n = v.size();
  return n % 2 ? v[n / 2] : (v[n / 2 - 1] + v[n / 2]) / 2;
}

// One row of the table: "row<TAB>benchmark<TAB>figure<TAB>reference<TAB>ratio<TAB>target<TAB>
// verdict". The verdict is "ok" or "MISS"; "n/a" when the figure could not be measured.
inline void Row(const std::string& name, const std::string& figure, const std::string& reference,
                const std::string& ratio, const std::string& target, const char* verdict) {
  std::printf("row\t%s\t%s\t%s\t%s\t%s\t%s\n", name.c_str(), figure.c_str(), reference.c_str(),
              ratio.c_str(), target.c_str(), verdict);
  std::fflush(stdout);
}

inline std::string Format(const char* format, double value) {
  char text[64];
  std::snprintf(text, sizeof text, format, value);
  return text;
}

}  // namespace voxbench
