#include "results/result_file.h"

#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "result_test_util.h"
#include "results/plot_description.h"
#include "results/record_builder.h"

namespace vox {
namespace {

using test::At;
using test::ReadBytes;
using test::SplitRecords;
using test::TempPath;

// The records of a file written by `write` between Open and Close.
template <typename Write>
std::vector<test::RawRecord> WrittenRecords(const char* name, Write write) {
  const std::string path = TempPath(name);
  TResultFile writer(path);
  EXPECT_TRUE(writer.Open());
  write(writer);
  EXPECT_TRUE(writer.Close());
  return SplitRecords(ReadBytes(path));
}

TEST(ResultFileFraming, EmptyFileIsHeaderAndEndRecord) {
  const std::string path = TempPath("empty.res");
  TResultFile writer(path);
  ASSERT_TRUE(writer.Open());
  EXPECT_TRUE(writer.Close());
  const auto bytes = ReadBytes(path);
  const std::vector<uint8_t> expected = {1, 15, 0, '$', 'Y', 'R', 'B', 0x52, 0x10, 0,
                                         0, 0,  0, 15,  0,   0,   5,   0,    5,    0};
  EXPECT_EQ(bytes, expected);
}

TEST(ResultFileFraming, MessagesAreCutAndNullIsEmpty) {
  const auto records = WrittenRecords("msg.res", [](TResultFile& writer) {
    EXPECT_TRUE(writer.WriteMessage(std::string(300, 'x').c_str(), 1));
    EXPECT_TRUE(writer.WriteMessage(nullptr, 3));
  });
  ASSERT_EQ(records.size(), 4u);
  EXPECT_EQ(records[1].kind, kKindMessage);
  EXPECT_EQ(At<uint32_t>(records[1].payload, 0), 3u);
  ASSERT_EQ(records[1].payload.size(), 8u + 1 + 255);
  EXPECT_EQ(records[1].payload[8], 255);
  EXPECT_EQ(records[2].payload.size(), 9u);  // L = 14
  EXPECT_EQ(At<uint32_t>(records[2].payload, 0), 5u);
  EXPECT_EQ(records[2].payload[8], 0);
}

TEST(ResultFileFraming, MessageFlagsGiveTypesAndDepths) {
  const auto records = WrittenRecords("depth.res", [](TResultFile& writer) {
    writer.WriteMessage("open", 0x10);
    writer.WriteMessage("close", 0x20);
    writer.WriteMessage("both", 0x30 | 0x400 | 9);
  });
  ASSERT_EQ(records.size(), 5u);
  EXPECT_EQ(At<uint32_t>(records[1].payload, 0), 0x20u);
  EXPECT_EQ(At<uint32_t>(records[1].payload, 4), 1u);
  EXPECT_EQ(At<uint32_t>(records[2].payload, 0), 0x40u);
  EXPECT_EQ(At<uint32_t>(records[2].payload, 4), 0u);
  EXPECT_EQ(At<uint32_t>(records[3].payload, 0), 6u + 0x20 + 0x40 + 0x80);
  EXPECT_EQ(At<uint32_t>(records[3].payload, 4), 0u);
}

TEST(ResultFileFraming, MessageTypeTable) {
  const uint32_t expected[16] = {0, 3, 4, 5, 0, 1, 2, 1, 7, 6, 0, 0, 0, 0, 0, 0};
  for (uint32_t f = 0; f < 16; ++f)
    EXPECT_EQ(MessageType(f), expected[f]) << f;
}

TEST(ResultFileFraming, RecordOver16377BytesIsRefused) {
  const auto records = WrittenRecords("big.res", [](TResultFile& writer) {
    const std::vector<uint8_t> payload(16378, 0xAB);
    EXPECT_FALSE(writer.WriteRecord(30, payload.data(), payload.size()));
    EXPECT_TRUE(writer.WriteRecord(30, payload.data(), 16377));
  });
  ASSERT_EQ(records.size(), 3u);
  EXPECT_EQ(records[1].payload.size(), 16377u);
}

TEST(ResultFileFraming, PlotDescriptionsAreEncoded) {
  const auto records = WrittenRecords("plot.res", [](TResultFile& writer) {
    PlotLineDescEx ex{};
    ex.stream_id = 1;
    ex.flags = 0x101;
    ex.sat_a = 5;
    ex.sat_b = 12;
    ex.index = 7;
    std::strcpy(ex.name, "G05-G12 L1");
    EXPECT_TRUE(writer.WriteRecord(kKindPlotLineV101, &ex, sizeof ex));
    PlotLineDescIm im{};
    im.index = 9;
    im.value = 3;
    std::memset(im.name, 'n', kPlotNameMax);  // no terminator inside the 80 bytes
    EXPECT_TRUE(writer.WriteRecord(kKindPlotLineV100, &im, sizeof im));
    EXPECT_FALSE(writer.WriteRecord(kKindPlotLineV101, &ex, 5));  // shorter than its fixed part
  });
  ASSERT_EQ(records.size(), 4u);
  const auto& p53 = records[1].payload;
  ASSERT_EQ(p53.size(), 11u + 10);
  EXPECT_EQ(At<uint16_t>(p53, 2), 0x101);
  EXPECT_EQ(At<uint16_t>(p53, 8), 7);
  EXPECT_EQ(p53[10], 10);
  EXPECT_EQ(std::string(p53.begin() + 11, p53.end()), "G05-G12 L1");
  const auto& p4 = records[2].payload;
  ASSERT_EQ(p4.size(), 4u + 80);
  EXPECT_EQ(At<uint16_t>(p4, 0), 9);
  EXPECT_EQ(p4[2], 3);
  EXPECT_EQ(p4[3], 80);
}

TEST(ResultFileFraming, WritesAfterCloseFail) {
  const std::string path = TempPath("closed.res");
  TResultFile writer(path);
  EXPECT_FALSE(writer.WriteMessage("x", 1));
  EXPECT_FALSE(writer.Close());
}

// A full disk must show in Close's result even when the end record still sat in the buffer.
TEST(ResultFileFraming, CloseReportsAFailedFinalFlush) {
  if (!std::filesystem::exists("/dev/full")) GTEST_SKIP() << "no /dev/full on this system";
  TResultFile writer("/dev/full");
  if (!writer.Open()) GTEST_SKIP() << "/dev/full cannot be opened for writing";
  writer.WriteMessage("lost", 1);
  EXPECT_FALSE(writer.Close());
}

class ResultFileAppend : public testing::Test {
 protected:
  // A thread file with header, two records and the end record.
  std::string MakeThreadFile() {
    const std::string path = TempPath("thread.tmp");
    TResultFile thread(path);
    EXPECT_TRUE(thread.Open());
    thread.WriteMessage("from thread", 1);
    const uint8_t sol[8] = {1, 0, 0, 0, 0, 0, 0, 0};
    thread.WriteRecord(kKindSolutionStart, sol, sizeof sol);
    EXPECT_TRUE(thread.Close());
    return path;
  }
};

TEST_F(ResultFileAppend, AddsExactlyTheThreadRecords) {
  const std::string thread = MakeThreadFile();
  const std::string path = TempPath("main.res");
  TResultFile writer(path);
  ASSERT_TRUE(writer.Open());
  EXPECT_EQ(writer.Append(thread), 2u);
  ASSERT_TRUE(writer.Close());
  const auto records = SplitRecords(ReadBytes(path));
  ASSERT_EQ(records.size(), 4u);
  EXPECT_EQ(records[0].kind, kKindHeader);
  EXPECT_EQ(records[1].kind, kKindMessage);
  EXPECT_EQ(records[2].kind, kKindSolutionStart);
  EXPECT_EQ(records[3].kind, kKindEnd);
}

TEST_F(ResultFileAppend, StopsAtACutOrCorruptRecord) {
  const std::string thread = MakeThreadFile();
  auto bytes = ReadBytes(thread);
  const size_t solution_at = 15 + 3 + 8 + 1 + 11 + 2;  // header, message
  ASSERT_EQ(bytes[solution_at], kKindSolutionStart);

  // Cut inside the second record: only the message survives.
  auto cut = std::vector<uint8_t>(bytes.begin(), bytes.begin() + solution_at + 6);
  test::WriteBytes(thread, cut);
  const std::string path = TempPath("main.res");
  TResultFile writer(path);
  ASSERT_TRUE(writer.Open());
  EXPECT_EQ(writer.Append(thread), 1u);

  // A length of zero must not make the walk spin or run backwards.
  auto zero = bytes;
  zero[solution_at + 1] = 0;
  zero[solution_at + 2] = 0;
  test::WriteBytes(thread, zero);
  EXPECT_EQ(writer.Append(thread), 1u);

  // A length far past the end of the file.
  auto huge = bytes;
  huge[solution_at + 1] = 0xFF;
  huge[solution_at + 2] = 0x7F;
  test::WriteBytes(thread, huge);
  EXPECT_EQ(writer.Append(thread), 1u);

  EXPECT_EQ(writer.Append(TempPath("missing.tmp")), 0u);
  ASSERT_TRUE(writer.Close());
  EXPECT_EQ(SplitRecords(ReadBytes(path)).size(), 5u);
}

// A record framed by hand: kind, length, payload, length.
std::vector<uint8_t> Frame(uint8_t kind, const std::vector<uint8_t>& payload) {
  const auto length = static_cast<uint16_t>(payload.size() + 5);
  std::vector<uint8_t> out{kind, static_cast<uint8_t>(length), static_cast<uint8_t>(length >> 8)};
  out.insert(out.end(), payload.begin(), payload.end());
  out.push_back(static_cast<uint8_t>(length));
  out.push_back(static_cast<uint8_t>(length >> 8));
  return out;
}

void Add(std::vector<uint8_t>& to, const std::vector<uint8_t>& bytes) {
  to.insert(to.end(), bytes.begin(), bytes.end());
}

// The merge copies runs of records in single writes, and thread files are written through a
// large buffer; the bytes must be those of copying record by record, for merges of many
// buffers' worth, a header met inside a run, and a thread file cut inside a run.
TEST_F(ResultFileAppend, LargeMergesGiveTheRecordByRecordBytes) {
  const std::vector<uint8_t> header =
      Frame(kKindHeader, {'$', 'Y', 'R', 'B', 0x52, 0x10, 0, 0, 0, 0});
  const std::string thread_path = TempPath("big.tmp");
  // A thread file left over from earlier, longer than what follows: replaced, not overlaid.
  test::WriteBytes(thread_path, std::vector<uint8_t>(5000, 0xEE));
  TResultFile thread(thread_path);
  ASSERT_TRUE(thread.OpenThreadFile());
  std::vector<uint8_t> records;  // what the merge must copy
  std::vector<size_t> ends;      // where each record ends in `records`
  const size_t sizes[] = {0, 1, 100, kMaxRecordPayload, 4000, 2, 16000, 57};
  for (size_t i = 0; records.size() < 3'000'000; ++i) {
    std::vector<uint8_t> payload(sizes[i % std::size(sizes)]);
    for (size_t j = 0; j < payload.size(); ++j)
      payload[j] = static_cast<uint8_t>(i * 7 + j);
    ASSERT_TRUE(thread.WriteRecord(kKindVector, payload.data(), payload.size()));
    Add(records, Frame(kKindVector, payload));
    ends.push_back(records.size());
  }
  ASSERT_TRUE(thread.Close());
  std::vector<uint8_t> thread_bytes = header;
  Add(thread_bytes, records);
  Add(thread_bytes, Frame(kKindEnd, {}));
  ASSERT_EQ(ReadBytes(thread_path), thread_bytes);

  // A second thread file with a header in the middle of its records: left out like the first.
  const std::string odd_path = TempPath("odd.tmp");
  const std::vector<uint8_t> first = Frame(kKindMessage, std::vector<uint8_t>(300, 1));
  const std::vector<uint8_t> second = Frame(kKindFan, std::vector<uint8_t>(9000, 2));
  std::vector<uint8_t> odd = header;
  Add(odd, first);
  Add(odd, header);
  Add(odd, second);
  Add(odd, Frame(kKindEnd, {}));
  Add(odd, first);  // after the end record: not copied
  test::WriteBytes(odd_path, odd);

  const std::string path = TempPath("merged.res");
  TResultFile writer(path);
  ASSERT_TRUE(writer.Open());
  ASSERT_TRUE(writer.WriteMessage("job", 1));
  EXPECT_EQ(writer.Append(thread_path), ends.size());
  EXPECT_EQ(writer.Append(odd_path), 2u);
  // Cut inside the run, in the largest record that follows the cut_after'th: in its head,
  // in its middle, just before its last byte.
  const size_t cut_after = ends.size() / 2 / std::size(sizes) * std::size(sizes) + 2;
  for (const size_t into : {size_t{1}, size_t{3000}, sizes[3] + 4}) {
    auto cut = std::vector<uint8_t>(thread_bytes.begin(),
                                    thread_bytes.begin() + header.size() + ends[cut_after] + into);
    test::WriteBytes(thread_path, cut);
    EXPECT_EQ(writer.Append(thread_path), cut_after + 1);
  }
  ASSERT_TRUE(writer.Close());

  std::vector<uint8_t> expected = header;
  RecordBuilder message;
  message.U32(3).U32(0).CountedString("job");
  Add(expected, Frame(kKindMessage, {message.data(), message.data() + message.size()}));
  Add(expected, records);
  Add(expected, first);
  Add(expected, second);
  for (int i = 0; i < 3; ++i)
    expected.insert(expected.end(), records.begin(), records.begin() + ends[cut_after]);
  Add(expected, Frame(kKindEnd, {}));
  EXPECT_EQ(ReadBytes(path), expected);
}

}  // namespace
}  // namespace vox
