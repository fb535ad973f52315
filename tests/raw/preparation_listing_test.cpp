#include "raw/preparation_listing.h"

#include <gtest/gtest.h>

#include "base/gps_time.h"
#include "raw/ephemeris_store.h"
#include "raw/precise_store.h"
#include "raw/vector_fusing.h"

namespace vox {
namespace {

void Collect(void* context, const char* text) {
  *static_cast<std::string*>(context) += text;
}

TEST(PreparationListing, ListsEphemeridesPreciseOccupationsAndVectors) {
  EphemerisStore eph;
  GpsEphemerisRecord g;
  g.number = 32;
  g.time = RawTime{3600250, 9000};
  ASSERT_TRUE(eph.InsertGps(g, false));
  g.number = 1;
  ASSERT_TRUE(eph.InsertGps(g, true));  // J01
  SbasEphemerisRecord s;
  s.number = 20;
  s.time = RawTime{0, 9000};
  ASSERT_TRUE(eph.Insert(s));
  PreciseStore precise;
  const SatId r01 = MakeSatId(SatSystem::kGlonass, 1);
  precise.Insert(r01, TimeMs{9000 * 86400, 0}, 1, 2, 3, 0);
  precise.Insert(r01, TimeMs{9000 * 86400 + 900, 0}, 1, 2, 3, 0);

  TPointItem p(1), q(2);
  p.name = "P";
  q.name = "Q";
  TChainItem file(3, "/tmp/f.bin", false, false);
  file.c2_l2_offset = 0.25;
  file.c2_usable_mask = 0x81;
  ItemList<TOccupItem> occupations;
  TOccupItem* a = occupations.Append(new TOccupItem(1));
  a->name = "occA";
  a->SetPoint(&p);
  a->SetFile(&file);
  a->epoch_count = 42;
  a->first_epoch = TimeMs{9000 * 86400, 0};
  a->last_epoch = TimeMs{9000 * 86400 + 60, 0};
  TOccupItem* b = occupations.Append(new TOccupItem(2));
  b->name = "occB";
  ItemList<TVectorItem> vectors;
  TVectorItem* v = vectors.Append(new TVectorItem(1, &p, &q));
  v->occupations.Append(new TROccupItem(a));

  std::string log;
  WritePreparationListing(eph, precise, occupations, vectors, {&Collect, &log});
  const std::string t0 = CalendarText(TimeMs{9000 * 86400, 0});
  const std::string t1 = CalendarText(TimeMs{9000 * 86400 + 3600, 250});
  const std::string t60 = CalendarText(TimeMs{9000 * 86400 + 60, 0});
  const std::string t900 = CalendarText(TimeMs{9000 * 86400 + 900, 0});
  const std::string zero = CalendarText(TimeMs{0, 0});
  const std::string expected =
      "Ephemeris:\n"
      "032 - G32 - 777603600.250 " +
      t1 +
      "\n"
      "033 - J01 - 777603600.250 " +
      t1 +
      "\n"
      "129 - S20 - 777600000.000 " +
      t0 +
      "\n"
      "\n"
      "Precise Ephemeris:\n"
      "R01 - " +
      t0 + " - " + t900 +
      " - 2\n"
      "Occupation:\n"
      "OCCUP#02000001 P, beg=" +
      t0 + " end=" + t60 +
      ",     42 epochs, CHAIN#04000003 GPS: "
      "dL2X=0.2500 (00000081)\n"
      "OCCUP#02000002 Move, beg=" +
      zero + " end=" + zero +
      ",      0 epochs\n"
      "\n"
      "VECTOR: P - Q\n"
      "OCCUP: occA " +
      t0 + "-" + t60 +
      "\n"
      "\n";
  EXPECT_EQ(log, expected);
}

TEST(VectorFusing, DuplicatesInEitherDirectionJoinTheFirstWithOccupations) {
  TPointItem p(1), q(2), r(3);
  TOccupItem o1(1), o2(2), o3(3), o4(4);
  ItemList<TVectorItem> vectors;
  TVectorItem* empty = vectors.Append(new TVectorItem(1, &p, &q));
  TVectorItem* first = vectors.Append(new TVectorItem(2, &p, &q));
  TVectorItem* reversed = vectors.Append(new TVectorItem(3, &q, &p));
  TVectorItem* other = vectors.Append(new TVectorItem(4, &p, &r));
  TVectorItem* again = vectors.Append(new TVectorItem(5, &p, &q));
  first->occupations.Append(new TROccupItem(&o1));
  reversed->occupations.Append(new TROccupItem(&o2));
  reversed->occupations.Append(new TROccupItem(&o3));
  other->occupations.Append(new TROccupItem(&o4));
  again->occupations.Append(new TROccupItem(&o4));
  EXPECT_TRUE(FuseVectors(vectors));
  std::vector<TOccupItem*> got;
  for (const TROccupItem& ref : first->occupations)
    got.push_back(ref.occupation);
  EXPECT_EQ(got, (std::vector<TOccupItem*>{&o1, &o2, &o3, &o4}));
  EXPECT_TRUE(empty->occupations.empty());
  EXPECT_TRUE(reversed->occupations.empty());
  EXPECT_TRUE(again->occupations.empty());
  EXPECT_EQ(other->occupations.Count(), 1u);  // shares one point only
}

}  // namespace
}  // namespace vox
