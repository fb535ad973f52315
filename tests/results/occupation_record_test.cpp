#include "results/occupation_record.h"

#include <string>

#include <gtest/gtest.h>

#include "result_test_util.h"

namespace vox {
namespace {

using test::At;

TEST(OccupationRecord, FixedPartAndCutNames) {
  TPointItem point(4);
  point.name = "BASE";
  TAntennItem antenna(2);
  antenna.name = std::string(70, 'A');
  antenna.l2_up = 0.125;
  TChainItem file(5, "/data/rover.raw", false, false);
  file.receiver_text = "RX 1.0";
  TOccupItem o(3);
  ASSERT_TRUE(o.SetPoint(&point));
  ASSERT_TRUE(o.SetAntenna(&antenna));
  ASSERT_TRUE(o.SetFile(&file));
  o.first_epoch = TimeMs{86400 * 2 + 10, 500};
  o.last_epoch = TimeMs{86400 * 2 + 20, 0};
  o.epoch_count = 11;
  o.l1_up = 1.5;
  o.nav.x = 99;  // not set: must not show

  const auto p = BuildOccupationRecord(o);
  ASSERT_EQ(p.size(), 104u + 1 + 4 + 1 + 6 + 1 + 60);
  EXPECT_EQ(At<uint32_t>(p, 0), 3u);
  EXPECT_EQ(At<uint32_t>(p, 4), 4u);
  EXPECT_EQ(At<uint32_t>(p, 8), 2u);
  EXPECT_EQ(At<uint32_t>(p, 12), 10500u);
  EXPECT_EQ(At<uint32_t>(p, 16), 2u);
  EXPECT_EQ(At<uint32_t>(p, 20), 20000u);
  EXPECT_EQ(At<uint32_t>(p, 28), 11u);
  EXPECT_EQ(At<float>(p, 40), 1.5f);
  EXPECT_EQ(At<float>(p, 52), 0.125f);
  EXPECT_EQ(At<double>(p, 56), 0.0);
  EXPECT_EQ(p[104], 4);
  EXPECT_EQ(p[109], 6);
  EXPECT_EQ(p[116], 60);

  o.nav_set = true;
  EXPECT_EQ(At<double>(BuildOccupationRecord(o), 56), 99.0);
}

TEST(OccupationRecord, MissingItemsGiveZerosAndEmptyNames) {
  TOccupItem o(1);
  const auto p = BuildOccupationRecord(o);
  ASSERT_EQ(p.size(), 107u);
  EXPECT_EQ(At<uint32_t>(p, 4), 0u);
  EXPECT_EQ(At<uint32_t>(p, 8), 0u);
  EXPECT_EQ(p[104] + p[105] + p[106], 0);
}

}  // namespace
}  // namespace vox
