// The scan's signal walk reads only what can change its results (flags always, values only
// while they can still add a mask bit or feed the L2C note) and reads records in place from
// the mapped file. These tests hold it to a plain reference: every block decoded whole by the
// record decoders, over random and damaged epoch records in both byte orders and both tags.
#include <gtest/gtest.h>

#include <bit>
#include <bitset>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "base/buf_file.h"
#include "raw/raw_codec.h"
#include "raw/record_reader.h"
#include "raw/scan_rules.h"
#include "raw/signal_rules.h"
#include "scan_test_util.h"

namespace vox {
namespace {

using voxtools::RawOrder;
using voxtools::RawWriter;

// ---- the pieces the walk relies on

template <typename Order, bool kTag51>
void ExpectLayoutsMatchTheDecoder() {
  // Distinct bytes, so that each value read shows where it was read from.
  uint8_t bytes[64];
  for (unsigned i = 0; i < sizeof bytes; ++i)
    bytes[i] = static_cast<uint8_t>(i * 7 + 1);
  for (unsigned f = 0; f < 65536; ++f) {
    const auto flags = static_cast<uint16_t>(f);
    Order::template Store<uint16_t>(bytes, flags);
    SignalBlock s;
    const size_t n = kTag51 ? RawCodec<Order>::Signal51(ByteSpan(bytes, sizeof bytes), s)
                            : RawCodec<Order>::Signal8(ByteSpan(bytes, sizeof bytes), s);
    const SignalLayout& layout = SignalLayoutOf<kTag51>(flags);
    ASSERT_EQ(layout.size, n) << std::hex << f;
    if (flags & kSigCode) {
      ASSERT_EQ(std::bit_cast<uint64_t>(s.code),
                Order::template Load<uint64_t>(bytes + layout.code_at))
          << std::hex << f;
    }
    if (flags & kSigPhase) {
      ASSERT_EQ(std::bit_cast<uint64_t>(s.phase),
                Order::template Load<uint64_t>(bytes + layout.phase_at))
          << std::hex << f;
    }
  }
}

TEST(ScanWalkPieces, SignalLayoutsMatchTheDecodersForEveryFlagsWord) {
  ExpectLayoutsMatchTheDecoder<LittleEndianOrder, true>();
  ExpectLayoutsMatchTheDecoder<LittleEndianOrder, false>();
  ExpectLayoutsMatchTheDecoder<BigEndianOrder, true>();
  ExpectLayoutsMatchTheDecoder<BigEndianOrder, false>();
}

TEST(ScanWalkPieces, BitWindowChecksAgreeWithTheFloatChecks) {
  std::vector<double> values = {0.0,
                                -0.0,
                                std::numeric_limits<double>::denorm_min(),
                                -std::numeric_limits<double>::min(),
                                std::numeric_limits<double>::infinity(),
                                -std::numeric_limits<double>::infinity(),
                                std::numeric_limits<double>::quiet_NaN(),
                                -std::numeric_limits<double>::quiet_NaN(),
                                std::numeric_limits<double>::max(),
                                2.0e7,
                                -1.2e8};
  for (int e : {-51, -50, -49, 27, 28, 29, 43, 44, 45}) {
    const double v = std::ldexp(1.0, e);
    for (double w : {v, std::nextafter(v, 0.0), std::nextafter(v, 1e300)}) {
      values.push_back(w);
      values.push_back(-w);
    }
  }
  std::mt19937_64 random(7);
  for (int i = 0; i < 200000; ++i)
    values.push_back(std::bit_cast<double>(random()));
  for (double v : values) {
    const uint64_t bits = std::bit_cast<uint64_t>(v);
    ASSERT_EQ(CodeBitsOk(bits), CodeValueOk(v)) << std::hex << bits;
    ASSERT_EQ(PhaseBitsOk(bits), PhaseValueOk(v)) << std::hex << bits;
  }
}

// ---- the reference: every block decoded whole, as the decoders describe it

struct Reference {
  uint32_t masks[kSystemCount] = {};
  C2Collector c2;
  uint32_t epochs = 0;
  uint8_t max_satellites = 0;
  std::bitset<kSatIndexCount> seen;
};

template <typename Order>
void ReferenceEpoch(Reference& ref, ByteSpan body, bool tag51) {
  using C = RawCodec<Order>;
  EpochHeader h;
  size_t n = C::Epoch(body, h);
  if (n == 0) return;
  body = body.subspan(n);
  for (unsigned i = 0; i < h.sat_count; ++i) {
    SatBlock sat;
    n = tag51 ? C::SatBlock51(body, sat) : C::SatBlock8(body, sat);
    if (n == 0) break;
    body = body.subspan(n);
    if (sat.valid) ref.seen.set(SatIndexOf(sat.sat));
    const bool gps0 = tag51 && sat.group == 0;
    uint32_t mask = 0;
    double l2c = 0.0, l2p = 0.0;
    bool truncated = false;
    for (;;) {
      SignalBlock s;
      n = tag51 ? C::Signal51(body, s) : C::Signal8(body, s);
      if (n == 0) {
        truncated = true;
        break;
      }
      body = body.subspan(n);
      if (!tag51) {
        const SignalSlot slot = Slot8ForMask(Kind8(s.flags));
        mask |= ((s.flags & kSigCode) ? CodeBit(slot) : 0u) |
                ((s.flags & kSigPhase) ? PhaseBit(slot) : 0u);
      } else if (const SignalSlot slot = Slot51(sat.group, s.flags & 0x7F); slot != kNoSlot) {
        const bool code_ok = (s.flags & kSigCode) && !(s.flags & kSigCodeBad);
        const bool phase_ok = (s.flags & kSigPhase) && !(s.flags & kSigPhaseBad);
        mask |= (code_ok ? CodeBit(slot) : 0u) | (phase_ok ? PhaseBit(slot) : 0u);
      }
      if (gps0 && (s.flags & kSigPhase) && !(s.flags & kSigPhaseBad)) {
        const unsigned code = s.flags & 0x7F, number = NumberOf(sat.sat);
        if (code == 32 || code == 34 || code == 35) {
          l2c = s.phase;
          if (number >= 1 && number <= 32) ref.c2.working_l2c_mask |= 1u << (number - 1);
        } else if (code == 36 || code == 37) {
          l2p = s.phase;
        }
      }
      if (!(s.flags & kSigMore)) break;
    }
    if (!tag51 || sat.group <= 5) ref.masks[static_cast<unsigned>(SystemOf(sat.sat))] |= mask;
    if (gps0 && l2c != 0.0 && l2p != 0.0) ref.c2.Add(NumberOf(sat.sat), l2c, l2p);
    if (truncated) break;
  }
  ++ref.epochs;
  if (h.sat_count > ref.max_satellites) ref.max_satellites = h.sat_count;
}

// Walks the file through the buffer (mapping off) and scans its epochs the reference way.
Reference ReferenceScan(const std::string& path) {
  Reference ref;
  TBufFile file;
  file.set_mapping_allowed(false);
  EXPECT_TRUE(file.OpenRead(path));
  RecordReader reader(file);
  const RawStart start = reader.Start();
  EXPECT_EQ(start.status, 0);
  while (start.status == 0 && reader.next_tag() != kTagEnd) {
    if (reader.Next() != ReadResult::kOk) break;
    if (reader.tag() != kTagEpoch8 && reader.tag() != kTagEpoch51) continue;
    if (start.order == ByteOrder::kBig)
      ReferenceEpoch<BigEndianOrder>(ref, reader.body(), reader.tag() == kTagEpoch51);
    else
      ReferenceEpoch<LittleEndianOrder>(ref, reader.body(), reader.tag() == kTagEpoch51);
  }
  return ref;
}

// ---- random epoch records, many of them damaged

class RandomEpochs {
 public:
  explicit RandomEpochs(uint32_t seed) : random_(seed) {}

