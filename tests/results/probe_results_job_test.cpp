// A whole job through voxrun whose engine (the probe, in its results mode) stores known
// records through every result function, on the task's writer and on a thread writer of its
// own: the result file read back with the reader library holds every field as the record
// layouts say, voxdump prints it completely, and the fan's NMEA file passes an independent
// parser.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <sstream>
#include <string>
#include <variant>
#include <vector>

#include "probe_values.h"
#include "raw_writer.h"
#include "result_reader.h"
#include "support/process.h"
#include "support/scratch.h"

namespace vox::test {
namespace {

using namespace probe_values;
using tools::Record;

#define ENGINE_DIR VOX_TEST_ENGINE_DIR "/"

bool WriteRawFile(const std::string& path) {
  voxtools::RawWriter w;
  w.Header().TimeRef("GPS", {0, kDay});
  for (uint32_t s = 36000; s < 36004; ++s) {
    voxtools::RawSatellite sat;
    sat.code = voxtools::SatCode51('G', 3);
    sat.signals.push_back(voxtools::RawSignal::Tag51(16, 2.0e7, 1.0e8));
    w.Epoch(51, s * 1000, {sat});
  }
  w.EndOfData();
  return w.Save(path);
}

// ---- What the result file must hold, worked out from the record layouts.

tools::RecTime Raw(const TimeMs& t) {
  return {(t.seconds % 86400) * 1000 + t.ms, t.seconds / 86400};
}

void ExpectTime(const tools::RecTime& got, const TimeMs& want) {
  EXPECT_EQ(got.day, Raw(want).day);
  EXPECT_EQ(got.ms_of_day, Raw(want).ms_of_day);
}

uint16_t SatelliteFlags(uint16_t o, bool pair, bool timed) {
  uint16_t f = pair ? 0x100 : 0;
  const uint16_t bits[7][2] = {{0, 0x400}, {1, 1}, {2, 2}, {6, 6}, {3, 3}, {4, 4}, {5, 5}};
  for (const auto& b : bits)
    if (o & (1u << b[0])) f |= b[1];
  if (o & 0x100) f |= 0x10;
  if (o & 0x200) f |= 0x20;
  if (timed && (o & 0x8000)) f |= 0x8000;
  if (!timed && (o & 0x4000)) f |= 0x200;
  return f;
}

uint16_t OneByteCode(uint8_t v) {
  if (v > 37) return (v - 37) | 0x80;
  if (v >= 33) return (v - 32) | 0xC0;
  return v;
}

uint16_t TwoByteCode(uint8_t v) {
  if (v < 33) return v;
  if (v <= 37) return (v - 32) | 0xC0;
  if (v <= 61) return (v - 37) | 0x80;
  if (v <= 98) return (v - 61) | 0x140;
  if (v <= 128) return (v - 98) | 0x100;
  if (v <= 149) return (v - 128) | 0x40;
  return 0;
}

void ExpectSatellite(const Record& r, const CopyCase& c, uint32_t seed, uint16_t counter) {
  SCOPED_TRACE("copy kind " + std::to_string(c.kind) + " seed " + std::to_string(seed));
  const uint8_t kinds[12] = {0, 0, 0, 0, 0, 39, 0, 0, 38, 0, 52, 55};
  ASSERT_EQ(r.kind, kinds[c.kind]);
  const auto& s = std::get<tools::SatelliteRec>(r.body);
  const bool timed = c.kind == 5 || c.kind == 10;
  const bool wide = c.kind == 10 || c.kind == 11;
  EXPECT_EQ(s.flags, SatelliteFlags(c.obs_flags, c.b != 0, timed));
  EXPECT_EQ(s.plot_counter, counter);
  EXPECT_EQ(s.code_a, wide ? TwoByteCode(c.a) : OneByteCode(c.a));
  EXPECT_EQ(s.code_b, wide ? TwoByteCode(c.b) : OneByteCode(c.b));
  EXPECT_EQ(s.timed, timed);
  if (timed) {
    const vox_CopyDataRec in = Satellite(c.obs_flags, c.a, c.b, seed);
    ExpectTime(s.time1, in.satellite.time1);
    ExpectTime(s.time2, in.satellite.time2);
    EXPECT_EQ(s.value, in.satellite.value);
    EXPECT_EQ(s.value_f, in.satellite.value_f);
    for (int i = 0; i < 4; ++i)
      EXPECT_EQ(s.values[i], in.satellite.values[i]);
  } else {
    for (uint32_t i = 0; i < 3; ++i)
      EXPECT_EQ(s.values[i], seed * 10 + i);
  }
}

void ExpectSpan(const tools::SpanFields& got, const vox_CopyDataRec& in, bool vector,
                const std::string& name) {
  ExpectTime(got.start, vector ? in.vector_span.start : in.fan_span.start);
  ExpectTime(got.end, vector ? in.vector_span.end : in.fan_span.end);
  EXPECT_EQ(got.value1, vector ? in.vector_span.value1 : in.fan_span.value1);
  EXPECT_EQ(got.value2, vector ? in.vector_span.value2 : in.fan_span.value2);
  EXPECT_EQ(got.value, vector ? in.vector_span.value : in.fan_span.value);
  EXPECT_EQ(got.name, name);
}

void ExpectVector(const Record& r, const vox_VectorResult& in, uint8_t kind, uint32_t flags) {
  ASSERT_EQ(r.kind, kind);
  const auto& v = std::get<tools::VectorRec>(r.body);
  EXPECT_EQ(v.number, 1u);
  EXPECT_EQ(v.flags, flags) << std::hex << v.flags;
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(v.base[i], in.base[i]);
    EXPECT_EQ(v.baseline[i], in.baseline[i]);
  }
  for (int i = 0; i < 4; ++i) {
    EXPECT_EQ(v.values_32[i], in.stored_d[i]);
    EXPECT_EQ(v.values_80[i], in.stored_a[i]);
  }
  EXPECT_EQ(v.value_48, in.stored_e);
  EXPECT_EQ(v.value_52, in.stored_f);
  EXPECT_EQ(v.value_96, in.stored_b);
  EXPECT_EQ(v.value_100, in.stored_c);
  EXPECT_EQ(v.has_span, kind == 40);
  if (kind == 40) {
    EXPECT_EQ(v.from_point, in.reversed ? 2u : 1u);
    EXPECT_EQ(v.to_point, in.reversed ? 1u : 2u);
    ExpectSpan(v.span, VectorSpan(), true, "Span-V");
  }
  EXPECT_EQ(v.has_extra, (flags & 0x1000) != 0);
  if (v.has_extra) {
    EXPECT_EQ(v.extra_marker, 1u);
    EXPECT_EQ(v.extra, in.extra);
  }
}

void ExpectPlotLine(const Record& r, uint16_t stream, const PlotLine& line, uint16_t flags,
                    uint16_t a, uint16_t b) {
  ASSERT_EQ(r.kind, 53);
  const auto& l = std::get<tools::PlotLineRec>(r.body);
  EXPECT_EQ(l.stream_id, stream);
  EXPECT_EQ(l.index, line.index);
  EXPECT_EQ(l.flags, flags) << line.name;
  EXPECT_EQ(l.sat_a, a) << line.name;
  EXPECT_EQ(l.sat_b, b) << line.name;
  EXPECT_EQ(l.name, line.name);
}

void ExpectPlotEpoch(const Record& r, uint16_t stream, double time,
                     const std::vector<std::pair<uint16_t, float>>& values) {
  ASSERT_EQ(r.kind, 54);
  const auto& e = std::get<tools::PlotEpochRec>(r.body);
  const uint64_t ms = static_cast<uint64_t>(std::llround(time * 1000.0));
  EXPECT_EQ(e.time.day, ms / 86400000);
  EXPECT_EQ(e.time.ms_of_day, ms % 86400000);
  EXPECT_EQ(e.stream_id, stream);
  ASSERT_EQ(e.values.size(), values.size());
  for (size_t i = 0; i < values.size(); ++i) {
    EXPECT_EQ(e.values[i].index, values[i].first);
    EXPECT_EQ(e.values[i].value, values[i].second);
  }
}

class ProbeResultsJobTest : public ::testing::Test {
 protected:
  void SetUp() override { Run(1); }

