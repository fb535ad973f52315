// The two-point example job of our job-file documentation, run through voxrun with test
// engines placed beside the library under their default names: the job loads
// "kra_static.eng" from the library's own folder (not from the current folder), hands it the
// parameters of [JOB] and ends with exit code 0.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "raw_writer.h"
#include "support/process.h"
#include "support/scratch.h"

namespace {

namespace fs = std::filesystem;
using vox::test::ReadFile;
using vox::test::ScratchDir;
using vox::test::WriteFile;
using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;

constexpr uint32_t kDay = 9000;

bool WriteRawFile(const std::string& path) {
  RawWriter w;
  w.Header().TimeRef("GPS", {0, kDay});
  for (uint32_t s = 0; s < 5; ++s) {
    RawSatellite sat;
    sat.code = voxtools::SatCode51('G', 5);
    sat.signals.push_back(RawSignal::Tag51(16, 2.1e7, 1.1e8));
    w.Epoch(51, s * 1000, {sat});
  }
  w.EndOfData();
  return w.Save(path);
}

// voxrun with LD_LIBRARY_PATH pointing at `library_folder`, so that the library (and with it
// "beside the library") is the copy there. Returns the exit status.
int RunVoxrun(const std::string& library_folder, const std::string& job,
              const std::string& record) {
  return vox::test::RunProgram(VOX_VOXRUN, {"--quiet", job},
                               {{"LD_LIBRARY_PATH", library_folder}, {"VOX_TEST_RECORD", record}});
}

TEST(ExampleJob, LoadsTheDefaultEngineBesideTheLibraryAndHandsItItsParameters) {
  ScratchDir scratch;
  const fs::path lib = scratch.path() / "lib";
  const fs::path work = scratch.path() / "work";
  fs::create_directories(lib);
  fs::create_directories(work);
  fs::copy_file(VOX_LIBRARY, lib / "libvox.so");
  fs::copy_file(VOX_TEST_ENGINE_DIR "/test_params.eng", lib / "kra_static.eng");
  // A raw filter that processes nothing, so that the engine step runs.
  fs::copy_file(VOX_TEST_ENGINE_DIR "/test_bare.dll", lib / "kra_rawfilter.dll");
  // A decoy in the current folder that must not be taken for the engine.
  WriteFile((work / "kra_static.eng").string(), "not a library");

  ASSERT_TRUE(WriteRawFile((work / "base.raw").string()));
  ASSERT_TRUE(WriteRawFile((work / "rover.raw").string()));
  const std::string job = WriteFile((work / "bridge.job").string(),
                                    "[JOB]\nName=Bridge control\nType=1\nResultPath=result.bin\n"
                                    "NumFiles=2\nNumPoints=2\nNumOccups=2\nNumVectors=1\n"
                                    "NumAntennas=1\nNumReceivers=1\nStartPoint=5\nMode=fast\n"
                                    "[FILE:1]\nName=base.raw\n[FILE:2]\nName=rover.raw\n"
                                    "[POINT:1]\nName=BASE\nPosX=2849000.125\nPosY=2196000.250\n"
                                    "PosZ=5249000.375\nType=0\n[POINT:2]\nName=ROVER\n"
                                    "[ANTENNA:1]\nName=A1\n[RECEIVER:1]\nName=R1\n"
                                    "[OCCUP:1]\nFile=1\nPoint=1\nAntenna=1\nReceiver=1\n"
                                    "OffsetL1_U=1.5\n[OCCUP:2]\nFile=2\nPoint=2\nAntenna=1\n"
                                    "Receiver=1\n[VECTOR:1]\nPoints=1,2\n");
  const std::string record = (scratch.path() / "calls.txt").string();

  const fs::path previous = fs::current_path();
  fs::current_path(work);
  const int exit_code = RunVoxrun(lib.string(), job, record);
  fs::current_path(previous);

  EXPECT_EQ(exit_code, 0);
  EXPECT_TRUE(fs::exists(work / "result.bin"));
  const std::string calls = ReadFile(record);
  EXPECT_NE(calls.find("init_engine " + (lib / "libvox.so").string()), std::string::npos) << calls;
  EXPECT_NE(calls.find("StartPoint=16777221"), std::string::npos) << calls;
  EXPECT_NE(calls.find("Mode=fast"), std::string::npos) << calls;
  EXPECT_NE(calls.find("group 1"), std::string::npos) << calls;
}

}  // namespace
