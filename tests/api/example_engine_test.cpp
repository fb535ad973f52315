// The example engine of the SDK run as a real job through libvox: the job file names it,
// vox scans the raw file, loads the engine and serves it the epochs and meteorological
// samples through the exported streams; the engine's messages land in the result file.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "raw_writer.h"
#include "support/scratch.h"
#include "vox/vox_host.h"

namespace vox::test {
namespace {

using voxtools::RawMeteoSample;
using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;

constexpr uint32_t kDay = 13204;  // March 2016

RawSatellite Gps(unsigned number, bool with_l1) {
  RawSatellite s;
  s.code = voxtools::SatCode51('G', number);
  s.signals.push_back(with_l1 ? RawSignal::Tag51(16, 2.0e7 + number, 1.0e8)
                              : RawSignal::Tag51(36, 2.1e7, {}));
  return s;
}

std::vector<std::string> Messages(const std::string& result_path) {
  std::vector<std::string> texts;
  for (const ResultRecord& r : ReadResultRecords(result_path))
    if (r.kind == 29) texts.push_back(MessageText(r));
  return texts;
}

TEST(ExampleEngine, ReadsEveryEpochAndTheMeteoSamplesOfAJob) {
  ScratchDir scratch;
  TempDirEnv temp(scratch, true);
  RawWriter w;
  w.Header().TimeRef("GPS", {0, kDay});
  RawMeteoSample m;
  m.time = {0, kDay};
  m.pressure = 1000.0f;
  m.temperature = 10.0f;
  w.MeteoSample(m);
  for (uint32_t s = 1; s <= 5; ++s)
    w.Epoch(51, s * 1000, {Gps(3, true), Gps(7, s % 2 == 0)});
  m.time = {10000, kDay};
  m.pressure = 1010.0f;
  m.temperature = 20.0f;
  w.MeteoSample(m);
  w.EndOfData();
  ASSERT_TRUE(w.Save(scratch.File("site.raw")));

  const std::string result = scratch.File("result.bin");
  const std::string job =
      WriteFile(scratch.File("job.txt"),
                JobText("example", result,
                        "Type=1\nEnginePath=" EXAMPLE_ENGINE "\nRawfiltPath=" EXAMPLE_ENGINE
                        "\nNumFiles=1\nNumPoints=1\nNumOccups=1\n[FILE:1]\nName=site.raw\n"
                        "[POINT:1]\nName=SITE\n[OCCUP:1]\nFile=1\nPoint=1\n"));
  RunProcessAndWait(job.c_str());

  const std::vector<std::string> messages = Messages(result);
  std::string all;
  for (const std::string& t : messages)
    all += t + "\n";
  for (const std::string& log : temp.EngineLogTexts())
    all += "---- engine log\n" + log;
  EXPECT_NE(all.find("occupation 02000001: 5 epochs, 10 satellites, 7 L1 codes"), std::string::npos)
      << all;
  // The first epoch is 1 s after the first sample: a tenth of the way to the second.
  EXPECT_NE(all.find("pressure 1001.0 hPa, temperature 11.0 C"), std::string::npos) << all;
}

}  // namespace
}  // namespace vox::test