  // Runs the job with the probe's results mode (1, or 2 for a last ray that is not a number).
  void Run(int mode, int version = 101) {
    ASSERT_TRUE(WriteRawFile(scratch_.File("a.raw")));
    ASSERT_TRUE(WriteRawFile(scratch_.File("b.raw")));
    const std::string job = WriteFile(
        scratch_.File("job.txt"),
        JobText("Results", result_,
                "Type=1\nResultVersion=" + std::to_string(version) +
                    "\nRawfiltPath=" ENGINE_DIR "test_schedule.eng\nEnginePath=" ENGINE_DIR
                    "test_probe.eng\nProbeOut=" +
                    probe_ + "\nProbeResults=" + std::to_string(mode) +
                    "\n"
                    "NumFiles=2\nNumPoints=2\nNumOccups=2\nNumVectors=1\nNumFans=1\n"
                    "[FILE:1]\nName=a.raw\n[FILE:2]\nName=b.raw\n"
                    "[POINT:1]\nName=Base\n[POINT:2]\nName=Rover\n"
                    "[OCCUP:1]\nFile=1\nPoint=1\n[OCCUP:2]\nFile=2\nPoint=2\n"
                    "[VECTOR:1]\nPoints=1,2\n"
                    "[FAN:1]\nPoint=1\nRover=2\nGGAPath=fan.nmea\n"));
    ASSERT_EQ(RunVoxrun(job), 0);
    read_ = tools::ReadResultFile(result_);
  }

