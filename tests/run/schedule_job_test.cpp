// Whole jobs through voxrun with a raw filter and an engine: the scheduling engine
// (tests/engines/schedule_engine.cpp) filters every occupation, on the job thread or on
// workers, and the probe engine (tests/engines/probe_engine.cpp) is the static processing
// engine, whose report of what it read is compared with the job.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "raw_writer.h"
#include "support/process.h"
#include "support/scratch.h"

namespace vox::test {
namespace {

using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;

#define ENGINE_DIR VOX_TEST_ENGINE_DIR "/"
constexpr uint32_t kDay = 13204;

size_t CountPrefix(const std::vector<std::string>& lines, const std::string& prefix) {
  return std::count_if(lines.begin(), lines.end(),
                       [&](const std::string& l) { return l.rfind(prefix, 0) == 0; });
}

uint32_t U32At(const std::vector<uint8_t>& b, size_t at) {
  return b[at] | b[at + 1] << 8 | b[at + 2] << 16 | static_cast<uint32_t>(b[at + 3]) << 24;
}

// A raw file of `epochs` one-second epochs of two GPS satellites, starting at first_s.
bool WriteRawFile(const std::string& path, uint32_t first_s, uint32_t epochs) {
  RawWriter w;
  w.Header().TimeRef("GPS", {0, kDay});
  for (uint32_t s = first_s; s < first_s + epochs; ++s) {
    std::vector<RawSatellite> sats;
    for (unsigned number : {3u, 7u}) {
      RawSatellite sat;
      sat.code = voxtools::SatCode51('G', number);
      sat.signals.push_back(RawSignal::Tag51(16, 2.0e7 + number, 1.0e8));
      sats.push_back(sat);
    }
    w.Epoch(51, s * 1000, sats);
  }
  w.EndOfData();
  return w.Save(path);
}

class ScheduleJobTest : public ::testing::Test {
 protected:
  void SetUp() override {
    setenv("VOX_TEST_RECORD", calls_.c_str(), 1);
    ASSERT_TRUE(WriteRawFile(scratch_.File("a.raw"), 10, 6));
    ASSERT_TRUE(WriteRawFile(scratch_.File("b.raw"), 12, 4));
  }
  void TearDown() override { unsetenv("VOX_TEST_RECORD"); }

  // Two files, two points, three occupations, one vector and one fan.
  std::string Job(const std::string& keys) {
    return WriteFile(
        scratch_.File("job.txt"),
        JobText("Sched", result_,
                "Type=1\nRawfiltPath=" ENGINE_DIR "test_schedule.eng\nEnginePath=" ENGINE_DIR
                "test_probe.eng\nProbeOut=" +
                    probe_ + "\n" + keys +
                    "NumFiles=2\nNumPoints=2\nNumOccups=3\nNumVectors=1\n"
                    "NumFans=1\nNumAntennas=1\n"
                    "[FILE:1]\nName=a.raw\n[FILE:2]\nName=b.raw\n"
                    "[POINT:1]\nName=Base\n[POINT:2]\nName=Rover\n"
                    "[ANTENNA:1]\nName=Ant\n"
                    "[OCCUP:1]\nFile=1\nPoint=1\nAntenna=1\n"
                    "[OCCUP:2]\nFile=2\nPoint=2\n"
                    "[OCCUP:3]\nFile=2\nPoint=1\n"
                    "[VECTOR:1]\nPoints=1,2\n"
                    "[FAN:1]\nPoint=1\nRover=2\n"));
  }

  // The occupation records of the result file, by occupation number.
  std::vector<std::vector<uint8_t>> OccupationRecords() {
    std::vector<std::vector<uint8_t>> out;
    for (const ResultRecord& r : ReadResultRecords(result_))
      if (r.kind == 34) out.push_back(r.payload);
    return out;
  }

