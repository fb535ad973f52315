// NodePool: a bump allocator for the many small nodes of long per-satellite lists (precise
// orbit samples, meteorological samples). Nodes are never freed one by one; the pool returns
// all its blocks at once, which makes filling a store with hundreds of thousands of samples
// cheap in both time and memory.
//
// Thread safety: a pool belongs to one store; the stores are filled on the job thread before
// any engine reads them, so the pool takes no locks.
#pragma once

#include <cstddef>
#include <cstdint>

namespace vox {

class NodePool {
 public:
  static constexpr uint32_t kInitialBlockSize = 65536;
  static constexpr uint32_t kHeadSize = 16;

  NodePool() = default;
  ~NodePool() { Release(); }
  NodePool(const NodePool&) = delete;
  NodePool& operator=(const NodePool&) = delete;
  NodePool(NodePool&& other) noexcept;
  NodePool& operator=(NodePool&& other) noexcept;

  // Memory for a node of bytes bytes, aligned to 8; null when the system has none to give.
  void* Allocate(size_t bytes);
  // Returns every block; the pool can be used again afterwards.
  void Release();

  size_t block_size() const { return block_size_; }
  size_t block_count() const;

 private:
  // The head of each block: the next block of the chain, then how much of the block is cut
  // and how much is left.
  struct Block {
    Block* next;
    uint32_t used;
    uint32_t free;
  };
  static_assert(sizeof(Block) == kHeadSize);

  static void* Cut(Block* block, size_t bytes);
  Block* NewBlock(size_t data_bytes);

  Block* chain_ = nullptr;    // every block, for Release
  Block* present_ = nullptr;  // the block requests are cut from
  Block* kept_ = nullptr;     // the block before the present one, while it may still serve
  size_t block_size_ = kInitialBlockSize;
  size_t smallest_ = SIZE_MAX;  // the smallest request seen
};

}  // namespace vox