  // The engine's records: from the solution start (kind 30) on, messages left out.
  std::vector<Record> EngineRecords() const {
    std::vector<Record> out;
    bool started = false;
    for (const Record& r : read_.records) {
      started = started || r.kind == 30;
      if (started && r.kind != 29 && r.kind != 0) out.push_back(r);
    }
    return out;
  }

  static std::vector<uint8_t> Kinds(const std::vector<Record>& records) {
    std::vector<uint8_t> kinds;
    for (const Record& r : records)
      kinds.push_back(r.kind);
    return kinds;
  }

  ScratchDir scratch_;
  TempDirEnv temp_{scratch_, true};
  std::string result_ = scratch_.File("job.res");
  std::string probe_ = scratch_.File("probe.txt");
  tools::ReadResult read_;
};

TEST_F(ProbeResultsJobTest, EveryResultFunctionReportsWhatItDid) {
  const std::vector<std::string> lines = Lines(ReadFile(probe_));
  auto has = [&](const std::string& l) {
    return std::find(lines.begin(), lines.end(), l) != lines.end();
  };
  EXPECT_TRUE(has("results start=1 counter=0 copied=4"));
  EXPECT_TRUE(has("results vector=1,1,2 none=0 short_span=0 span=1"));
  EXPECT_TRUE(has("results fan=1,1 span=1"));
  EXPECT_TRUE(has("results rays=1,1,1 null=0"));
  EXPECT_TRUE(has("plot set=4 time_line=1 beyond=0 sent=6 close=1"));
  EXPECT_TRUE(has("results thread init=1 own_writer=1 start=1 copied=2 delete=0"));
  EXPECT_EQ(lines.back(), "end");
}

TEST_F(ProbeResultsJobTest, TheResultFileHoldsEveryFieldAsStored) {
  ASSERT_FALSE(read_.fault) << read_.fault->what;
  ASSERT_FALSE(read_.records.empty());
  EXPECT_EQ(read_.records.back().kind, 0);
  const std::vector<Record> r = EngineRecords();
  ASSERT_EQ(Kinds(r), std::vector<uint8_t>({30, 39, 38, 52, 55, 33, 40, 40, 35, 41, 36, 36,
                                            36, 53, 53, 53, 53, 54, 54, 30, 55, 39, 53, 54}));

  // Solution start: the type as sent, bits 25, 27 and 28 of the flags cleared.
  const auto& start = std::get<tools::SolutionStartRec>(r[0].body);
  EXPECT_EQ(start.type, 2u);
  EXPECT_EQ(start.flags, 0xE5FFFFFFu);
  // Satellite records: kind 9 raised the plot counter of the task's writer to 1.
  for (uint32_t k = 0; k < 4; ++k)
    ExpectSatellite(r[1 + k], kCopyCases[k], k + 1, 1);

  // Vector 1 before its span, then reversed and unsolved with the extra value, then the
  // conflicting solution (baseline rms above 1 m + 10 ppm: 0x40000000).
  ExpectVector(r[5], VectorFirst(), 33, 0x80000000u | 2 | 8 | 0x30 | 0x300 | 0x400);
  ExpectVector(r[6], VectorSecond(), 40, 0x3F000000u | 0x40000 | 0x800 | 1 | 0x200 | 0x1000);
  ExpectVector(r[7], VectorConflict(), 40, 0xC0000000u | 3 | 0x100);

  // The fan without and with its span (name cut to 15 characters).
  const auto& fan1 = std::get<tools::FanRec>(r[8].body);
  EXPECT_EQ(fan1.number, 1u);
  EXPECT_EQ(fan1.flags, 0x80000000u);
  EXPECT_FALSE(fan1.has_span);
  const auto& fan2 = std::get<tools::FanRec>(r[9].body);
  EXPECT_EQ(fan2.number, 1u);
  EXPECT_EQ(fan2.flags, 0x80000000u);
  EXPECT_TRUE(fan2.has_span);
  EXPECT_EQ(fan2.fan_id, 0x10000001u);
  ExpectSpan(fan2.span, FanSpan(), false, "Span-F-12345678");
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(fan1.position[i], kFan1[i]);
    EXPECT_EQ(fan2.position[i], kFan2[i]);
  }

