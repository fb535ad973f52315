// Whole jobs through libvox.so:
//  - the round trip of a job with no files and no engine step, from RunProcessAndWait to the
//    exit code arriving at the host callback (median), beside the least such a job must do:
//    start and join a thread and write a small file;
//  - the multi-threaded raw filter on a CPU-bound filter (bench_engine.cpp) over eight
//    occupations, NumCPUs=2 against NumCPUs=1, rounds interleaved.
//
// Usage: vox_bench_job [--rounds N]
#include <unistd.h>

#include <atomic>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "bench_common.h"
#include "raw_writer.h"
#include "vox/vox_host.h"

namespace {

namespace fs = std::filesystem;
using voxbench::Clock;

std::atomic<int64_t> g_exit_at{0};  // steady clock ticks when the exit code arrived
std::atomic<uint32_t> g_exit_code{0xFFFFFFFFu};

void VOX_CALL Callback(void*, uint32_t code, uint32_t value) {
  if (code != VOX_CALLBACK_EXIT_CODE) return;
  g_exit_code.store(value);
  g_exit_at.store(Clock::now().time_since_epoch().count());
}

void Write(const fs::path& path, const std::string& text) {
  std::ofstream(path, std::ios::binary) << text;
}

// Runs the job file and returns the seconds until its exit code reached the callback.
double RoundTrip(const std::string& job) {
  g_exit_at.store(0);
  const auto start = Clock::now();
  RunProcessAndWait(job.c_str());
  while (g_exit_at.load() == 0)
    std::this_thread::yield();
  return voxbench::Seconds(Clock::duration(g_exit_at.load()) - start.time_since_epoch());
}

double ThreadAndFile(const fs::path& path) {
  return voxbench::Time([&] {
    std::thread t([&] { Write(path, std::string(64, 'x')); });
    t.join();
  });
}

std::string ScalingJob(const fs::path& folder, int cpus) {
  std::string text = "[JOB]\nName=Scaling\nType=0\nRunRawFilterOnly=1\nResultPath=" +
                     (folder / "scaling.res").string() +
                     "\nRawfiltPath=" VOX_BENCH_ENGINE "\nNumCPUs=" + std::to_string(cpus) +
                     "\nNumFiles=8\nNumOccups=8\n";
  for (int i = 1; i <= 8; ++i) {
    text += "[FILE:" + std::to_string(i) + "]\nName=" + (folder / "site.raw").string() + "\n";
    text += "[OCCUP:" + std::to_string(i) + "]\nName=O" + std::to_string(i) +
            "\nFile=" + std::to_string(i) + "\n";
  }
  const fs::path path = folder / ("scaling" + std::to_string(cpus) + ".job");
  Write(path, text);
  return path.string();
}

}  // namespace

int main(int argc, char** argv) {
  int rounds = 3;
  for (int i = 1; i + 1 < argc; i += 2)
    if (std::strcmp(argv[i], "--rounds") == 0) rounds = std::atoi(argv[i + 1]);
  const fs::path folder = fs::temp_directory_path() / ("vox_bench_job_" + std::to_string(getpid()));
  fs::create_directories(folder);

  // The callback stays registered for the process once set on any handle.
  Write(folder / "noop.job",
        "[JOB]\nName=Noop\nResultPath=" + (folder / "noop.res").string() + "\n");
  const std::string noop = (folder / "noop.job").string();
  vox_HostCallbackPair pair{Callback, nullptr};
  vox_ControlHandle first = RunProcess(noop.c_str());
  SendEngineControl(first, VOX_CMD_SET_CALLBACK, reinterpret_cast<uintptr_t>(&pair));
  while (g_exit_at.load() == 0)
    std::this_thread::yield();

  std::vector<double> trips, floors;
  for (int i = 0; i < 50; ++i) {
    trips.push_back(RoundTrip(noop));
    floors.push_back(ThreadAndFile(folder / "floor.bin"));
  }
  const double trip_ms = voxbench::Median(trips) * 1e3, floor_ms = voxbench::Median(floors) * 1e3;
  std::printf("job round trip: median %.3f ms (exit code %u); thread + small file %.3f ms\n",
              trip_ms, g_exit_code.load(), floor_ms);
  voxbench::Row("job round trip, no-op job", voxbench::Format("%.2f ms median", trip_ms),
                voxbench::Format("thread + file %.2f ms", floor_ms),
                voxbench::Format("%.2f", floor_ms / trip_ms), "<= 2 ms",
                g_exit_code.load() == 0 && trip_ms <= 2.0 ? "ok" : "MISS");

  // The raw filter over eight occupations of one small file.
  voxtools::RawWriter w;
  w.Header().TimeRef("GPS", {0, 13204}, {}, 17);
  for (uint32_t s = 0; s < 10; ++s) {
    voxtools::RawSatellite sat{voxtools::SatCode51('G', 1), 0, 0, {}};
    sat.signals.push_back(voxtools::RawSignal::Tag51(16, 2.0e7 + s, 1.0e8 + s));
    w.Epoch(51, s * 1000, {sat});
  }
  w.EndOfData();
  w.Save((folder / "site.raw").string());
  const std::string calls = (folder / "calls.txt").string();
  setenv("VOX_BENCH_CALLS", calls.c_str(), 1);
  const std::string one = ScalingJob(folder, 1), two = ScalingJob(folder, 2);
  double best1 = 1e9, best2 = 1e9;
  for (int r = 0; r < rounds; ++r) {
    best1 = std::min(best1, voxbench::Time([&] { RunProcessAndWait(one.c_str()); }));
    best2 = std::min(best2, voxbench::Time([&] { RunProcessAndWait(two.c_str()); }));
  }
  const bool called = fs::exists(calls) && fs::file_size(calls) == 16u * rounds;
  const double speedup = best1 / best2;
  std::printf("raw filter, 8 occupations: NumCPUs=1 %.3f s, NumCPUs=2 %.3f s, speed-up %.2f%s\n",
              best1, best2, speedup, called ? "" : " (the raw filter was not called every time)");
  if (called) {
    voxbench::Row("raw filter, NumCPUs 2 vs 1", voxbench::Format("%.3f s", best2),
                  voxbench::Format("NumCPUs=1 %.3f s", best1), voxbench::Format("%.2f", speedup),
                  "speed-up >= 1.8 (2 cores)", speedup >= 1.8 ? "ok" : "MISS");
  } else {
    voxbench::Row("raw filter, NumCPUs 2 vs 1", "-", "-", "-", "speed-up >= 1.8 (2 cores)",
                  "n/a (raw filter not scheduled)");
  }
  fs::remove_all(folder);
  return 0;
}
