// SPDX-License-Identifier: Apache-2.0
// See blocks.h.
#include "src/platform/blocks.h"

#include <algorithm>
#include <new>

namespace ZVsysutil {
namespace {

// The first block holds a short list, and each is twice as large as the one before. Where the
// memory that is not used yet has not been touched either, it is four times. The largest is a size
// that the C library keeps for what is read next rather than giving it back to the system at once;
// a single thing that stays keeps no more than that.
constexpr size_t kFirst = 512;
constexpr size_t kTouched = size_t{64} << 10;
constexpr size_t kLargest = size_t{4} << 20;

size_t Grown(size_t size) {
  return std::clamp(size < kTouched ? 2 * size : 4 * size, kFirst, kLargest);
}

// Stands for the things that are still to be made.
constexpr uint32_t kUnfinished = uint32_t{1} << 30;

}  // namespace

void ZvBlock::Drop(uint32_t count) {
  if (things.fetch_sub(count, std::memory_order_acq_rel) != count) return;
  this->~ZvBlock();
  delete[] reinterpret_cast<unsigned char*>(this);
}

bool ZvBlocks::Open(size_t size) {
  Close();
  grown_ = std::max(size + sizeof(ZvBlock), Grown(grown_));
  auto* const memory = new (std::nothrow) unsigned char[grown_];
  if (memory == nullptr) return false;
  block_ = new (memory) ZvBlock{kUnfinished};
  next_ = memory + sizeof(ZvBlock);
  end_ = memory + grown_;
  return true;
}

void ZvBlocks::Close() {
  if (block_ != nullptr) block_->Drop(kUnfinished - count_);
  block_ = nullptr;
  next_ = end_ = nullptr;
  count_ = 0;
}

}  // namespace ZVsysutil
