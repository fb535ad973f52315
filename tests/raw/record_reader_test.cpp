#include "raw/record_reader.h"

#include <gtest/gtest.h>

#include <cmath>

#include "base/buf_file.h"
#include "raw/raw_decoder.h"
#include "raw/signal_rules.h"
#include "raw_test_files.h"

namespace vox {
namespace {

using voxtools::RawOrder;
using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;

class RecordReaderTest : public ::testing::TestWithParam<RawOrder> {
 protected:
  RawWriter Writer() const { return RawWriter(GetParam()); }
};

// Walks a whole file; returns the tags read and the final result.
struct Walk {
  std::vector<uint8_t> tags;
  int start_status = -1;
  std::string start_message;
  ReadResult end = ReadResult::kOk;
  bool reached_end = false;
};

// A written file opened through the library's file object, with a reader over it.
struct OpenedFile {
  explicit OpenedFile(const RawWriter& w) : raw(w) { EXPECT_TRUE(file.OpenRead(raw.path())); }
  test::TempRawFile raw;
  TBufFile file;
  RecordReader reader{file};
};

Walk WalkFile(const voxtools::RawWriter& w) {
  OpenedFile f(w);
  RecordReader& reader = f.reader;
  Walk walk;
  const RawStart start = reader.Start();
  walk.start_status = start.status;
  walk.start_message = start.message ? start.message : "";
  if (start.status != 0) return walk;
  while (reader.next_tag() != kTagEnd) {
    walk.end = reader.Next();
    if (walk.end != ReadResult::kOk) return walk;
    walk.tags.push_back(reader.tag());
  }
  walk.reached_end = true;
  return walk;
}

TEST_P(RecordReaderTest, HeaderFollowedByEndRecordReachesTheEndWithNoData) {
  RawWriter w = Writer();
  w.Header().EndOfData();
  const Walk walk = WalkFile(w);
  EXPECT_EQ(walk.start_status, 0);
  EXPECT_TRUE(walk.reached_end);
  EXPECT_TRUE(walk.tags.empty());
}

TEST_P(RecordReaderTest, EndTagWithoutItsLengthIsAnEarlyEnd) {
  RawWriter w = Writer();
  w.Header().EndOfData(/*cut=*/true);
  const Walk walk = WalkFile(w);
  EXPECT_EQ(walk.start_status, 2);
  EXPECT_EQ(walk.start_message, " - Unexpected EOF\n");

  RawWriter w2 = Writer();
  w2.Header().TimeRef("GPS", {0, 100}).EndOfData(true);
  const Walk walk2 = WalkFile(w2);
  EXPECT_EQ(walk2.start_status, 0);
  EXPECT_EQ(walk2.end, ReadResult::kTruncated);
}

TEST_P(RecordReaderTest, HeaderFailuresGiveTheirMessages) {
  RawWriter bad_type = Writer();
  bad_type.Header('X').EndOfData();
  EXPECT_EQ(WalkFile(bad_type).start_message, " - Unexpected type tag\n");
  RawWriter bad_version = Writer();
  bad_version.Header('N', 1).EndOfData();
  EXPECT_EQ(WalkFile(bad_version).start_message, " - Unexpected version\n");
  RawWriter bad_signature = Writer();
  bad_signature.Header('O', 0, true).EndOfData();
  EXPECT_EQ(WalkFile(bad_signature).start_message, " - Unexpected signature\n");
  RawWriter not_header = Writer();
  not_header.TimeRef("GPS", {0, 0}).EndOfData();
  EXPECT_EQ(WalkFile(not_header).start_status, 3);
  RawWriter tiny = Writer();
  tiny.U8(1).U16(15);
  EXPECT_EQ(WalkFile(tiny).start_status, 2);
}

TEST_P(RecordReaderTest, OverLongRecordIsReadAndTheNextFoundByItsLength) {
  RawWriter w = Writer();
  w.Header();
  w.Begin(3).U32(0).U32(5000).U32(100).Zeros(37).End();  // 37 bytes the decoder ignores
  w.TimeRef("GPS", {7000, 101});
  w.EndOfData();
  OpenedFile f(w);
  RecordReader& reader = f.reader;
  ASSERT_EQ(reader.Start().status, 0);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  TimeRefRecord t;
  EXPECT_EQ(reader.decoder().time_ref(reader.body(), t), 12u);
  EXPECT_EQ(t.time.day, 100u);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  reader.decoder().time_ref(reader.body(), t);
  EXPECT_EQ(t.time.ms_of_day, 7000u);
  EXPECT_EQ(t.time.day, 101u);
  EXPECT_EQ(reader.next_tag(), kTagEnd);
}

TEST_P(RecordReaderTest, LengthsOutsideTheFrameOrTheBufferStopTheWalk) {
  for (uint16_t length : {0, 4, 16385, 65535}) {
    RawWriter w = Writer();
    w.Header().Begin(2).Str("a").End(length).EndOfData();
    const Walk walk = WalkFile(w);
    EXPECT_EQ(walk.end, ReadResult::kBadLength) << length;
  }
  // A record of exactly 16384 bytes fits.
  RawWriter w = Writer();
  w.Header().Begin(99).Zeros(16384 - 5).End().EndOfData();
  const Walk walk = WalkFile(w);
  EXPECT_TRUE(walk.reached_end);
  ASSERT_EQ(walk.tags.size(), 1u);
}

TEST_P(RecordReaderTest, RecordPositionsLeadBackToTheirRecords) {
  RawWriter w = Writer();
  w.Header().Receiver("a", "b", "c", "d", "e");
  const size_t time_ref_at = w.offset();
  w.TimeRef("UTC", {1, 2}, 9, 18).EndOfData();
  OpenedFile f(w);
  RecordReader& reader = f.reader;
  ASSERT_EQ(reader.Start().status, 0);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  EXPECT_EQ(reader.position(), time_ref_at - 2);
  ASSERT_TRUE(reader.Seek(reader.position()));
  EXPECT_EQ(reader.next_tag(), kTagTimeRef);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  TimeRefRecord t;
  EXPECT_EQ(reader.decoder().time_ref(reader.body(), t), 20u);
  EXPECT_FALSE(t.IsGps());
  EXPECT_TRUE(t.has_field_a && t.has_leap);
  EXPECT_EQ(t.field_a, 9u);
  EXPECT_EQ(t.leap_seconds, 18u);
}

TEST_P(RecordReaderTest, LongStringKeepsItsCapacityAndTheNextFieldFollowsIt) {
  RawWriter w = Writer();
  const std::string thirty(30, 'x');
  w.Header().Receiver("first", "second", thirty, "model", "v1").EndOfData();
  OpenedFile f(w);
  RecordReader& reader = f.reader;
  ASSERT_EQ(reader.Start().status, 0);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  ReceiverRecord r;
  EXPECT_EQ(reader.decoder().receiver(reader.body(), r), 6u + 7u + 31u + 6u + 3u);
  EXPECT_EQ(std::string(r.s3), std::string(20, 'x'));
  EXPECT_STREQ(r.s4, "model");
  EXPECT_STREQ(r.s5, "v1");
}

INSTANTIATE_TEST_SUITE_P(BothOrders, RecordReaderTest,
                         ::testing::Values(RawOrder::kLittle, RawOrder::kBig));

// ---- decoding of blocks and values

template <typename Fn>
void WithRecord(RawOrder order, const std::function<void(RawWriter&)>& build, Fn check) {
  RawWriter w(order);
  w.Header();
  build(w);
  w.EndOfData();
  OpenedFile f(w);
  RecordReader& reader = f.reader;
  ASSERT_EQ(reader.Start().status, 0);
  ASSERT_EQ(reader.Next(), ReadResult::kOk);
  check(reader);
}

// Decodes the first satellite's signal blocks of an epoch record.
std::vector<SignalBlock> Signals(const RecordReader& r, SatBlock& sat) {
  const RawDecoder& d = r.decoder();
  ByteSpan b = r.body();
  EpochHeader h;
  b = b.subspan(d.epoch(b, h));
  const bool t51 = r.tag() == kTagEpoch51;
  b = b.subspan(t51 ? d.sat_block51(b, sat) : d.sat_block8(b, sat));
  std::vector<SignalBlock> out;
  for (;;) {
    SignalBlock s;
    const size_t n = t51 ? d.signal51(b, s) : d.signal8(b, s);
    if (n == 0) break;
    out.push_back(s);
    b = b.subspan(n);
    if (!(s.flags & kSigMore)) break;
  }
  return out;
}

TEST(SignalDecoding, CodeWindowDropsValuesFromTwoToThe28AndKeepsZero) {
  for (RawOrder order : {RawOrder::kLittle, RawOrder::kBig}) {
    WithRecord(
        order,
        [](RawWriter& w) {
          RawSatellite sat{voxtools::SatCode51('G', 5), 1, 2, {}};
          sat.signals.push_back(RawSignal::Tag51(16, 3.0e8, 1.0e20));
          sat.signals.push_back(RawSignal::Tag51(20, 0.0, 0.0));
          sat.signals.push_back(RawSignal::Tag51(36, std::ldexp(1.0, 28) * 0.999, 1.0e13));
          w.Epoch(51, 1000, {sat});
        },
        [](const RecordReader& r) {
          SatBlock sat;
          const auto s = Signals(r, sat);
          ASSERT_EQ(s.size(), 3u);
          EXPECT_EQ(sat.sat, MakeSatId(SatSystem::kGps, 5));
          EXPECT_EQ(sat.b2, 1);
          EXPECT_EQ(sat.b3, 2);
          EXPECT_FALSE(s[0].flags & kSigCode);   // 3e8 m >= 2^28
          EXPECT_FALSE(s[0].flags & kSigPhase);  // 1e20 >= 2^44
          EXPECT_TRUE(s[1].flags & kSigCode);    // zero passes
          EXPECT_TRUE(s[1].flags & kSigPhase);
          EXPECT_TRUE(s[2].flags & kSigCode);
          EXPECT_TRUE(s[2].flags & kSigPhase);
        });
  }
}

TEST(SignalDecoding, GalileoBlockWithGpsCodeIsConsumedButHasNoSlot) {
  WithRecord(
      RawOrder::kBig,
      [](RawWriter& w) {
        RawSatellite e{voxtools::SatCode51('E', 11), 0, 0, {}};
        e.signals.push_back(RawSignal::Tag51(20, 2.2e7, 1.1e8));
        e.signals.push_back(RawSignal::Tag51(18, 2.3e7, {}));
        w.Epoch(51, 0, {e});
      },
      [](const RecordReader& r) {
        SatBlock sat;
        const auto s = Signals(r, sat);
        ASSERT_EQ(s.size(), 2u);
        EXPECT_EQ(sat.sat, MakeSatId(SatSystem::kGalileo, 11));
        EXPECT_EQ(Slot51(sat.group, s[0].flags & 0x7F), kNoSlot);
        EXPECT_EQ(Slot51(sat.group, s[1].flags & 0x7F), kL1C);
        EXPECT_DOUBLE_EQ(s[1].code, 2.3e7);
      });
}

TEST(SignalDecoding, FloatFieldsAndOptionalBytesAreConsumedInOrder) {
  WithRecord(
      RawOrder::kBig,
      [](RawWriter& w) {
        RawSatellite g{voxtools::SatCode8('R', 3), 0, 0, {}};
        RawSignal s = RawSignal::Tag8(2, 2.0e7, 1.0e8);
        s.flags |= (1u << 5) | (1u << 6) | (1u << 10) | (1u << 11);
        s.byte_a = 7, s.byte_b = 8, s.f32a = 5.0e6f /* >= 2^21: dropped */, s.correction = 0.5f;
        g.signals.push_back(s);
        g.signals.push_back(RawSignal::Tag8(1, {}, 3.0));
        w.Epoch(8, 0, {g}, 1.5);
      },
      [](const RecordReader& r) {
        SatBlock sat;
        const auto s = Signals(r, sat);
        ASSERT_EQ(s.size(), 2u);
        EXPECT_EQ(sat.sat, MakeSatId(SatSystem::kGlonass, 3));
        EXPECT_EQ(s[0].byte_a, 7);
        EXPECT_EQ(s[0].byte_b, 8);
        EXPECT_FALSE(s[0].flags & kSigF32A);
        EXPECT_TRUE(s[0].flags & kSigCorrection);
        EXPECT_FLOAT_EQ(s[0].correction, 0.5f);
        EXPECT_EQ(Kind8(s[1].flags), 1u);
        EXPECT_DOUBLE_EQ(s[1].phase, 3.0);
      });
}

TEST(SignalDecoding, TruncatedEpochRecordNeverReadsPastItsBody) {
  // The satellite count promises more blocks than the body holds.
  WithRecord(
      RawOrder::kLittle,
      [](RawWriter& w) {
        RawSatellite g{voxtools::SatCode51('G', 1), 0, 0, {RawSignal::Tag51(16, 2e7, 1e8)}};
        w.Epoch(51, 0, {g}, {}, 40);
      },
      [](const RecordReader& r) {
        const RawDecoder& d = r.decoder();
        ByteSpan b = r.body();
        EpochHeader h;
        b = b.subspan(d.epoch(b, h));
        EXPECT_EQ(h.sat_count, 40);
        SatBlock sat;
        b = b.subspan(d.sat_block51(b, sat));
        SignalBlock s;
        b = b.subspan(d.signal51(b, s));
        EXPECT_TRUE(b.empty());
        EXPECT_EQ(d.sat_block51(b, sat), 0u);
      });
}

TEST(SatelliteCodes, DecodeEveryGroupAndRejectOutOfRange) {
  EXPECT_EQ(DecodeSatCode(5, false).sat, MakeSatId(SatSystem::kGps, 5));
  EXPECT_EQ(DecodeSatCode((1 << 6) | 20, false).sat, MakeSatId(SatSystem::kSbas, 20));
  EXPECT_EQ(DecodeSatCode((2 << 6) | 24, false).sat, MakeSatId(SatSystem::kGlonass, 24));
  EXPECT_EQ(DecodeSatCode((3 << 6) | 5, false).sat, MakeSatId(SatSystem::kGps, 37));
  EXPECT_FALSE(DecodeSatCode((3 << 6) | 6, false).valid);  // GPS 38
  EXPECT_FALSE(DecodeSatCode((2 << 6) | 25, false).valid);
  EXPECT_FALSE(DecodeSatCode((1 << 6) | 19, false).valid);
  EXPECT_EQ(DecodeSatCode((4 << 6) | 30, true).sat, MakeSatId(SatSystem::kGalileo, 30));
  EXPECT_EQ(DecodeSatCode((5 << 6) | 37, true).sat, MakeSatId(SatSystem::kBds, 37));
  EXPECT_FALSE(DecodeSatCode((6 << 6) | 1, true).valid);
  EXPECT_FALSE(DecodeSatCode(0, true).valid);  // GPS 0
}

TEST(SignalTables, KindTablesOfTheScanAndTheStreamDifferOnlyForKinds1And3) {
  EXPECT_EQ(Slot8ForMask(0), kL1P);
  EXPECT_EQ(Slot8ForValues(0), kL1P);
  EXPECT_EQ(Slot8ForMask(2), kL1C);
  EXPECT_EQ(Slot8ForValues(2), kL1C);
  EXPECT_EQ(Slot8ForMask(1), kL2C);
  EXPECT_EQ(Slot8ForValues(1), kL2P);
  EXPECT_EQ(Slot8ForMask(3), kL2P);
  EXPECT_EQ(Slot8ForValues(3), kL2C);
  EXPECT_EQ(Slot51(0, 36), kL2P);
  EXPECT_EQ(Slot51(3, 36), kNoSlot);  // GPS 33+ has no L2P code
  EXPECT_EQ(Slot51(3, 18), kL1P);
  EXPECT_EQ(Slot51(5, 99), kL5X);
  EXPECT_EQ(Slot51(1, 82), kL5X);
  EXPECT_EQ(Slot51(2, 34), kL2P);
}

}  // namespace
}  // namespace vox
