#include "results/plot_stream.h"

#include <string>

#include <gtest/gtest.h>

#include "result_test_util.h"

namespace vox {
namespace {

using test::At;

PlotLine Parsed(const std::string& name) {
  PlotLine line;
  ParsePlotLineName(line, name);
  return line;
}

TEST(PlotLineNames, SatellitesAndSignals) {
  struct Case {
    const char* name;
    uint16_t flags, sat_a, sat_b;
  };
  const Case cases[] = {
      {"G05-G12 L1", 0x100 | 1, 5, 12},
      {"R07 L2C", 0x400 | 2, 135, 0},
      {"E11 IonoFree", 5, 256 + 11, 0},
      {"G05-G12 L1-L2", 0x100 | 4, 5, 12},
      {"C30 B1I", 0x400 | 1, 320 + 30, 0},
      {"G01 L1+L2", 3, 1, 0},
      {"J02 E5AQ", 6, 192 + 2, 0},
      {"G01L1", 1, 1, 0},  // the signal may follow the digits directly
      {"Total", 0, 0, 0},
      // A name that ends inside the satellite part, or right after it, has no signal part.
      {"G05", 0, 5, 0},
      {"G05-G1", 0, 5, 0},
      {"G05   ", 0, 5, 0},
      // Equality is over the whole rest: "L1 " is not "L1".
      {"G05 L1 ", 0, 5, 0},
  };
  for (const Case& c : cases) {
    const PlotLine l = Parsed(c.name);
    EXPECT_EQ(l.flags, c.flags) << c.name;
    EXPECT_EQ(l.sat_a, c.sat_a) << c.name;
    EXPECT_EQ(l.sat_b, c.sat_b) << c.name;
  }
}

class PlotStreamTest : public testing::Test {
 protected:
  void OpenWriter(uint32_t version) {
    path_ = test::TempPath("plot.res");
    writer_.set_path(path_);
    writer_.result_version = version;
    ASSERT_TRUE(writer_.Open());
  }
  std::vector<test::RawRecord> CloseAndRead() {
    EXPECT_TRUE(writer_.Close());
    return test::SplitRecords(test::ReadBytes(path_));
  }
  std::string path_;
  TResultFile writer_;
};

TEST_F(PlotStreamTest, SetLineBoundsAndModes) {
  OpenWriter(101);
  auto stream = OpenPlotStream(writer_);
  ASSERT_TRUE(stream);
  EXPECT_EQ(stream->SetLine(1, 0, "G05 L1", "m"), 1);
  EXPECT_EQ(stream->line(1).flags, 0);
  EXPECT_EQ(stream->line(1).name, "");
  EXPECT_EQ(stream->SetLine(1024, 0, "G05 L1", nullptr), 0);
  EXPECT_EQ(stream->SetLine(0xFFFFFFFF, 0, "G05 L1", nullptr), 0);
  EXPECT_EQ(stream->SetLine(7, 2, "G05 L1", "m"), 1);
  EXPECT_EQ(stream->line(7).flags, 0x4007);
  EXPECT_EQ(stream->SetLine(8, 0, "G05 L1", "m"), 1);
  EXPECT_EQ(stream->line(8).flags, 0x210 | 1);
  EXPECT_EQ(stream->SetLine(9, 0, nullptr, "c"), 1);
  EXPECT_EQ(stream->line(9).flags, 0x20);
  ClosePlotStream(stream.release());
}

TEST_F(PlotStreamTest, StreamIdsCountPerWriter) {
  OpenWriter(101);
  auto first = OpenPlotStream(writer_);
  auto second = OpenPlotStream(writer_);
  EXPECT_EQ(first->stream_id(), 1);
  EXPECT_EQ(second->stream_id(), 2);
  ClosePlotStream(first.release());
  ClosePlotStream(second.release());
  EXPECT_EQ(ClosePlotStream(nullptr), 1);
}

TEST_F(PlotStreamTest, EpochsFlushOnChangeAndClose) {
  OpenWriter(101);
  auto stream = OpenPlotStream(writer_);
  stream->SetLine(2, 0, "G05-G12 L1", nullptr);
  EXPECT_EQ(stream->CreatePlot(2), 0);
  EXPECT_EQ(stream->CreatePlot(1024), 0);  // nothing written
  stream->SendData(1, 1, 86400.0 * 3 + 12.3456);
  stream->SendData(2, 1, 1.5);
  stream->SendData(3, 1, -2.0);
  stream->SendData(2, 2, 7.0);
  ClosePlotStream(stream.release());
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 5u);
  const auto& line = records[1];
  EXPECT_EQ(line.kind, kKindPlotLineV101);
  EXPECT_EQ(At<uint16_t>(line.payload, 0), 1);
  EXPECT_EQ(At<uint16_t>(line.payload, 2), 0x101);
  EXPECT_EQ(At<uint16_t>(line.payload, 8), 2);
  const auto& e1 = records[2];
  EXPECT_EQ(e1.kind, kKindPlotEpochV101);
  ASSERT_EQ(e1.payload.size(), 12u + 2 * 6);
  EXPECT_EQ(At<uint32_t>(e1.payload, 0), 12346u);
  EXPECT_EQ(At<uint32_t>(e1.payload, 4), 3u);
  EXPECT_EQ(At<uint16_t>(e1.payload, 8), 1);
  EXPECT_EQ(At<uint16_t>(e1.payload, 10), 2);
  EXPECT_EQ(At<uint16_t>(e1.payload, 12), 2);
  EXPECT_EQ(At<float>(e1.payload, 14), 1.5f);
  EXPECT_EQ(At<uint16_t>(e1.payload, 18), 3);
  const auto& e2 = records[3];
  ASSERT_EQ(e2.payload.size(), 12u + 6);
  EXPECT_EQ(At<float>(e2.payload, 14), 7.0f);
}

TEST_F(PlotStreamTest, CloseWithoutDataWritesNothingAndEmptyEpochWritesCountZero) {
  OpenWriter(101);
  ClosePlotStream(OpenPlotStream(writer_).release());
  auto stream = OpenPlotStream(writer_);
  stream->SendData(1, 5, 10.0);
  ClosePlotStream(stream.release());
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 3u);
  EXPECT_EQ(At<uint16_t>(records[1].payload, 10), 0);
}

