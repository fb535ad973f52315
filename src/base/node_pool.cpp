#include "base/node_pool.h"

#include <cstdlib>
#include <utility>

namespace vox {

NodePool::NodePool(NodePool&& other) noexcept
    : chain_(std::exchange(other.chain_, nullptr)),
      present_(std::exchange(other.present_, nullptr)),
      kept_(std::exchange(other.kept_, nullptr)),
      block_size_(std::exchange(other.block_size_, kInitialBlockSize)),
      smallest_(std::exchange(other.smallest_, SIZE_MAX)) {}

NodePool& NodePool::operator=(NodePool&& other) noexcept {
  if (this != &other) {
    Release();
    chain_ = std::exchange(other.chain_, nullptr);
    present_ = std::exchange(other.present_, nullptr);
    kept_ = std::exchange(other.kept_, nullptr);
    block_size_ = std::exchange(other.block_size_, kInitialBlockSize);
    smallest_ = std::exchange(other.smallest_, SIZE_MAX);
  }
  return *this;
}

void NodePool::Release() {
  while (chain_ != nullptr)
    std::free(std::exchange(chain_, chain_->next));
  present_ = nullptr;
  kept_ = nullptr;
  block_size_ = kInitialBlockSize;
  smallest_ = SIZE_MAX;
}

size_t NodePool::block_count() const {
  size_t count = 0;
  for (const Block* b = chain_; b != nullptr; b = b->next)
    ++count;
  return count;
}

void* NodePool::Cut(Block* block, size_t bytes) {
  void* node = reinterpret_cast<char*>(block + 1) + block->used;
  block->used += static_cast<uint32_t>(bytes);
  block->free -= static_cast<uint32_t>(bytes);
  return node;
}

NodePool::Block* NodePool::NewBlock(size_t data_bytes) {
  if (data_bytes > UINT32_MAX) return nullptr;
  auto* block = static_cast<Block*>(std::malloc(data_bytes + kHeadSize));
  if (block == nullptr) return nullptr;
  block->next = nullptr;
  block->used = 0;
  block->free = static_cast<uint32_t>(data_bytes);
  return block;
}

void* NodePool::Allocate(size_t bytes) {
  if (bytes > SIZE_MAX - 8) return nullptr;
  const size_t request = ((bytes == 0 ? 1 : bytes) + 7) & ~size_t{7};
  if (request < smallest_) smallest_ = request;

  // A large node would waste most of a shared block: it gets one of its own, and the blocks
  // that serve the small nodes stay as they are.
  if (request > block_size_ / 4) {
    Block* own = NewBlock(request);
    if (own == nullptr) return nullptr;
    if (present_ != nullptr) {
      own->next = present_->next;
      present_->next = own;
    } else {
      own->next = chain_;
      chain_ = own;
    }
    return Cut(own, request);
  }

  // Keep at least 128 nodes per block so that large nodes do not mean a block per few nodes.
  if (128 * request > block_size_) block_size_ = (128 * request + 65551) & ~size_t{65535};

  if (kept_ != nullptr) {
    if (kept_->free >= request) return Cut(kept_, request);
    // Nothing that can still be asked for fits: stop trying this block.
    if (kept_->free < smallest_) kept_ = nullptr;
  }
  if (present_ != nullptr && present_->free >= request) return Cut(present_, request);

  Block* fresh = NewBlock(block_size_ - kHeadSize);
  if (fresh == nullptr) return nullptr;
  fresh->next = chain_;
  chain_ = fresh;
  kept_ = present_;
  present_ = fresh;
  return Cut(fresh, request);
}

}  // namespace vox