  // An epoch record body with n satellites, cut short now and then.
  std::vector<uint8_t> Body(RawOrder order, bool tag51, uint32_t ms_of_day) {
    RawWriter w(order);
    const unsigned n = Pick(9);
    w.U32(ms_of_day).U16(0);
    const bool extra = Pick(8) == 0;
    w.U8(extra ? 0x80 : 0);
    // The count usually agrees with the blocks, but not always.
    w.U8(static_cast<uint8_t>(Pick(6) == 0 ? Pick(12) : n));
    if (extra) w.F64(1.5);
    for (unsigned i = 0; i < n; ++i)
      Satellite(w, tag51);
    // A good GPS pair of L2C and L2P phases in every epoch, so that the L2C note decides.
    if (tag51 && Pick(4) != 0) GoodL2Pair(w, static_cast<uint16_t>(1 + Pick(3)));
    std::vector<uint8_t> body = w.bytes();
    if (Pick(5) == 0 && !body.empty()) body.resize(Pick(static_cast<unsigned>(body.size())));
    return body;
  }

 private:
  unsigned Pick(unsigned n) { return n == 0 ? 0 : static_cast<unsigned>(random_() % n); }

  void Satellite(RawWriter& w, bool tag51) {
    static const char kSystems[] = {'G', 'R', 'E', 'C', 'S'};
    const char system = kSystems[Pick(5)];
    const unsigned number = system == 'S' ? 20 + Pick(21) : 1 + Pick(37);
    if (tag51) {
      uint16_t code = voxtools::SatCode51(system, number);
      if (Pick(10) == 0) code = static_cast<uint16_t>((6 + Pick(10)) << 6 | Pick(64));  // no group
      if (Pick(20) == 0) code = static_cast<uint16_t>(random_());
      w.U16(code).U8(0).U8(0);
    } else {
      w.U8(Pick(10) == 0 ? static_cast<uint8_t>(random_()) : voxtools::SatCode8(system, number))
          .U8(0)
          .U8(0)
          .U8(0);
    }
    const unsigned signals = 1 + Pick(4);
    for (unsigned k = 0; k < signals; ++k)
      Signal(w, tag51, k + 1 < signals || Pick(15) == 0);
  }