  // Rays: bit 3 moves to bit 31, bits outside 0x7FFC0407 go; positions relative to the fan.
  const uint32_t ray_flags[3] = {0x3, 0x80000402u, 0x40001};
  for (uint32_t k = 0; k < 3; ++k) {
    SCOPED_TRACE("ray " + std::to_string(k));
    const auto& ray = std::get<tools::RayRec>(r[10 + k].body);
    const vox_RayData in = Ray(k);
    EXPECT_EQ(ray.fan, 1u);
    EXPECT_EQ(ray.flags, ray_flags[k]);
    ExpectTime(ray.time, in.time);
    for (int i = 0; i < 3; ++i) {
      EXPECT_EQ(ray.offset[i], in.position[i] - kFan2[i]);
      EXPECT_EQ(ray.values[i], in.values[i]);
    }
    EXPECT_EQ(ray.hdop, in.hdop);
    EXPECT_EQ(ray.satellites, in.satellites);
  }

  // The main plot stream: id 2 (kind 9 took the counter to 1), four lines, two epochs.
  ExpectPlotLine(r[13], 2, kMainLines[0], 0x210 | 0x100 | 1, 5, 12);
  ExpectPlotLine(r[14], 2, kMainLines[1], 0x20 | 0x400 | 2, 128 + 7, 0);
  ExpectPlotLine(r[15], 2, kMainLines[2], 5, 256 + 11, 0);
  ExpectPlotLine(r[16], 2, kMainLines[3], 0x4007, 0, 0);
  ExpectPlotEpoch(r[17], 2, kPlotTime, {{0, 1.5f}, {2, 2.5f}});
  ExpectPlotEpoch(r[18], 2, kPlotTime + 1.0, {{3, 3.5f}, {7, 7.5f}});

