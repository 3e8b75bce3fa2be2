// SPDX-License-Identifier: Apache-2.0
// See blocks.h.
#include "src/platform/blocks.h"

#include <sys/mman.h>

#include <algorithm>
#include <new>

namespace ZVsysutil {
namespace {

// Each block is twice as large as the one before. Where the memory that is not used yet has not
// been touched either, it is four times. The largest is a size that the C library keeps for what is
// read next rather than giving it back to the system at once; a single thing that stays keeps no
// more than that.
constexpr size_t kTouched = size_t{64} << 10;
constexpr size_t kLargest = size_t{4} << 20;

// From the second block of the largest size on, pages are of this size where the system has them: a
// text of megabytes becomes twenty times as much, and to make forty thousand small pages for it
// takes twice as long as reading it.
constexpr std::align_val_t kLargePage{size_t{2} << 20};

unsigned char* Allocate(size_t size, bool large) {
  if (!large) return new (std::nothrow) unsigned char[size];
  auto* const memory = new (kLargePage, std::nothrow) unsigned char[size];
  if (memory != nullptr) madvise(memory, size, MADV_HUGEPAGE);  // a wish
  return memory;
}

size_t Grown(size_t size) { return std::min(size < kTouched ? 2 * size : 4 * size, kLargest); }

// Stands for the things that are still to be made.
constexpr uint32_t kUnfinished = uint32_t{1} << 30;

}  // namespace

void ZvBlock::Drop(uint32_t count) {
  if (things.fetch_sub(count, std::memory_order_acq_rel) != count) return;
  const bool wasLarge = large;
  this->~ZvBlock();
  if (wasLarge) {
    ::operator delete[](this, kLargePage);
  } else {
    delete[] reinterpret_cast<unsigned char*>(this);
  }
}

bool ZvBlocks::Open(size_t size) {
  Close();
  const bool large = opened_ >= kLargest;
  const size_t whole = std::max(size + sizeof(ZvBlock), following_);
  unsigned char* const memory = Allocate(whole, large);
  if (memory == nullptr) return false;
  block_ = new (memory) ZvBlock{kUnfinished, large};
  next_ = memory + sizeof(ZvBlock);
  end_ = memory + whole;
  opened_ = whole;
  following_ = Grown(whole);
  return true;
}

void ZvBlocks::Close() {
  if (block_ != nullptr) block_->Drop(kUnfinished - count_);
  block_ = nullptr;
  next_ = end_ = nullptr;
  count_ = 0;
}

}  // namespace ZVsysutil
