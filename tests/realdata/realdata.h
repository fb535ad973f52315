// Helpers of the real-data tests: where the team's GNSS files are, running voxraw, and plain
// readers of the RINEX and SP3 text that know nothing of the converter, so that the tests
// compare what vox delivers against the files' own text.
#pragma once

#include <array>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "job/items.h"
#include "raw/ephemeris_store.h"
#include "support/scratch.h"

namespace vox::test {

// The folder of the real GNSS files; empty when it is not there.
std::string GnssDir();
#define REQUIRE_GNSS_DATA()                                                               \
  do {                                                                                    \
    if (::vox::test::GnssDir().empty())                                                   \
      GTEST_SKIP() << "the real GNSS data (" VOX_SHARED_DIR "/data/gnss) is not present"; \
  } while (0)

struct ToolRun {
  int exit_code = -1;
  std::string out, err;
};
// Runs voxraw with the arguments (each quoted for the shell), capturing its output.
ToolRun RunVoxraw(const std::vector<std::string>& args, const std::string& scratch);

// A RINEX observation file (with navigation files and options) converted by voxraw
// from-rinex, and scanned as data preparation would, with one occupation over it.
struct Converted {
  Converted(const std::string& obs, const std::vector<std::string>& navs,
            const std::vector<std::string>& options = {});

  ScratchDir scratch;
  std::string path;
  ToolRun run;
  std::unique_ptr<TChainItem> file;
  std::unique_ptr<TOccupItem> occupation;
  EphemerisStore ephemerides;
  int status = 0;
};

// ---- RINEX text, read plainly (version 2 and 3 observation files, version 2 GPS navigation)

struct TextSat {
  char system = 'G';
  int number = 0;
  std::vector<std::optional<double>> values;  // by the header's type list of its system
};
struct TextEpoch {
  int year, month, day, hour, minute;
  double second;
  std::vector<TextSat> sats;
};
struct TextObs {
  std::vector<std::string> types;                                   // version 2
  std::vector<std::pair<char, std::vector<std::string>>> types_v3;  // version 3
  std::optional<std::array<double, 3>> position;
  std::vector<TextEpoch> epochs;
  const std::vector<std::string>& TypesOf(char system) const;
};
TextObs ReadTextObs(const std::string& path, size_t max_epochs = 1000000);

struct TextNav {
  int prn;
  int year, month, day, hour, minute;
  double second;
  std::array<double, 32> v;  // the three clock numbers, then four per orbit line
};
std::vector<TextNav> ReadTextNavV2(const std::string& path);

struct TextSp3Sample {
  int year, month, day, hour, minute;
  double second;
  char system;
  int number;
  double x, y, z, clock;  // km, km, km, microseconds
};
std::vector<TextSp3Sample> ReadTextSp3(const std::string& path);

// Seconds since 1980-01-06 of a calendar time (no leap seconds).
double GpsSeconds(int year, int month, int day, int hour, int minute, double second);

// ECEF differences and lengths.
double Distance(const std::array<double, 3>& a, const std::array<double, 3>& b);

}  // namespace vox::test
