#include "raw/ephemeris_store.h"

#include <gtest/gtest.h>

#include <cstring>

namespace vox {
namespace {

RawTime At(uint32_t day, uint32_t hour, uint32_t min = 0, uint32_t sec = 0, uint32_t ms = 0) {
  return RawTime{((hour * 60 + min) * 60 + sec) * 1000 + ms, day};
}

GpsEphemerisRecord Gps(uint8_t number, RawTime t) {
  GpsEphemerisRecord r;
  r.number = number;
  r.time = t;
  r.g8 = 0.01;
  r.g3_g7[4] = 7.0f;
  r.g11_g16[1] = 12.0f;
  r.g11_g16[2] = 13.0f;
  r.g24 = 0x1234;
  r.g25 = 4;
  return r;
}

std::vector<uint32_t> Times(const EphemerisStore& s, SatId sat) {
  std::vector<uint32_t> out;
  for (const TNavEphemItem* p = s.head(SatIndexOf(sat)); p; p = p->next)
    out.push_back(p->data.head.seconds);
  return out;
}

const SatId kG5 = MakeSatId(SatSystem::kGps, 5);

TEST(EphemerisInsert, SameSecondIsDroppedAndOrderIsKept) {
  EphemerisStore s;
  EXPECT_TRUE(s.InsertGps(Gps(5, At(100, 10)), false));
  EXPECT_FALSE(s.InsertGps(Gps(5, At(100, 10, 0, 0, 500)), false));  // first one wins
  EXPECT_TRUE(s.InsertGps(Gps(5, At(100, 14)), false));
  EXPECT_TRUE(s.InsertGps(Gps(5, At(100, 8)), false));              // older than all: head
  EXPECT_TRUE(s.InsertGps(Gps(5, At(100, 12, 0, 0, 250)), false));  // middle
  const uint32_t d = 100 * 86400;
  EXPECT_EQ(Times(s, kG5),
            (std::vector<uint32_t>{d + 8 * 3600, d + 10 * 3600, d + 12 * 3600, d + 14 * 3600}));
  EXPECT_EQ(s.head(4)->next->next->data.head.ms, 250);
  EXPECT_FALSE(s.InsertGps(Gps(33, At(100, 8)), false));
  EXPECT_FALSE(s.InsertGps(Gps(0, At(100, 8)), false));
}

TEST(EphemerisInsert, Tag45GoesToGps33To37WithItsOwnFlagByte) {
  EphemerisStore s;
  GpsEphemerisRecord r = Gps(3, At(50, 1));
  r.g24 = 1;
  EXPECT_TRUE(s.InsertGps(r, true));
  const TNavEphemItem* item = s.head(SatIndexOf(MakeSatId(SatSystem::kGps, 35)));
  ASSERT_NE(item, nullptr);
  EXPECT_EQ(item->data.head.sat, MakeSatId(SatSystem::kGps, 35));
  EXPECT_EQ(item->data.bytes[121], 0);
  r.g24 = 2;
  r.time = At(50, 2);
  s.InsertGps(r, true);
  EXPECT_EQ(item->next->data.bytes[121], 1);
  EXPECT_FALSE(s.InsertGps(Gps(6, At(50, 1)), true));
}

TEST(EphemerisInsert, SbasReferenceBeforeMidnightBelongsToTheDayBefore) {
  EphemerisStore s;
  // Received at 00:00:10 of day 10 with a reference of 23:59:00: the reference belongs to
  // the day before.
  SbasEphemerisRecord e;
  e.number = 20;
  e.time = At(10, 0, 0, 10, 700);
  e.reference_seconds = 86340;
  e.s3_s5[0] = 1.0;
  e.s6_s13[0] = 1.0f;
  ASSERT_TRUE(s.Insert(e));
  const vox_EphemerisData& d = s.head(128)->data;
  EXPECT_EQ(d.head.seconds, 10u * 86400 - 60);
  EXPECT_EQ(d.head.ms, 0);
}

TEST(EphemerisInsert, StaticSbasRepeatIsDroppedUnlessItsPositionChanges) {
  EphemerisStore s;
  SbasEphemerisRecord e;
  e.number = 33;
  e.time = At(10, 1);
  e.reference_seconds = 3600;
  e.s3_s5[0] = 5.0;
  e.s3_s5[1] = 6.0;
  EXPECT_TRUE(s.Insert(e));
  e.time = At(10, 2), e.reference_seconds = 7200;
  EXPECT_FALSE(s.Insert(e));
  e.s3_s5[1] = 7.0;
  EXPECT_TRUE(s.Insert(e));
}

// The windows of the other systems, at their bounds, are held by the probe job test.
TEST(EphemerisWindows, CentredOnTheEphemerisTimeAndInclusive) {
  EphemerisStore s;
  BdsEphemerisRecord b;
  b.number = 7;
  b.time = At(200, 12);
  ASSERT_TRUE(s.Insert(b));
  const SatId c07 = MakeSatId(SatSystem::kBds, 7);
  const uint32_t t = 200 * 86400 + 12 * 3600;
  const uint32_t from = 0, to = 0xFFFFFFFF;
  EphemerisCursor* c = OpenEphemerisStream(s, c07, &from, &to);
  ASSERT_NE(c, nullptr);
  vox_EphemerisData out;
  for (uint32_t q : {t - 3600, t + 3600})
    EXPECT_EQ(FindEphemeris(s, c, &q, &out), 1) << q;
  uint32_t late = t + 3601;
  EXPECT_EQ(FindEphemeris(s, c, &late, &out), 0);
  EXPECT_EQ(GetNextEphemeris(c, &out), 0);  // a failed find leaves no current item
  CloseEphemerisStream(c);
}

TEST(EphemerisStream, OpenChoosesTheFirstOverlappingAndGetNextRunsToTheEnd) {
  EphemerisStore s;
  for (uint32_t h : {0u, 4u, 8u})
    s.InsertGps(Gps(5, At(300, h)), false);
  const uint32_t day = 300 * 86400;
  const uint32_t from = day + 4 * 3600 + 7100, to = day + 4 * 3600 + 7150;
  EphemerisCursor* c = OpenEphemerisStream(s, kG5, &from, &to);
  ASSERT_NE(c, nullptr);
  vox_EphemerisData out;
  ASSERT_EQ(GetNextEphemeris(c, &out), 1);
  EXPECT_EQ(out.head.seconds, day + 4 * 3600);
  ASSERT_EQ(GetNextEphemeris(c, &out), 1);
  EXPECT_EQ(out.head.seconds, day + 8 * 3600);
  EXPECT_EQ(GetNextEphemeris(c, &out), 0);
  EXPECT_EQ(CloseEphemerisStream(c), 1);

  const uint32_t far = day + 20 * 3600;
  EXPECT_EQ(OpenEphemerisStream(s, kG5, &far, &far), nullptr);
  EXPECT_EQ(OpenEphemerisStream(s, kG5, nullptr, &far), nullptr);
  EXPECT_EQ(OpenEphemerisStream(s, MakeSatId(SatSystem::kGlonass, 0), &from, &to), nullptr);
}

TEST(EphemerisStream, ShortFormsFillNothingForOtherSystemsAndRefuseNumbersOfNoSatellite) {
  EphemerisStore s;
  s.InsertGps(Gps(5, At(300, 4)), false);
  GalileoEphemerisRecord e;
  e.number = 2;
  e.time = At(300, 4);
  s.Insert(e);
  const uint32_t t = 300 * 86400 + 4 * 3600;
  // The GPS and GLONASS short records, byte by byte, are the probe job test's. A cursor of
  // another system fills nothing.
  vox_ShortEphemerisData sh;
  EphemerisCursor* ce = OpenEphemerisStream(s, MakeSatId(SatSystem::kGalileo, 2), &t, &t);
  ASSERT_NE(ce, nullptr);
  std::memset(&sh, 0xEE, sizeof sh);
  EXPECT_EQ(FindEphemerisShort(s, ce, &t, &sh), 0);
  EXPECT_EQ(sh.bytes[0], 0xEE);
  CloseEphemerisStream(ce);

  EXPECT_EQ(OpenEphemerisStreamShort(s, 0, &t, &t), nullptr);
  EXPECT_EQ(OpenEphemerisStreamShort(s, 128, &t, &t), nullptr);  // GLONASS slot 0
}

}  // namespace
}  // namespace vox