  void Signal(RawWriter& w, bool tag51, bool more) {
    static const uint8_t kCodes[] = {16, 17, 18, 20, 32, 33, 34, 35, 36, 37, 82, 98, 114, 127};
    uint16_t flags = static_cast<uint16_t>(random_() & 0xFF00);
    flags |= Pick(4) == 0 ? Pick(128) : kCodes[Pick(sizeof kCodes)];
    if (more)
      flags |= kSigMore;
    else
      flags &= ~kSigMore;
    w.U16(flags);
    if (tag51) {
      if (flags & kSig51I16) w.I16(-3);
      if (flags & kSig51U16) w.U16(3);
    } else {
      if (flags & kSig8ByteA) w.U8(1);
      if (flags & kSig8ByteB) w.U8(2);
    }
    if (flags & kSigCode) w.F64(Value());
    if (flags & kSigPhase) w.F64(Value());
    if (flags & kSigF32A) w.F32(40.0f);
    if (flags & kSigCorrection)
      w.F32(Pick(3) == 0 ? std::numeric_limits<float>::quiet_NaN() : 0.5f);
  }

  // Values inside, at and outside the windows, zeros of both signs and non-numbers.
  double Value() {
    static const double kValues[] = {0.0,
                                     -0.0,
                                     2.0e7,
                                     -1.1e8,
                                     std::ldexp(1.0, -50),
                                     std::nextafter(std::ldexp(1.0, -50), 0.0),
                                     std::ldexp(1.0, 28),
                                     std::nextafter(std::ldexp(1.0, 28), 0.0),
                                     std::ldexp(1.0, 44),
                                     std::nextafter(std::ldexp(1.0, 44), 0.0),
                                     std::numeric_limits<double>::denorm_min(),
                                     std::numeric_limits<double>::infinity(),
                                     std::numeric_limits<double>::quiet_NaN()};
    if (Pick(3) == 0) return 1e7 + Pick(1000000) * 0.37;
    return kValues[Pick(sizeof kValues / sizeof kValues[0])];
  }

  void GoodL2Pair(RawWriter& w, uint16_t number) {
    const double l2p = 1.0e8 + Pick(1000000);
    w.U16(voxtools::SatCode51('G', number)).U8(0).U8(0);
    w.U16(static_cast<uint16_t>(kSigMore | kSigPhase | 32)).F64(l2p + 3.3 + Pick(5));
    w.U16(static_cast<uint16_t>(kSigPhase | 36)).F64(l2p);
  }