TEST_F(PlotStreamTest, The1025thValueIsDropped) {
  OpenWriter(101);
  auto stream = OpenPlotStream(writer_);
  for (int i = 0; i < 1025; ++i)
    stream->SendData(2, 1, i);
  EXPECT_EQ(stream->value_count(), 1024);
  ClosePlotStream(stream.release());
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 3u);
  EXPECT_EQ(records[1].payload.size(), 12u + 1024 * 6);
  EXPECT_EQ(At<float>(records[1].payload, 12 + 1023 * 6 + 2), 1023.0f);
}

TEST_F(PlotStreamTest, ImStreamsDropSatellitesAboveAByte) {
  OpenWriter(100);
  auto stream = OpenPlotStream(writer_);
  ASSERT_NE(dynamic_cast<vox_PlotStreamIm*>(stream.get()), nullptr);
  stream->SetLine(2, 0, "E11 L1", nullptr);  // 267: does not fit
  stream->SetLine(3, 0, "R07 L2C", nullptr);
  stream->CreatePlot(3);
  stream->SendData(2, 1, 1.0);
  stream->SendData(3, 1, 2.0);
  ClosePlotStream(stream.release());
  const auto records = CloseAndRead();
  ASSERT_EQ(records.size(), 4u);
  EXPECT_EQ(records[1].kind, kKindPlotLineV100);
  EXPECT_EQ(At<uint16_t>(records[1].payload, 0), 3);
  EXPECT_EQ(records[1].payload[2], 3);
  EXPECT_EQ(records[1].payload[3], 7);
  const auto& e = records[2];
  EXPECT_EQ(e.kind, kKindPlotEpochV100);
  ASSERT_EQ(e.payload.size(), 12u + 8);
  EXPECT_EQ(At<uint16_t>(e.payload, 12), 0x402);
  EXPECT_EQ(e.payload[14], 135);
  EXPECT_EQ(At<float>(e.payload, 16), 2.0f);
}

}  // namespace
}  // namespace vox
