// Scan throughput: a one-day 1 Hz raw file (36 satellites of four systems, three signals
// each, tag-51 epochs) scanned by the library, side by side with a plain sequential read of
// the same bytes (map the file, sum its words). Prints MB/s and epochs/s of both and their
// ratio. Times are the thread's CPU time (see bench_common.h). Then the epoch stream over the same
// file (every epoch and every satellite record of one occupation), against the same plain read.
//
// Usage: vox_bench_scan [--keep PATH] [--rounds N]
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "bench_common.h"
#include "job/items.h"
#include "raw/ephemeris_store.h"
#include "raw/epoch_stream.h"
#include "raw/meteo_track.h"
#include "raw/precise_store.h"
#include "raw/scan.h"
#include "raw_writer.h"

namespace {

using Clock = std::chrono::steady_clock;
constexpr uint32_t kEpochs = 86400;
constexpr uint32_t kDay = 12000;

// 12 GPS, 8 GLONASS, 8 GALILEO, 8 BDS, each with three signals (code and phase).
std::vector<voxtools::RawSatellite> Satellites(uint32_t epoch) {
  using voxtools::RawSignal;
  struct Sys {
    char letter;
    unsigned count;
    uint8_t signals[3];
  };
  const Sys systems[] = {{'G', 12, {16, 20, 36}},
                         {'R', 8, {16, 17, 34}},
                         {'E', 8, {18, 82, 98}},
                         {'C', 8, {33, 34, 114}}};
  std::vector<voxtools::RawSatellite> sats;
  for (const Sys& s : systems) {
    for (unsigned n = 1; n <= s.count; ++n) {
      voxtools::RawSatellite sat{voxtools::SatCode51(s.letter, n), 40, 1, {}};
      for (int k = 0; k < 3; ++k) {
        const double range = 2.0e7 + n * 1000.0 + epoch * 0.8 + k;
        sat.signals.push_back(RawSignal::Tag51(s.signals[k], range, range / 0.19 + 0.25 * k));
      }
      sats.push_back(std::move(sat));
    }
  }
  return sats;
}

void WriteDay(const std::string& path) {
  voxtools::RawWriter w;
  w.Header().Receiver("bench", "", "0001", "Bench", "1.0").TimeRef("GPS", {0, kDay}, {}, 18);
  for (uint32_t e = 0; e < kEpochs; ++e)
    w.Epoch(51, e * 1000, Satellites(e));
  w.EndOfData();
  w.Save(path);
}

double Seconds(Clock::duration d) {
  return std::chrono::duration<double>(d).count();
}

// The plain read: map the whole file and sum it as 64-bit words.
double PlainRead(const std::string& path, uint64_t& sum) {
  const double start = voxbench::ThreadCpuSeconds();
  const int fd = ::open(path.c_str(), O_RDONLY);
  struct stat st {};
  ::fstat(fd, &st);
  const size_t size = static_cast<size_t>(st.st_size);
  void* view = ::mmap(nullptr, size, PROT_READ, MAP_PRIVATE, fd, 0);
  const auto* p = static_cast<const uint8_t*>(view);
  uint64_t s = 0;
  size_t i = 0;
  for (; i + 8 <= size; i += 8) {
    uint64_t v;
    std::memcpy(&v, p + i, 8);
    s += v;
  }
  for (; i < size; ++i)
    s += p[i];
  ::munmap(view, size);
  ::close(fd);
  sum = s;
  return voxbench::ThreadCpuSeconds() - start;
}

void Discard(void*, const char*) {}

double Scan(const std::string& path, uint32_t& epochs) {
  const double start = voxbench::ThreadCpuSeconds();
  vox::TChainItem file(1, path, false, false);
  vox::EphemerisStore eph;
  vox::PreciseStore precise;
  vox::MeteoTrackList meteo;
  vox::ScanSinks sinks;
  sinks.ephemerides = &eph;
  sinks.precise = &precise;
  sinks.meteo = &meteo;
  sinks.log = {&Discard, nullptr};
  const int status = vox::ScanFile(file, sinks);
  const double s = voxbench::ThreadCpuSeconds() - start;
  if (status != vox::kScanComplete) std::fprintf(stderr, "scan status %d\n", status);
  epochs = file.epoch_count;
  return s;
}

// The whole day through the epoch stream of one occupation over the file: every epoch and
// every satellite record. Returns the satellite records read.
struct StreamRun {
  double seconds = 0;
  uint64_t epochs = 0;
  uint64_t satellites = 0;
};

class DayStream {
 public:
  explicit DayStream(const std::string& path) : file_(1, path, false, false), occupation_(1) {
    occupation_.SetFile(&file_);
    vox::ScanSinks sinks;
    sinks.log = {&Discard, nullptr};
    status_ = vox::ScanFile(file_, sinks);
  }
  bool usable() const { return status_ == vox::kScanComplete; }