  // The thread's block, whole: its own writer counts its own plot streams from 1.
  const auto& thread_start = std::get<tools::SolutionStartRec>(r[19].body);
  EXPECT_EQ(thread_start.type, 3u);
  EXPECT_EQ(thread_start.flags, 0x12345678u & 0xE5FFFFFFu);
  ExpectSatellite(r[20], kThreadCases[0], 50, 0);
  ExpectSatellite(r[21], kThreadCases[1], 51, 0);
  ExpectPlotLine(r[22], 1, kThreadLine, 0x100 | 0x400 | 1, 320 + 3, 320 + 4);
  ExpectPlotEpoch(r[23], 1, kPlotTime + 9.0, {{5, 5.5f}});
}

TEST_F(ProbeResultsJobTest, VoxdumpPrintsEveryRecord) {
  int status = 0;
  const std::string out =
      RunCommand(std::string("'") + VOXDUMP_PATH + "' '" + result_ + "' 2>&1", status);
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << out;
  std::vector<std::string> records;
  for (const std::string& l : Lines(out))
    if (l.rfind("@", 0) == 0) records.push_back(l);
  ASSERT_EQ(records.size(), read_.records.size()) << out;
  for (size_t i = 0; i < records.size(); ++i) {
    const std::string kind =
        tools::KindName(read_.records[i].kind) + "(" + std::to_string(read_.records[i].kind) + ")";
    EXPECT_EQ(records[i].rfind("@" + std::to_string(read_.records[i].offset) + " " + kind, 0), 0u)
        << records[i];
  }
  EXPECT_NE(records.back().find("end(0)"), std::string::npos);
  EXPECT_EQ(out.find("fault"), std::string::npos) << out;
}

TEST_F(ProbeResultsJobTest, TheFansNmeaFileHoldsOneSentencePerRay) {
  const std::string path = scratch_.File("fan.nmea");
  const std::string text = ReadFile(path);
  std::vector<std::string> sentences;
  for (std::string l : Lines(text)) {
    if (!l.empty() && l.back() == '\r') l.pop_back();
    sentences.push_back(l);
  }
  ASSERT_EQ(sentences.size(), 4u) << text;
  EXPECT_EQ(sentences[0].rfind("$GPZDA,", 0), 0u);
  // UTC is GPS time less the 17 leap seconds of 2016; quality 2, 5 and 0 by the ray flags.
  const char* times[3] = {"095943.250", "095944.250", "095945.250"};
  const char* quality[3] = {"2", "5", "0"};
  const char* satellites[3] = {"07", "08", "09"};
  const char* hdop[3] = {"0.5", "1.5", "2.5"};
  for (int k = 0; k < 3; ++k) {
    std::vector<std::string> field;
    std::istringstream in(sentences[1 + k]);
    for (std::string f; std::getline(in, f, ',');)
      field.push_back(f);
    ASSERT_GE(field.size(), 10u) << sentences[1 + k];
    EXPECT_EQ(field[0], "$GPGGA");
    EXPECT_EQ(field[1], times[k]);
    EXPECT_EQ(field[6], quality[k]);
    EXPECT_EQ(field[7], satellites[k]);
    EXPECT_EQ(field[8], hdop[k]);
  }

  // The same file through an independent parser, where one could be installed.
  const std::string node_modules = std::string(VOX_BUILD_DIR) + "/npm/node_modules";
  if (std::system("node --version > /dev/null 2>&1") != 0)
    GTEST_SKIP() << "node is not installed: independent NMEA check skipped";
  const std::string command = "NODE_PATH='" + node_modules +
                              "' node '" VOX_RESULTS_TEST_DIR "/nmea_check.js' '" + path + "' 2>&1";
  int status = 0;
  const std::string out = RunCommand(command, status);
  if (WIFEXITED(status) && WEXITSTATUS(status) == 77)
    GTEST_SKIP() << "npm package nmea-simple not in " << node_modules
                 << " (npm could not install it): independent NMEA check skipped";
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << out;
  EXPECT_EQ(Lines(out).size(), 4u) << out;
}

