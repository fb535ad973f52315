// Result writing with 32 engine threads: each registers a thread writer, writes its records
// into its own temporary file, and is released, which merges its file into the job's result
// file. Measured from the first registration to the closed result file, side by side with a
// plain copy of the finished result file (read and write in 1 MB blocks), rounds interleaved.
// Both in wall time and in the CPU time they cost (all threads), which other processes on a
// shared machine do not disturb.
//
// Usage: vox_bench_results [--rounds N] [--records N]   (records per thread)
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include "bench_common.h"
#include "platform/platform.h"
#include "results/result_file.h"
#include "run/engine_threads.h"
#include "run/task.h"

namespace {

using voxbench::Clock;
constexpr int kThreads = 32;

struct Cost {
  double wall = 1e9;
  double cpu = 1e9;
  void Keep(const Cost& c) {
    wall = std::min(wall, c.wall);
    cpu = std::min(cpu, c.cpu);
  }
};

template <typename F>
Cost Measure(F&& f) {
  const double cpu = voxbench::ProcessCpuSeconds();
  const double wall = voxbench::Time(f);
  return {wall, voxbench::ProcessCpuSeconds() - cpu};
}

void WriteAndMerge(const std::string& path, int records) {
  vox::TTask task;
  task.result_file.set_path(path);
  task.result_file.Open();
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&task, t, records] {
      vox_ThreadContext context = vox::MakeThreadContext(task, 4, 1);
      vox::InitNewThread(task, &context);
      auto* writer = static_cast<vox::TResultFile*>(context.writer);
      uint8_t payload[100];
      for (int i = 0; i < records; ++i) {
        std::memset(payload, t + i, sizeof payload);
        writer->WriteRecord(vox::kKindVector, payload, sizeof payload);
      }
      vox::DeleteThread(task, &context);
      vox::platform::RestoreDefaultFloatingPointMode();
    });
  }
  for (std::thread& t : threads)
    t.join();
  task.result_file.Close();
}

void PlainCopy(const std::string& from, const std::string& to) {
  const int in = ::open(from.c_str(), O_RDONLY);
  const int out = ::open(to.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
  std::vector<char> block(1 << 20);
  for (ssize_t n; (n = ::read(in, block.data(), block.size())) > 0;)
    if (::write(out, block.data(), static_cast<size_t>(n)) != n) break;
  ::close(in);
  ::close(out);
}

}  // namespace

int main(int argc, char** argv) {
  int rounds = 5, records = 10000;
  for (int i = 1; i + 1 < argc; i += 2) {
    if (std::strcmp(argv[i], "--rounds") == 0) rounds = std::atoi(argv[i + 1]);
    if (std::strcmp(argv[i], "--records") == 0) records = std::atoi(argv[i + 1]);
  }
  const auto folder = std::filesystem::temp_directory_path();
  const std::string result =
      (folder / ("vox_bench_" + std::to_string(::getpid()) + ".res")).string();
  const std::string copy = result + ".copy";

  Cost write, plain;
  for (int r = 0; r < rounds; ++r) {
    write.Keep(Measure([&] { WriteAndMerge(result, records); }));
    plain.Keep(Measure([&] { PlainCopy(result, copy); }));
  }
  const double mb = std::filesystem::file_size(result) / 1e6;
  std::filesystem::remove(result);
  std::filesystem::remove(copy);
  const double ratio = plain.wall / write.wall, cpu_ratio = plain.cpu / write.cpu;
  std::printf(
      "result writing: %d threads x %d records, %.1f MB: %.0f MB/s (plain copy %.0f MB/s); "
      "in CPU time %.0f MB/s (plain copy %.0f MB/s, ratio %.2f)\n",
      kThreads, records, mb, mb / write.wall, mb / plain.wall, mb / write.cpu, mb / plain.cpu,
      cpu_ratio);
  voxbench::Row("result writing + merge, 32 threads",
                voxbench::Format("%.0f MB/s", mb / write.wall),
                voxbench::Format("plain copy %.0f MB/s", mb / plain.wall),
                voxbench::Format("%.2f", ratio), "ratio >= 0.5", ratio >= 0.5 ? "ok" : "MISS");
  return 0;
}
