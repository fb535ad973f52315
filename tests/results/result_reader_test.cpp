// The result-file reader and voxdump against files the writer produced.
#include "result_reader.h"

#include <cstdio>
#include <cstring>
#include <string>
#include <variant>

#include <gtest/gtest.h>

#include "result_test_util.h"
#include "results/occupation_record.h"
#include "results/plot_stream.h"
#include "results/result_file.h"
#include "results/result_functions.h"
#ifndef _WIN32
#include "support/process.h"
#endif

namespace vox {
namespace {

using tools::ReadResultBytes;
using tools::ReadResultFile;

// A file with one record of most kinds, written through the room's own functions.
std::string WriteSampleFile() {
  const std::string path = test::TempPath("sample.res");
  TResultFile writer(path);
  writer.result_version = 101;
  EXPECT_TRUE(writer.Open());
  writer.WriteMessage("Can not prepare data", 3);
  TPointItem p1(1), p2(2);
  p1.name = "BASE";
  TVectorItem vector(3, &p1, &p2);
  TLock lock("solution");
  vox_VectorResult vr{};
  vr.solved = 1;
  vr.baseline[0] = 12.5;
  SetVectorResult(writer, &vector, 3, &vr, lock);
  TOccupItem o(7);
  o.SetPoint(&p1);
  WriteOccupationRecord(writer, o);
  auto plot = OpenPlotStream(writer);
  plot->SetLine(2, 0, "R07 L2C", nullptr);
  plot->CreatePlot(2);
  plot->SendData(1, 1, 100.0);
  plot->SendData(2, 1, 0.25);
  ClosePlotStream(plot.release());
  EXPECT_TRUE(writer.Close());
  return path;
}

TEST(ResultReader, DecodesWhatTheWriterWrote) {
  const auto result = ReadResultFile(WriteSampleFile());
  ASSERT_FALSE(result.fault) << result.fault->what;
  ASSERT_EQ(result.records.size(), 7u);
  const auto& header = std::get<tools::HeaderRec>(result.records[0].body);
  EXPECT_EQ(header.magic, "$YRB");
  EXPECT_EQ(header.format, 4178u);
  const auto& message = std::get<tools::MessageRec>(result.records[1].body);
  EXPECT_EQ(message.type, 5u);
  EXPECT_EQ(message.text, "Can not prepare data");
  const auto& vector = std::get<tools::VectorRec>(result.records[2].body);
  EXPECT_EQ(vector.number, 3u);
  EXPECT_FALSE(vector.has_span);
  EXPECT_EQ(vector.baseline[0], 12.5);
  const auto& occupation = std::get<tools::OccupationRec>(result.records[3].body);
  EXPECT_EQ(occupation.occupation, 7u);
  EXPECT_EQ(occupation.point_name, "BASE");
  const auto& line = std::get<tools::PlotLineRec>(result.records[4].body);
  EXPECT_TRUE(line.v101);
  EXPECT_EQ(line.name, "R07 L2C");
  EXPECT_EQ(line.sat_a, 135);
  const auto& epoch = std::get<tools::PlotEpochRec>(result.records[5].body);
  EXPECT_EQ(epoch.time.ms_of_day, 100000u);
  ASSERT_EQ(epoch.values.size(), 1u);
  EXPECT_EQ(epoch.values[0].value, 0.25f);
  EXPECT_TRUE(std::holds_alternative<tools::EndRec>(result.records[6].body));
}

TEST(ResultReader, ReportsWhereAFileIsCutOrCorrupt) {
  const auto bytes = test::ReadBytes(WriteSampleFile());
  const auto whole = ReadResultBytes(bytes);
  ASSERT_EQ(whole.records.size(), 7u);
  const uint64_t last_epoch = whole.records[5].offset;

  // Cut inside the plot epoch: the five records before it survive.
  std::vector<uint8_t> cut(bytes.begin(), bytes.begin() + static_cast<long>(last_epoch) + 9);
  auto r = ReadResultBytes(cut);
  ASSERT_TRUE(r.fault);
  EXPECT_EQ(r.records.size(), 5u);
  EXPECT_EQ(r.fault->offset, last_epoch);
  EXPECT_NE(r.fault->what.find("cut short"), std::string::npos);

  // Fewer bytes than a frame at the end.
  std::vector<uint8_t> tail(bytes.begin(), bytes.begin() + 17);
  r = ReadResultBytes(tail);
  ASSERT_TRUE(r.fault);
  EXPECT_EQ(r.records.size(), 1u);
  EXPECT_EQ(r.fault->offset, 15u);

  // A message whose text length runs past its record.
  auto bad = bytes;
  bad[15 + 3 + 8] = 200;
  r = ReadResultBytes(bad);
  ASSERT_TRUE(r.fault);
  EXPECT_EQ(r.records.size(), 1u);
  EXPECT_EQ(r.fault->offset, 15u + 3 + 9);
  EXPECT_NE(r.fault->what.find("message text"), std::string::npos);

  // A trailing length that disagrees with the leading one.
  bad = bytes;
  const size_t message_end = whole.records[2].offset;
  bad[message_end - 2] ^= 1;
  r = ReadResultBytes(bad);
  ASSERT_TRUE(r.fault);
  EXPECT_EQ(r.fault->offset, message_end - 2);

  // A length of zero.
  bad = bytes;
  bad[16] = 0;
  bad[17] = 0;
  r = ReadResultBytes(bad);
  ASSERT_TRUE(r.fault);
  EXPECT_EQ(r.records.size(), 1u);
}

// voxdump's own runs read its exit status through a POSIX pipe (the Windows build checks
// voxdump.exe in its whole-job script).
#if defined(VOXDUMP_PATH) && !defined(_WIN32)
using test::RunCommand;

TEST(Voxdump, PrintsEverythingBeforeATruncatedLastRecordAndTheFault) {
  const auto bytes = test::ReadBytes(WriteSampleFile());
  const std::string path = test::TempPath("cut.res");
  test::WriteBytes(path, std::vector<uint8_t>(bytes.begin(), bytes.end() - 3));
  int status = 0;
  const std::string out =
      RunCommand(std::string("'") + VOXDUMP_PATH + "' '" + path + "' 2>/dev/null", status);
  EXPECT_EQ(WEXITSTATUS(status), 2);
  EXPECT_NE(out.find("@0 header(1) magic=\"$YRB\" format=4178"), std::string::npos) << out;
  EXPECT_NE(out.find("message(29) type=0x05[type=5] depth=0 text=\"Can not prepare data\""),
            std::string::npos);
  EXPECT_NE(out.find("vector(33) vector=0x00000003 flags=0x80000000[solved]"), std::string::npos);
  EXPECT_NE(out.find("line=2 line_name=\"R07 L2C\" value=0.25"), std::string::npos);
  EXPECT_NE(out.find("time=1980-01-06 00:01:40.000 (GPS 100.000 s)"), std::string::npos);
  EXPECT_EQ(out.find("end(0)"), std::string::npos);
  EXPECT_NE(out.find("fault at offset " + std::to_string(bytes.size() - 5)), std::string::npos);

  const std::string json = RunCommand(
      std::string("'") + VOXDUMP_PATH + "' --json --kind 29 '" + path + "' 2>/dev/null", status);
  EXPECT_EQ(json.find("\"kind\":33"), std::string::npos);
  EXPECT_NE(json.find("{\"offset\":15,\"kind\":29,\"name\":\"message\""), std::string::npos)
      << json;
  EXPECT_NE(json.find("{\"fault\":{\"offset\":"), std::string::npos);
}
#endif

}  // namespace
}  // namespace vox