// A ray whose position is not a number (an engine's failed solution) is stored as it came and
// left out of the NMEA file, whose sentences could not say anything sound about it.
class ProbeNanRayJobTest : public ProbeResultsJobTest {
 protected:
  void SetUp() override { Run(2); }
};

TEST_F(ProbeNanRayJobTest, IsStoredAndLeftOutOfTheNmeaFile) {
  const std::vector<std::string> lines = Lines(ReadFile(probe_));
  EXPECT_EQ(lines.back(), "end");
  size_t rays = 0;
  for (const Record& r : read_.records)
    rays += r.kind == 36;
  EXPECT_EQ(rays, 4u);
  // The NaN ray came through a second ray stream, whose opening replaced the fan's NMEA file:
  // nothing was written to it, not even the ZDA sentence that a first fix brings.
  EXPECT_TRUE(Lines(ReadFile(scratch_.File("fan.nmea"))).empty());
}

// With result version 100 the plot streams write the older records: line descriptions of kind
// 4, epochs of kind 37 that carry each value's line flags and one-byte satellites, so that a
// value on a line whose satellite does not fit a byte (GALILEO, BDS) is dropped.
class ProbeResultsV100JobTest : public ProbeResultsJobTest {
 protected:
  void SetUp() override { Run(1, 100); }
};

TEST_F(ProbeResultsV100JobTest, PlotStreamsWriteTheOlderRecords) {
  ASSERT_FALSE(read_.fault) << read_.fault->what;
  const std::vector<Record> r = EngineRecords();
  ASSERT_EQ(Kinds(r), std::vector<uint8_t>({30, 39, 38, 52, 55, 33, 40, 40, 35, 41, 36, 36,
                                            36, 4,  4,  4,  4,  37, 37, 30, 55, 39, 4,  37}));
  const PlotLine* lines[5] = {&kMainLines[0], &kMainLines[1], &kMainLines[2], &kMainLines[3],
                              &kThreadLine};
  const size_t at[5] = {13, 14, 15, 16, 22};
  for (size_t i = 0; i < 5; ++i) {
    const auto& l = std::get<tools::PlotLineRec>(r[at[i]].body);
    EXPECT_FALSE(l.v101);
    EXPECT_EQ(l.index, lines[i]->index);
    EXPECT_EQ(l.value, 3);
    EXPECT_EQ(l.name, lines[i]->name);
  }
  struct Value {
    uint16_t flags;
    uint8_t a, b;
    float value;
  };
  auto expect_epoch = [](const Record& rec, uint16_t stream, double time,
                         const std::vector<Value>& values) {
    const auto& e = std::get<tools::PlotEpochRec>(rec.body);
    EXPECT_FALSE(e.v101);
    const uint64_t ms = static_cast<uint64_t>(std::llround(time * 1000.0));
    EXPECT_EQ(e.time.ms_of_day, ms % 86400000);
    EXPECT_EQ(e.stream_id, stream);
    ASSERT_EQ(e.values.size(), values.size());
    for (size_t i = 0; i < values.size(); ++i) {
      EXPECT_EQ(e.values[i].flags, values[i].flags);
      EXPECT_EQ(e.values[i].sat_a, values[i].a);
      EXPECT_EQ(e.values[i].sat_b, values[i].b);
      EXPECT_EQ(e.values[i].value, values[i].value);
    }
  };
  expect_epoch(r[17], 2, kPlotTime, {{0x311, 5, 12, 1.5f}, {0x422, 135, 0, 2.5f}});
  // E11 (267) does not fit a byte: only line 7 remains.
  expect_epoch(r[18], 2, kPlotTime + 1.0, {{0x4007, 0, 0, 7.5f}});
  // The thread's C03-C04 line loses its only value; the epoch is still written, empty.
  expect_epoch(r[23], 1, kPlotTime + 9.0, {});
}

}  // namespace
}  // namespace vox::test