  ScratchDir scratch_;
  TempDirEnv temp_{scratch_, false};
  std::string result_ = scratch_.File("job.res");
  std::string probe_ = scratch_.File("probe.txt");
  std::string calls_ = scratch_.File("calls.txt");
};

TEST_F(ScheduleJobTest, RawFilterPerOccupationThenTheEngineSeesTheWholeJob) {
  for (const char* cpus : {"1", "4"}) {
    SCOPED_TRACE(std::string("NumCPUs=") + cpus);
    std::remove(calls_.c_str());
    std::remove(probe_.c_str());
    EXPECT_EQ(RunVoxrun(Job(std::string("NumCPUs=") + cpus + "\n")), 0);

    // The raw filter ran once per occupation, on workers when there are several threads.
    const std::vector<std::string> calls = Lines(ReadFile(calls_));
    const std::string flags = std::string(cpus) == "1" ? "00000000" : "00000040";
    for (const char* id : {"02000001", "02000002", "02000003"})
      EXPECT_EQ(CountPrefix(calls, std::string("occ proc id=") + id + " flags=" + flags), 1u) << id;

    // One occupation record each, in order on the job thread, with what the scan found.
    const auto records = OccupationRecords();
    ASSERT_EQ(records.size(), 3u);
    std::vector<uint32_t> ids;
    for (const auto& r : records)
      ids.push_back(U32At(r, 0));
    if (std::string(cpus) == "1") {
      EXPECT_EQ(ids, (std::vector<uint32_t>{1, 2, 3}));
    }
    std::sort(ids.begin(), ids.end());
    EXPECT_EQ(ids, (std::vector<uint32_t>{1, 2, 3}));
    for (const auto& r : records) {
      const uint32_t id = U32At(r, 0);
      EXPECT_EQ(U32At(r, 4), id);                          // point
      EXPECT_EQ(U32At(r, 8), id == 1 ? 1u : 0u);           // antenna
      EXPECT_EQ(U32At(r, 12), id == 1 ? 10000u : 12000u);  // first epoch, ms of day
      EXPECT_EQ(U32At(r, 16), kDay);                       // its day
      EXPECT_EQ(U32At(r, 20), id == 1 ? 15000u : 15000u);  // last epoch
      EXPECT_EQ(U32At(r, 28), id == 1 ? 6u : 4u);          // epoch count
      const std::string point(r.begin() + 105, r.begin() + 105 + r[104]);
      EXPECT_EQ(point, id == 2 ? "Rover" : "Base");
    }

    // The probe engine, run once as the group engine, saw every item of the job.
    const std::vector<std::string> probe = Lines(ReadFile(probe_));
    std::string all;
    for (const std::string& l : probe)
      all += l + "\n";
    SCOPED_TRACE(all);
    ASSERT_FALSE(probe.empty());
    EXPECT_EQ(probe.front(), "start id=1 flags=00000004");
    EXPECT_EQ(probe.back(), "end");
    EXPECT_EQ(CountPrefix(probe, "occupation id="), 3u);
    EXPECT_EQ(CountPrefix(probe,
                          "occupation id=02000001 point=01000001 file=04000001 "
                          "receiver=00000000 epochs=6 interval=1000"),
              1u);
    EXPECT_EQ(CountPrefix(probe,
                          "occupation id=02000002 point=01000002 file=04000002 "
                          "receiver=00000000 epochs=4 interval=1000"),
              1u);
    EXPECT_EQ(CountPrefix(probe,
                          "occupation id=02000003 point=01000003 file=04000002 "
                          "receiver=00000000 epochs=4 interval=1000"),
              1u);
    EXPECT_EQ(CountPrefix(probe, "site id=01000001 "), 1u);
    EXPECT_EQ(CountPrefix(probe, "site id=01000002 "), 1u);
    EXPECT_EQ(CountPrefix(probe, "site id=01000003 "), 1u);
    EXPECT_EQ(CountPrefix(probe,
                          "vector id=08000001 points=01000001,01000002 names=Base,Rover "
                          "again=1 occups=02000001,02000002 "),
              1u);
    EXPECT_EQ(CountPrefix(probe,
                          "fan id=10000001 base=01000001 rover=04000002 base_name=Base "
                          "rover_name=b.raw occups=02000001,02000002,02000003 "),
              1u);
    EXPECT_EQ(CountPrefix(probe, "navcoord id="), 3u);
    EXPECT_EQ(CountPrefix(probe, "steps done"), 1u);
  }
}

TEST_F(ScheduleJobTest, ARawFilterOnlyJobRunsNoEngine) {
  EXPECT_EQ(RunVoxrun(Job("NumCPUs=2\nRunRawFilterOnly=1\n")), 0);
  EXPECT_EQ(CountPrefix(Lines(ReadFile(calls_)), "occ proc"), 3u);
  EXPECT_FALSE(std::filesystem::exists(probe_));
  EXPECT_EQ(OccupationRecords().size(), 3u);
}

}  // namespace
}  // namespace vox::test
