#include "job/items.h"

#include <gtest/gtest.h>

namespace vox {
namespace {

TEST(Items, ReferencesAreSetOnceAndListedWithTheirTarget) {
  TChainItem file(3, "C:\\data\\base.raw", false, true);
  EXPECT_EQ(file.id, 0x04000003u);
  EXPECT_EQ(file.file_name, "base.raw");
  TPointItem point(2);
  TAntennItem first(1), second(2);
  TOccupItem occupation(1);

  EXPECT_TRUE(occupation.SetAntenna(&first));
  EXPECT_FALSE(occupation.SetAntenna(&second));
  EXPECT_EQ(occupation.antenna, &first);
  EXPECT_FALSE(occupation.SetReceiver(nullptr));

  EXPECT_TRUE(occupation.SetFile(&file));
  EXPECT_FALSE(occupation.SetFile(&file));
  ASSERT_EQ(file.occupations.Count(), 1u);
  EXPECT_EQ(file.occupations.head()->occupation, &occupation);
  EXPECT_TRUE(occupation.SetPoint(&point));
  EXPECT_EQ(point.occupations.Count(), 1u);
}

TEST(Items, ParamBlockCopiesWhatItsHeaderSays) {
  auto block = ParamBlock::Create(12);
  EXPECT_EQ(block->data()[0] | block->data()[1] << 8, 0);
  EXPECT_EQ(block->allocated(), 12);
  block->data()[11] = 0x7F;
  auto copy = block->Copy();
  EXPECT_EQ(copy->allocated(), 12);
  EXPECT_EQ(copy->data()[11], 0x7F);
  EXPECT_NE(copy->data(), block->data());

  // An engine that enlarges the header must not make the copy read past the block.
  block->data()[2] = 0xFF;
  block->data()[3] = 0x01;
  auto enlarged = block->Copy();
  EXPECT_EQ(enlarged->allocated(), 0x1FF);
  EXPECT_EQ(enlarged->data()[11], 0x7F);
  EXPECT_EQ(enlarged->data()[12], 0);
}

}  // namespace
}  // namespace vox
