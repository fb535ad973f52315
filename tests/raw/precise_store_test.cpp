#include "raw/precise_store.h"

#include <gtest/gtest.h>

#include <cstring>
#include <utility>
#include <vector>

namespace vox {
namespace {

const SatId kG05 = MakeSatId(SatSystem::kGps, 5);
const SatId kR01 = MakeSatId(SatSystem::kGlonass, 1);

using Time = std::pair<uint32_t, uint16_t>;

std::vector<Time> Times(const PreciseStore& store, SatId sat) {
  std::vector<Time> times;
  for (const PreciseSample* s = store.first(SatIndexOf(sat)); s != nullptr; s = s->next)
    times.emplace_back(s->time.seconds, s->time.ms);
  return times;
}

std::vector<uint32_t> StreamSeconds(const PreciseStore& store, SatId sat, uint32_t from,
                                    uint32_t to) {
  std::vector<uint32_t> seconds;
  auto cursor = store.Open(sat, from, to);
  if (!cursor) return seconds;
  vox_PreciseEphemerisData record;
  while (GetNextPrecise(*cursor, record))
    seconds.push_back(record.seconds);
  return seconds;
}

TEST(PreciseStore, KeepsTimeOrderAndOneSamplePerSecond) {
  PreciseStore store;
  EXPECT_TRUE(store.Insert(kG05, {300, 0}, 1, 2, 3, 4));
  EXPECT_TRUE(store.Insert(kG05, {100, 0}, 1, 2, 3, 4));
  EXPECT_TRUE(store.Insert(kG05, {200, 250}, 1, 2, 3, 4));
  EXPECT_TRUE(store.Insert(kG05, {400, 500}, 1, 2, 3, 4));
  // The same whole second again, whatever its content or milliseconds, before or after.
  EXPECT_FALSE(store.Insert(kG05, {300, 0}, 9, 9, 9, 9));
  EXPECT_FALSE(store.Insert(kG05, {200, 0}, 9, 9, 9, 9));
  EXPECT_FALSE(store.Insert(kG05, {200, 999}, 9, 9, 9, 9));
  EXPECT_FALSE(store.Insert(kG05, {400, 100}, 9, 9, 9, 9));
  EXPECT_TRUE(store.Insert(kG05, {50, 0}, 1, 2, 3, 4));

  const std::vector<Time> expected = {{50, 0}, {100, 0}, {200, 250}, {300, 0}, {400, 500}};
  EXPECT_EQ(Times(store, kG05), expected);
  EXPECT_EQ(store.count(SatIndexOf(kG05)), 5u);
  EXPECT_TRUE(store.first(SatIndexOf(kG05))->time == (TimeMs{50, 0}));
  EXPECT_TRUE(store.last(SatIndexOf(kG05))->time == (TimeMs{400, 500}));
  EXPECT_EQ(store.first(SatIndexOf(kG05))->next->x, 1.0);  // the first one stored won

  // Each satellite has its own list.
  EXPECT_TRUE(store.Insert(kR01, {300, 0}, 1, 2, 3, 4));
  EXPECT_EQ(store.count(SatIndexOf(kR01)), 1u);
  EXPECT_EQ(store.count(SatIndexOf(kG05)), 5u);

  // Identifiers that name no satellite are dropped, also those that would map onto another
  // satellite's list (GLONASS 0 onto GPS 37).
  EXPECT_FALSE(store.Insert(MakeSatId(SatSystem::kGps, 0), {1, 0}, 0, 0, 0, 0));
  EXPECT_FALSE(store.Insert(MakeSatId(SatSystem::kGlonass, 0), {1, 0}, 0, 0, 0, 0));
  EXPECT_FALSE(store.Insert(MakeSatId(SatSystem::kSbas, 41), {1, 0}, 0, 0, 0, 0));
  EXPECT_FALSE(store.Insert(static_cast<SatId>(0x0701), {1, 0}, 0, 0, 0, 0));
  EXPECT_EQ(store.count(36), 0u);

  store.Clear();
  EXPECT_EQ(store.count(SatIndexOf(kG05)), 0u);
  EXPECT_EQ(store.first(SatIndexOf(kG05)), nullptr);
  EXPECT_TRUE(store.Insert(kG05, {300, 0}, 1, 2, 3, 4));
}

TEST(PreciseStore, StreamStartsAtTheFirstSampleWhoseWindowOverlapsTheSpan) {
  PreciseStore store;
  const SatId a = MakeSatId(SatSystem::kGps, 1);
  const SatId b = MakeSatId(SatSystem::kGps, 2);
  store.Insert(a, {2900, 0}, 0, 0, 0, 0);
  store.Insert(b, {2901, 0}, 0, 0, 0, 0);
  EXPECT_EQ(StreamSeconds(store, a, 1000, 2000), std::vector<uint32_t>{2900});
  EXPECT_FALSE(store.Open(b, 1000, 2000).has_value());

  // The window's lower end, and times too small to subtract the window from.
  const SatId c = MakeSatId(SatSystem::kGps, 3);
  store.Insert(c, {10, 0}, 0, 0, 0, 0);
  store.Insert(c, {100, 0}, 0, 0, 0, 0);
  EXPECT_EQ(StreamSeconds(store, c, 0, 0), (std::vector<uint32_t>{10, 100}));
  EXPECT_EQ(StreamSeconds(store, c, 1000, 5000), std::vector<uint32_t>{100});
  EXPECT_FALSE(store.Open(c, 1001, 5000).has_value());
  EXPECT_FALSE(store.Open(MakeSatId(SatSystem::kGps, 4), 0, 0xFFFFFFFF).has_value());
  EXPECT_FALSE(store.Open(MakeSatId(SatSystem::kGps, 0), 0, 0xFFFFFFFF).has_value());
}

TEST(PreciseStore, StreamRunsToTheEndOfTheList) {
  PreciseStore store;
  for (uint32_t t = 0; t <= 9000; t += 900)
    store.Insert(kG05, {t, 0}, t, 0, 0, 0);
  EXPECT_EQ(StreamSeconds(store, kG05, 1800, 1800),
            (std::vector<uint32_t>{900, 1800, 2700, 3600, 4500, 5400, 6300, 7200, 8100, 9000}));

  auto cursor = store.Open(kG05, 9000, 9000);
  ASSERT_TRUE(cursor.has_value());
  EXPECT_EQ(cursor->sat, kG05);
  vox_PreciseEphemerisData record;
  EXPECT_TRUE(GetNextPrecise(*cursor, record));  // 8100
  EXPECT_TRUE(GetNextPrecise(*cursor, record));  // 9000
  EXPECT_EQ(record.seconds, 9000u);
  EXPECT_FALSE(GetNextPrecise(*cursor, record));
  EXPECT_FALSE(GetNextPrecise(*cursor, record));
}

TEST(PreciseStore, RecordCarriesTheSampleAndZeroesTheRest) {
  PreciseStore store;
  store.Insert(kG05, {123456, 789}, 18392619.117, 7490690.408, -17846346.485, 2.69108429e-4f);
  auto cursor = store.Open(kG05, 123456, 123456);
  ASSERT_TRUE(cursor.has_value());
  vox_PreciseEphemerisData record;
  std::memset(&record, 0xFF, sizeof record);
  ASSERT_TRUE(GetNextPrecise(*cursor, record));
  const auto* bytes = reinterpret_cast<const uint8_t*>(&record);
  uint32_t seconds;
  double x, z;
  float clock;
  std::memcpy(&seconds, bytes + 0, 4);
  std::memcpy(&x, bytes + 6, 8);
  std::memcpy(&z, bytes + 22, 8);
  std::memcpy(&clock, bytes + 42, 4);
  EXPECT_EQ(seconds, 123456u);
  EXPECT_EQ(bytes[4] | bytes[5] << 8, 789);
  EXPECT_EQ(x, 18392619.117);
  EXPECT_EQ(z, -17846346.485);
  EXPECT_EQ(clock, 2.69108429e-4f);
  for (int i = 30; i < 42; ++i)
    EXPECT_EQ(bytes[i], 0) << i;
  for (int i = 46; i < 51; ++i)
    EXPECT_EQ(bytes[i], 0) << i;
}

TEST(PreciseStore, ShortSatelliteNumbers) {
  PreciseStore store;
  store.Insert(MakeSatId(SatSystem::kGps, 1), {1000, 0}, 0, 0, 0, 0);
  store.Insert(kR01, {1000, 0}, 0, 0, 0, 0);
  store.Insert(MakeSatId(SatSystem::kGps, 37), {1000, 0}, 0, 0, 0, 0);
  EXPECT_EQ(store.OpenShort(1, 0, 5000)->sat, MakeSatId(SatSystem::kGps, 1));
  EXPECT_EQ(store.OpenShort(38, 0, 5000)->sat, kR01);  // index 37
  EXPECT_EQ(store.OpenShort(129, 0, 5000)->sat, kR01);
  EXPECT_EQ(store.OpenShort(37, 0, 5000)->sat, MakeSatId(SatSystem::kGps, 37));
  EXPECT_FALSE(store.OpenShort(0, 0, 5000).has_value());
  // Slot 0 is no GLONASS satellite, even though its index would be GPS 37's.
  EXPECT_FALSE(store.OpenShort(128, 0, 5000).has_value());
  EXPECT_FALSE(store.OpenShort(128 + 25, 0, 5000).has_value());
}

}  // namespace
}  // namespace vox
