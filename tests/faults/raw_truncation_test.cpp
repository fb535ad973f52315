// Raw files cut short at every byte: at each record boundary and inside every record. A cut
// file must scan without harm, and the epoch stream over it must deliver exactly the leading
// epochs of the whole file, value for value, with nothing taken from the cut record.
//
// A record is read together with the tag and length of the record after it, so a record
// counts as whole once those three bytes follow it. The file-wide signal rules are decided
// only for a complete file; both sides are compared without them.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "raw/epoch_test_files.h"

namespace vox::test {
namespace {

// What a stream delivers: each epoch record followed by its satellite records, as bytes.
using Delivery = std::vector<std::vector<uint8_t>>;

template <typename T>
std::vector<uint8_t> BytesOf(const T& record) {
  const auto* p = reinterpret_cast<const uint8_t*>(&record);
  return {p, p + sizeof record};
}

Delivery ReadStream(EpochStream& stream) {
  Delivery out;
  vox_EpochData epoch{};
  for (bool ok = stream.Find(nullptr, epoch); ok; ok = stream.GetNext(epoch)) {
    out.push_back(BytesOf(epoch));
    vox_EpochSatData sat{};
    while (stream.GetSatellite(sat))
      out.push_back(BytesOf(sat));
  }
  return out;
}

struct CutRun {
  int status = 0;
  size_t epochs = 0;
  Delivery delivery;
};

CutRun ScanAndStream(const std::vector<uint8_t>& bytes) {
  RawWriter w(RawOrder::kLittle);
  w.Bytes(bytes);
  ScannedFile scanned(w);
  scanned.ClearRules();
  CutRun run;
  run.status = scanned.status;
  if (auto stream = scanned.Open()) run.delivery = ReadStream(*stream);
  for (const auto& r : run.delivery)
    if (r.size() == sizeof(vox_EpochData)) ++run.epochs;
  return run;
}

// A file of every common record kind, with the offsets at which its epoch records end.
struct BuiltFile {
  RawWriter writer;
  std::vector<size_t> epoch_ends;  // where each epoch record ends
};

BuiltFile Build(RawOrder order, uint8_t tag) {
  BuiltFile f{RawWriter(order), {}};
  RawWriter& w = f.writer;
  w.Header();
  w.TimeRef("GPS", {0, kDay}, {}, 17);
  voxtools::RawGpsEphemeris eph;
  eph.number = 3;
  eph.time = {3600000, kDay};
  w.GpsEphemeris(eph);
  for (uint32_t s = 0; s < 8; ++s) {
    w.Epoch(
        tag, 1000 * (s + 1),
        {Sat(tag, 'G', 1, {{0, 2.0e7 + s, 1.0e8 + s}, {2, 2.0e7 + s + 3, {}}}),
         Sat(tag, 'R', 5, {{0, 2.1e7 + s, 1.1e8 + s}}), Sat(tag, 'G', 9, {{0, 2.2e7 + s, {}}})});
    f.epoch_ends.push_back(w.offset());
    if (s == 3) {
      voxtools::RawMeteoSample m;
      m.time = {4500, kDay};
      m.pressure = 1013.0f;
      w.MeteoSample(m);
    }
  }
  w.EndOfData();
  return f;
}

class RawTruncationTest : public ::testing::TestWithParam<std::pair<RawOrder, uint8_t>> {};

TEST_P(RawTruncationTest, EveryCutDeliversTheLeadingEpochsOfTheWholeFile) {
  const BuiltFile built = Build(GetParam().first, GetParam().second);
  const std::vector<uint8_t>& whole = built.writer.bytes();
  const CutRun full = ScanAndStream(whole);
  ASSERT_EQ(full.status, kScanComplete);
  ASSERT_EQ(full.epochs, built.epoch_ends.size());

  size_t previous_epochs = 0;
  for (size_t cut = 0; cut < whole.size(); ++cut) {
    SCOPED_TRACE("cut at byte " + std::to_string(cut) + " of " + std::to_string(whole.size()));
    const CutRun run = ScanAndStream({whole.begin(), whole.begin() + cut});
    EXPECT_NE(run.status, kScanComplete);

    // The stream gives a leading part of the whole file's delivery, never anything else.
    ASSERT_LE(run.delivery.size(), full.delivery.size());
    for (size_t i = 0; i < run.delivery.size(); ++i)
      ASSERT_EQ(run.delivery[i], full.delivery[i]) << "record " << i << " differs";

    // Every epoch whose record lies wholly before the cut is there, and none after it.
    size_t complete = 0;
    while (complete < built.epoch_ends.size() && built.epoch_ends[complete] + 3 <= cut)
      ++complete;
    EXPECT_EQ(run.epochs, complete);
    // The satellites of the last delivered epoch are all there: the delivery ends on a whole
    // epoch exactly as in the whole file.
    if (run.epochs > 0) {
      const size_t next = run.delivery.size();
      EXPECT_TRUE(next == full.delivery.size() ||
                  full.delivery[next].size() == sizeof(vox_EpochData));
    }
    EXPECT_GE(run.epochs, previous_epochs);
    previous_epochs = run.epochs;
  }
}

INSTANTIATE_TEST_SUITE_P(OrdersAndRecordKinds, RawTruncationTest,
                         ::testing::Values(std::make_pair(RawOrder::kLittle, uint8_t{51}),
                                           std::make_pair(RawOrder::kBig, uint8_t{51}),
                                           std::make_pair(RawOrder::kLittle, uint8_t{8})));

}  // namespace
}  // namespace vox::test