  StreamRun Read() {
    StreamRun run;
    const double start = voxbench::ThreadCpuSeconds();
    auto stream = vox::EpochStream::Open(occupation_, 0, nullptr, nullptr);
    vox_EpochData epoch{};
    vox_EpochSatData sat{};
    double sum = 0;
    for (bool ok = stream && stream->Find(nullptr, epoch); ok; ok = stream->GetNext(epoch)) {
      ++run.epochs;
      while (stream->GetSatellite(sat)) {
        ++run.satellites;
        sum += sat.values[0];
      }
    }
    run.seconds = voxbench::ThreadCpuSeconds() - start;
    sink_ = sum;
    return run;
  }

 private:
  vox::TChainItem file_;
  vox::TOccupItem occupation_;
  int status_ = 0;
  volatile double sink_ = 0;
};

}  // namespace

int main(int argc, char** argv) {
  std::string keep;
  int rounds = 5;
  for (int i = 1; i + 1 < argc; i += 2) {
    if (std::strcmp(argv[i], "--keep") == 0) keep = argv[i + 1];
    if (std::strcmp(argv[i], "--rounds") == 0) rounds = std::atoi(argv[i + 1]);
  }
  const std::string path = !keep.empty()
                               ? keep
                               : (std::filesystem::temp_directory_path() /
                                  ("vox_bench_day_" + std::to_string(::getpid()) + ".raw"))
                                     .string();
  const auto gen_start = Clock::now();
  WriteDay(path);
  const double size_mb = std::filesystem::file_size(path) / 1e6;
  std::printf("file: %s, %.1f MB, %u epochs (written in %.2f s)\n", path.c_str(), size_mb, kEpochs,
              Seconds(Clock::now() - gen_start));

  double best_plain = 1e9, best_scan = 1e9;
  uint64_t sum = 0;
  uint32_t epochs = 0;
  for (int r = 0; r < rounds; ++r) {
    best_plain = std::min(best_plain, PlainRead(path, sum));
    best_scan = std::min(best_scan, Scan(path, epochs));
  }
  std::printf("%-12s %10s %14s\n", "", "MB/s", "epochs/s");
  std::printf("%-12s %10.0f %14.0f\n", "plain read", size_mb / best_plain, kEpochs / best_plain);
  std::printf("%-12s %10.0f %14.0f\n", "scan", size_mb / best_scan, epochs / best_scan);
  std::printf("scan / plain read: %.2f (checksum %llx, %u epochs scanned)\n",
              best_plain / best_scan, static_cast<unsigned long long>(sum), epochs);
  const double scan_mbs = size_mb / best_scan, plain_mbs = size_mb / best_plain;
  const double scan_ratio = best_plain / best_scan;
  voxbench::Row("scan, 1-day 1 Hz file", voxbench::Format("%.0f MB/s", scan_mbs),
                voxbench::Format("plain read %.0f MB/s", plain_mbs),
                voxbench::Format("%.2f", scan_ratio), ">= 1000 MB/s, ratio >= 0.25",
                scan_mbs >= 1000 && scan_ratio >= 0.25 ? "ok" : "MISS");

  // The epoch stream, rounds interleaved with the plain read again.
  DayStream day(path);
  if (!day.usable()) {
    voxbench::Row("epoch stream, same file", "-", "-", "-", ">= 10 M records/s", "n/a");
  } else {
    StreamRun best{1e9, 0, 0};
    double plain = 1e9;
    for (int r = 0; r < rounds; ++r) {
      plain = std::min(plain, PlainRead(path, sum));
      const StreamRun run = day.Read();
      if (run.seconds < best.seconds) best = run;
    }
    const double records = best.satellites / best.seconds;
    std::printf(
        "epoch stream: %llu epochs, %llu satellite records in %.3f s: %.1f M records/s, "
        "%.0f MB/s (plain read %.0f MB/s)\n",
        static_cast<unsigned long long>(best.epochs),
        static_cast<unsigned long long>(best.satellites), best.seconds, records / 1e6,
        size_mb / best.seconds, size_mb / plain);
    voxbench::Row("epoch stream, same file",
                  voxbench::Format("%.1f M sat records/s", records / 1e6),
                  voxbench::Format("plain read %.0f MB/s", size_mb / plain),
                  voxbench::Format("%.2f", plain / best.seconds), ">= 10 M records/s",
                  records >= 10e6 ? "ok" : "MISS");
  }
  if (keep.empty()) std::filesystem::remove(path);
  return epochs == kEpochs ? 0 : 1;
}