  std::mt19937 random_;
};

// A file of random epochs of one tag between a time reference and the end record; an end
// record cut off or a cut inside the last record now and then.
std::vector<uint8_t> RandomFile(RandomEpochs& epochs, RawOrder order, bool tag51, unsigned count,
                                unsigned ending) {
  RawWriter w(order);
  w.Header().TimeRef("GPS", {0, 12000}, {}, 18);
  for (unsigned e = 0; e < count; ++e) {
    w.Begin(tag51 ? kTagEpoch51 : kTagEpoch8).Bytes(epochs.Body(order, tag51, e * 1000)).End();
  }
  std::vector<uint8_t> bytes;
  if (ending == 0) {
    w.EndOfData();
    bytes = w.bytes();
  } else if (ending == 1) {
    w.EndOfData(true);
    bytes = w.bytes();
  } else {
    bytes = w.bytes();
    bytes.resize(bytes.size() - 7);  // inside the last epoch record
  }
  return bytes;
}

TEST(ScanWalk, RandomAndDamagedEpochsScanAsTheWholeDecodeDoes) {
  RandomEpochs epochs(20261206);
  for (int round = 0; round < 64; ++round) {
    const RawOrder order = round % 2 ? RawOrder::kBig : RawOrder::kLittle;
    const bool tag51 = (round / 2) % 4 != 0;
    const unsigned ending = round % 5 == 4 ? 1 + round % 2 : 0;
    const std::vector<uint8_t> bytes = RandomFile(epochs, order, tag51, 60, ending);
    test::TempRawFile f(bytes);
    SCOPED_TRACE("round " + std::to_string(round));

    test::ScanRun run;
    run.Run(f.path());
    const Reference ref = ReferenceScan(f.path());
    EXPECT_EQ(run.file->epoch_count, ref.epochs);
    EXPECT_EQ(run.file->max_satellites, ref.max_satellites);
    EXPECT_EQ(run.details.satellites_seen, ref.seen);

    // The decisions of a complete file, made from the reference's masks and notes.
    TChainItem expected(1, f.path(), false, false);
    std::memcpy(expected.signal_masks, ref.masks, sizeof ref.masks);
    std::string log;
    if (run.status == kScanComplete) {
      const ScanLogSink sink{&test::ScanRun::Collect, &log};
      DecideC2(ref.c2, expected, sink);
      ReportSignalsAndForceCopy(expected, sink);
      const std::string tail =
          run.log.substr(run.log.size() - std::min(run.log.size(), log.size()));
      EXPECT_EQ(tail, log);
      EXPECT_EQ(run.file->c2_usable_mask, expected.c2_usable_mask);
      EXPECT_EQ(run.file->c2_agreeing_mask, expected.c2_agreeing_mask);
      EXPECT_EQ(run.file->c2_l2_offset, expected.c2_l2_offset);
      EXPECT_EQ(std::memcmp(run.file->force_copy, expected.force_copy, sizeof expected.force_copy),
                0);
    }
    for (int k = 0; k < kSystemCount; ++k)
      EXPECT_EQ(run.file->signal_masks[k], expected.signal_masks[k]) << "system " << k;
  }
}

// ---- records read in place from the mapping or copied through the buffer

struct ReadStep {
  ReadResult result;
  uint8_t tag;
  uint16_t length, check;
  uint32_t position, next_position;
  uint8_t next_tag;
  uint16_t next_length;
  std::vector<uint8_t> body;
  bool operator==(const ReadStep&) const = default;
};

std::vector<ReadStep> ReadAll(const std::string& path, bool mapping) {
  TBufFile file;
  file.set_mapping_allowed(mapping);
  EXPECT_TRUE(file.OpenRead(path));
  EXPECT_EQ(file.mapped(), mapping);
  RecordReader reader(file);
  std::vector<ReadStep> steps;
  const auto take = [&](ReadResult result) {
    const ByteSpan body = reader.body();
    steps.push_back({result, reader.tag(), reader.length(), reader.check(), reader.position(),
                     reader.next_position(), reader.next_tag(), reader.next_length(),
                     std::vector<uint8_t>(body.begin(), body.end())});
  };
  if (reader.Start().status != 0) return steps;
  std::vector<uint32_t> positions;
  while (reader.next_tag() != kTagEnd) {
    positions.push_back(reader.next_position());
    const ReadResult result = reader.Next();
    take(result);
    if (result != ReadResult::kOk) break;
  }
  // Back to remembered records, as the epoch stream does, and past the end of the file.
  positions.push_back(file.file_size() - 2);
  for (size_t i = 0; i < positions.size(); i += 7) {
    const uint32_t at = i + 7 < positions.size() ? positions[i] : positions.back();
    if (!reader.Seek(at)) {
      steps.push_back({ReadResult::kTruncated, 0, 0, 0, at, 0, 0, 0, {}});
      continue;
    }
    take(reader.Next());
  }
  return steps;
}

TEST(ScanWalk, MappedAndBufferedReadingHandOutTheSameRecords) {
  RandomEpochs epochs(77);
  std::mt19937 random(5);
  for (int round = 0; round < 24; ++round) {
    const RawOrder order = round % 2 ? RawOrder::kBig : RawOrder::kLittle;
    std::vector<uint8_t> bytes = RandomFile(epochs, order, round % 3 != 0, 40, round % 3);
    // Now and then a damaged byte somewhere after the header, often a length.
    if (round % 4 == 3) bytes[20 + random() % (bytes.size() - 20)] = 0xFF;
    test::TempRawFile f(bytes);
    SCOPED_TRACE("round " + std::to_string(round));
    const std::vector<ReadStep> mapped = ReadAll(f.path(), true);
    EXPECT_FALSE(mapped.empty());
    EXPECT_TRUE(mapped == ReadAll(f.path(), false));
  }
}

}  // namespace
}  // namespace vox
