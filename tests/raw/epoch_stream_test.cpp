// The epoch stream over scanned raw files, in both byte orders and both epoch record kinds.
#include <gtest/gtest.h>

#include "epoch_test_files.h"
#include "vox/vox_sdk_epoch.h"

namespace vox::test {
namespace {

struct Variant {
  RawOrder order;
  uint8_t tag;
};

class EpochStreamTest : public ::testing::TestWithParam<Variant> {
 protected:
  RawOrder order() const { return GetParam().order; }
  uint8_t tag() const { return GetParam().tag; }
  RawWriter File(const std::vector<EpochSpec>& epochs, const char* system = "GPS",
                 std::optional<uint32_t> leap = {}) const {
    return BuildFile(order(), epochs, system, leap, tag());
  }
};

std::vector<uint64_t> SecondsOf(std::initializer_list<uint32_t> seconds) {
  std::vector<uint64_t> t;
  for (uint32_t s : seconds)
    t.push_back(Ms(At(s)));
  return t;
}

// Outside the file's span from and to take the whole span; inside they limit it.
TEST_P(EpochStreamTest, FromAndToLimitTheSpanOnlyInsideIt) {
  ScannedFile f(File(Seconds(tag(), 10, 15)));
  ASSERT_EQ(f.status, kScanComplete);
  const TimeMs before = At(0), from = At(11), to = At(13), after = At(100);
  auto whole = f.Open(0, &before, &after);
  ASSERT_TRUE(whole);
  EXPECT_EQ(Ms(whole->start()), Ms(At(10)));
  EXPECT_EQ(Ms(whole->end()), Ms(At(14)));
  EXPECT_EQ(Delivered(*whole), SecondsOf({10, 11, 12, 13, 14}));
  auto part = f.Open(0, &from, &to);
  ASSERT_TRUE(part);
  EXPECT_EQ(Delivered(*part), SecondsOf({11, 12, 13}));
  EXPECT_FALSE(f.Open(0, &to, &from)) << "from after to gives no stream";
}

TEST_P(EpochStreamTest, IntervalOfTheFileDeliversEveryEpoch) {
  ScannedFile f(File(Seconds(tag(), 10, 20)));
  ASSERT_EQ(f.file.epoch_interval_ms, 1000u);
  auto s = f.Open(1000);
  ASSERT_TRUE(s);
  EXPECT_EQ(s->interval(), 0u);
  EXPECT_EQ(Delivered(*s).size(), 10u);
}

TEST_P(EpochStreamTest, ThinningKeepsTheGridAndAGapMovesIt) {
  // 0..9 s, then a gap that skips 10 s, then 12..20 s.
  auto epochs = Seconds(tag(), 0, 10);
  auto later = Seconds(tag(), 12, 21);
  epochs.insert(epochs.end(), later.begin(), later.end());
  ScannedFile f(File(epochs));
  ASSERT_EQ(f.file.epoch_interval_ms, 1000u);
  auto s = f.Open(5000);
  ASSERT_TRUE(s);
  // Find ignores the interval; 12 s moves the grid to 15 s and is skipped itself.
  EXPECT_EQ(Delivered(*s), SecondsOf({0, 5, 15, 20}));
}

TEST_P(EpochStreamTest, ThinningStartsOnTheFirstGridPointAfterTheStart) {
  ScannedFile f(File(Seconds(tag(), 0, 12)));
  const TimeMs from = At(3);
  auto s = f.Open(5000, &from);
  ASSERT_TRUE(s);
  EXPECT_EQ(Delivered(*s), SecondsOf({3, 5, 10}));
}

TEST_P(EpochStreamTest, FindPositionsAndRejectsTimesOutsideTheSpan) {
  ScannedFile f(File(Seconds(tag(), 10, 15)));
  auto s = f.Open();
  ASSERT_TRUE(s);
  vox_EpochData e{};
  vox_EpochSatData d{};
  EXPECT_FALSE(s->GetNext(e)) << "nothing before the first Find";
  EXPECT_FALSE(s->GetSatellite(d));
  const TimeMs mid = At(12, 500), early = At(9), late = At(15);
  ASSERT_TRUE(s->Find(&mid, e));
  EXPECT_EQ(e.seconds, At(13).seconds);
  EXPECT_EQ(e.one, 1u);
  EXPECT_EQ(e.flags, 8u);
  EXPECT_EQ(e.sat_count, 1u);
  EXPECT_FALSE(s->Find(&early, e));
  EXPECT_FALSE(s->GetNext(e)) << "a failed Find leaves the stream ready";
  EXPECT_FALSE(s->Find(&late, e));
  // Find always starts over, also after the stream ran to its end.
  EXPECT_EQ(Delivered(*s).size(), 5u);
  EXPECT_EQ(Delivered(*s).size(), 5u);
}

TEST_P(EpochStreamTest, NavigationCoordinatesGoWithEveryEpoch) {
  ScannedFile f(File(Seconds(tag(), 10, 12)));
  auto s = f.Open();
  vox_EpochData e{};
  ASSERT_TRUE(s->Find(nullptr, e));
  EXPECT_EQ(e.flags, 8u);
  EXPECT_EQ(e.x, 0.0);
  f.occupation.nav.x = 1.5, f.occupation.nav.y = -2.5, f.occupation.nav.z = 3.25;
  f.occupation.nav_set = true;
  ASSERT_TRUE(s->GetNext(e));
  EXPECT_EQ(e.flags, 9u);
  EXPECT_EQ(e.x, 1.5);
  EXPECT_EQ(e.y, -2.5);
  EXPECT_EQ(e.z, 3.25);
}

TEST_P(EpochStreamTest, SatellitesEndWithTheEpochAndInvalidOnesAreSkipped) {
  RawSatellite invalid = Sat(tag(), 'G', 1, {{0, 2.1e7, {}}});
  invalid.code = tag() == 8 ? voxtools::SatCode8('S', 5) : voxtools::SatCode51('S', 5);  // SBAS 5
  std::vector<EpochSpec> epochs = {{1000,
                                    {Sat(tag(), 'G', 3, {{0, 2.0e7, 1.0e8}}, 7, 9), invalid,
                                     Sat(tag(), 'R', 4, {{0, 2.2e7, {}}})}},
                                   {2000, {Sat(tag(), 'G', 5, {{0, 2.3e7, {}}})}}};
  ScannedFile f(File(epochs));
  auto s = f.Open();
  vox_EpochData e{};
  ASSERT_TRUE(s->Find(nullptr, e));
  EXPECT_EQ(e.sat_count, 3u) << "invalid satellites are counted";
  vox_EpochSatData d{};
  ASSERT_TRUE(s->GetSatellite(d));
  EXPECT_EQ(d.sat, MakeSatId(SatSystem::kGps, 3));
  EXPECT_EQ(d.b2, 7);
  EXPECT_EQ(d.b3, 9);
  EXPECT_EQ(d.presence, 3u);
  EXPECT_EQ(d.values[1], 1.0e8) << "phase passes unchanged";
  ASSERT_TRUE(s->GetSatellite(d));
  EXPECT_EQ(d.sat, MakeSatId(SatSystem::kGlonass, 4));
  EXPECT_FALSE(s->GetSatellite(d));
  EXPECT_FALSE(s->GetSatellite(d));
  ASSERT_TRUE(s->GetNext(e));
  ASSERT_TRUE(s->GetSatellite(d));
  EXPECT_EQ(d.sat, MakeSatId(SatSystem::kGps, 5));
}

TEST_P(EpochStreamTest, AbsentValuesKeepTheBuffer) {
  std::vector<EpochSpec> epochs = {{1000, {Sat(tag(), 'R', 3, {{0, 0.0, {}}, {3, {}, 5.0e7}})}}};
  ScannedFile f(File(epochs));
  f.ClearRules();
  auto s = f.Open();
  const auto d = FirstSatellite(*s, -7.0);
  ASSERT_TRUE(d);
  EXPECT_EQ(d->presence, (1u << 0) | (1u << 7)) << "a zero code is present";
  EXPECT_EQ(d->values[0], 17.0) << "zero code plus the leap seconds of GLONASS";
  EXPECT_EQ(d->values[7], 5.0e7);
  for (int i : {1, 2, 3, 4, 5, 6, 8, 9})
    EXPECT_EQ(d->values[i], -7.0) << i;
}

TEST_P(EpochStreamTest, UnusableFlagsHideValues) {
  RawSatellite sat = Sat(tag(), 'G', 3, {{0, 2.0e7, 1.0e8}, {1, 2.0e7, 1.0e8}});
  sat.signals[0].flags |= 1u << 13;                 // code unusable
  sat.signals[0].flags |= 1u << 12;                 // phase unusable
  if (tag() == 8) sat.signals[1].flags |= 1u << 1;  // phase unusable in one-byte records
  ScannedFile f(BuildFile(order(), {{1000, {sat}}}, "GPS", {}, tag()));
  f.ClearRules();
  auto s = f.Open();
  const auto d = FirstSatellite(*s);
  ASSERT_TRUE(d);
  EXPECT_EQ(d->presence, tag() == 8 ? 0x4u : 0xCu);
}

TEST_P(EpochStreamTest, SmoothingSubtractsTheCodeCorrection) {
  RawSatellite sat = Sat(tag(), 'G', 3, {{0, 2.0e7, {}}});
  sat.signals[0].flags |= 1u << 11;
  sat.signals[0].correction = 0.25f;
  for (bool smooth : {false, true}) {
    ScannedFile f(BuildFile(order(), {{1000, {sat}}}, "GPS", {}, tag()), smooth);
    auto s = f.Open();
    const auto d = FirstSatellite(*s);
    ASSERT_TRUE(d);
    EXPECT_EQ(d->values[0], smooth ? 2.0e7 / kC - 0.25 : 2.0e7 / kC);
  }
}

// Epochs past midnight take the next day, with a new time reference after midnight (Find
// still dates the epochs before it by their own reference) and without one.
TEST_P(EpochStreamTest, EpochsPastMidnightTakeTheNextDay) {
  for (bool new_reference : {true, false}) {
    RawWriter w(order());
    w.Header().TimeRef("GPS", {86398000, kDay});
    for (uint32_t ms : {86398000u, 86399000u, 0u, 1000u}) {
      if (ms == 0 && new_reference) w.TimeRef("GPS", {0, kDay + 1});
      w.Epoch(tag(), ms, {Sat(tag(), 'G', 1, {{0, 2.0e7, {}}})});
    }
    w.EndOfData();
    ScannedFile f(w);
    auto s = f.Open();
    ASSERT_TRUE(s);
    const auto expected = SecondsOf({86398, 86399, 86400, 86401});
    EXPECT_EQ(Delivered(*s), expected) << "new reference " << new_reference;
    EXPECT_EQ(Delivered(*s), expected) << "a second pass sees the same times";
  }
}

// Each force-copy rule on a GLONASS satellite (its codes carry the 17 leap seconds of a
// GPS-time file). Value indices: 2 s code, 2 s + 1 phase of slot s.
TEST_P(EpochStreamTest, EachForceCopyRuleFillsItsTarget) {
  const int glonass = static_cast<int>(SatSystem::kGlonass);
  struct Rule {
    int group;      // TChainItem::force_copy group
    bool from_l1p;  // the satellite carries L1P and L2C; else only L1C
    int value;      // the value that appears
    double expect;
  };
  const double l1p_code = 2.0e7 / kC + 17.0, l1c_code = 1.9e7 / kC + 17.0;
  const double l2c_code = 2.1e7 / kC + 17.0;
  const Rule rules[] = {
      {0, true, 0, l1p_code},   // L1 to CA code
      {1, true, 1, 1.0e8},      // L1 to CA phase
      {2, false, 2, l1c_code},  // CA to L1 code
      {3, false, 3, 0.9e8},     // CA to L1 phase
      {4, true, 6, l2c_code},   // L2C to L2P code
      {5, true, 7, 1.1e8},      // L2C to L2P phase
  };
  ScannedFile l1p(File({{1000, {Sat(tag(), 'R', 4, {{1, 2.0e7, 1.0e8}, {2, 2.1e7, 1.1e8}})}}}));
  ScannedFile l1c(File({{1000, {Sat(tag(), 'R', 4, {{0, 1.9e7, 0.9e8}})}}}));
  for (const Rule& r : rules) {
    ScannedFile& f = r.from_l1p ? l1p : l1c;
    const uint32_t carried = r.from_l1p ? 0x3Cu : 0x03u;
    f.ClearRules();
    for (int other = 0; other < 5; ++other)
      f.file.force_copy[r.group][other] = other != glonass;
    auto s = f.Open();
    auto d = FirstSatellite(*s);
    ASSERT_TRUE(d);
    EXPECT_EQ(d->presence, carried) << "rule " << r.group << " of other systems";
    f.file.force_copy[r.group][glonass] = 1;
    s = f.Open();
    d = FirstSatellite(*s);
    ASSERT_TRUE(d);
    EXPECT_EQ(d->presence, carried | (1u << r.value)) << "rule " << r.group;
    EXPECT_EQ(d->values[r.value], r.expect) << "rule " << r.group;
  }
}

TEST_P(EpochStreamTest, CopyFromL1NeverOverwritesAPresentTarget) {
  ScannedFile f(File({{1000, {Sat(tag(), 'R', 4, {{0, 1.9e7, 0.9e8}, {1, 2.0e7, 1.0e8}})}}}));
  f.ClearRules();
  for (int g = 0; g < 4; ++g)
    f.file.force_copy[g][1] = 1;
  auto s = f.Open();
  const auto d = FirstSatellite(*s);
  ASSERT_TRUE(d);
  EXPECT_EQ(d->values[0], 1.9e7 / kC + 17.0);
  EXPECT_EQ(d->values[1], 0.9e8);
  EXPECT_EQ(d->values[2], 2.0e7 / kC + 17.0);
  EXPECT_EQ(d->values[3], 1.0e8);
}

INSTANTIATE_TEST_SUITE_P(
    OrdersAndTags, EpochStreamTest,
    ::testing::Values(Variant{RawOrder::kLittle, 51}, Variant{RawOrder::kBig, 51},
                      Variant{RawOrder::kLittle, 8}, Variant{RawOrder::kBig, 8}),
    [](const auto& info) {
      return std::string(info.param.order == RawOrder::kBig ? "Big" : "Little") + "Tag" +
             std::to_string(info.param.tag);
    });

}  // namespace
}  // namespace vox::test
