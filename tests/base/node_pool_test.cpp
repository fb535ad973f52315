#include "base/node_pool.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <vector>

namespace vox {
namespace {

uintptr_t Address(const void* p) {
  return reinterpret_cast<uintptr_t>(p);
}

TEST(NodePool, ManySmallNodesAndOneOversizedNode) {
  NodePool pool;
  std::vector<uint8_t*> nodes;
  uint8_t* big = nullptr;
  for (int i = 0; i < 100000; ++i) {
    if (i == 50000) {
      big = static_cast<uint8_t*>(pool.Allocate(40000));  // more than a quarter of a block
      ASSERT_NE(big, nullptr);
      std::memset(big, 0xAB, 40000);
    }
    auto* node = static_cast<uint8_t*>(pool.Allocate(37));
    ASSERT_NE(node, nullptr);
    EXPECT_EQ(Address(node) % 8, 0u);
    std::memset(node, i & 0xFF, 37);
    nodes.push_back(node);
  }
  // The oversized node did not interrupt the block the small ones were cut from.
  EXPECT_EQ(Address(nodes[50000]), Address(nodes[49999]) + 40);
  EXPECT_EQ(pool.block_size(), NodePool::kInitialBlockSize);
  // 40-byte nodes fill blocks of 65536 - 16 bytes, plus the oversized node's own block.
  const size_t per_block = (65536 - 16) / 40;
  EXPECT_EQ(pool.block_count(), (100000 + per_block - 1) / per_block + 1);

  // No node overlaps another: every one still holds what was written to it.
  for (size_t i = 0; i < nodes.size(); ++i) {
    for (int b = 0; b < 37; ++b)
      ASSERT_EQ(nodes[i][b], static_cast<uint8_t>(i & 0xFF)) << i;
  }
  for (int b = 0; b < 40000; ++b)
    ASSERT_EQ(big[b], 0xAB);

  pool.Release();
  EXPECT_EQ(pool.block_count(), 0u);
  EXPECT_NE(pool.Allocate(8), nullptr);
  EXPECT_EQ(pool.block_count(), 1u);
}

TEST(NodePool, OversizedNodeBeforeAnyBlockIsKept) {
  NodePool pool;
  ASSERT_NE(pool.Allocate(30000), nullptr);
  ASSERT_NE(pool.Allocate(16), nullptr);
  ASSERT_NE(pool.Allocate(30000), nullptr);
  EXPECT_EQ(pool.block_count(), 3u);
}

TEST(NodePool, BlocksGrowForLargerNodes) {
  NodePool pool;
  ASSERT_NE(pool.Allocate(1000), nullptr);  // 128 nodes of 1000 bytes exceed 65536
  EXPECT_EQ(pool.block_size(), 131072u);
  void* first = pool.Allocate(1000);
  for (int i = 0; i < 125; ++i)
    pool.Allocate(1000);
  EXPECT_EQ(pool.block_count(), 1u);
  EXPECT_GT(Address(pool.Allocate(1000)), Address(first));
}

TEST(NodePool, TheBlockBeforeThePresentOneServesWhatStillFits) {
  NodePool pool;
  auto* first = static_cast<uint8_t*>(pool.Allocate(512));
  for (int i = 1; i < 127; ++i)
    pool.Allocate(512);  // 127 * 512 leaves 496 bytes free
  auto* second_block = static_cast<uint8_t*>(pool.Allocate(504));
  EXPECT_EQ(pool.block_count(), 2u);
  const auto in_first = [&](void* p) {
    return Address(p) >= Address(first) && Address(p) < Address(first) + 65520;
  };
  EXPECT_FALSE(in_first(second_block));
  void* small = pool.Allocate(8);
  EXPECT_TRUE(in_first(small));
  EXPECT_EQ(Address(small), Address(first) + 127 * 512);
  EXPECT_TRUE(in_first(pool.Allocate(488)));  // fills the first block exactly
  EXPECT_EQ(Address(pool.Allocate(8)), Address(second_block) + 504);
}

}  // namespace
}  // namespace vox
