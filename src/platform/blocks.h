// SPDX-License-Identifier: Apache-2.0
// Memory for many small things that are made together: cut from blocks, so that none of them is
// allocated by itself. Each counts in its block, which goes with the last of them: they may outlive
// one another, and go in any order and in any thread.
#ifndef VESK2_SRC_PLATFORM_BLOCKS_H
#define VESK2_SRC_PLATFORM_BLOCKS_H

#include <atomic>
#include <cstddef>
#include <cstdint>

#ifdef __SANITIZE_ADDRESS__
extern "C" void __asan_poison_memory_region(const volatile void* memory, size_t size);
#endif

namespace ZVsysutil {

// Stands in front of a block's memory.
struct alignas(16) ZvBlock {
  // A thing is known by its place: the bytes between it and its block's start, never 0.
  static ZvBlock* Of(void* memory, uint32_t place) {
    return reinterpret_cast<ZvBlock*>(static_cast<unsigned char*>(memory) - place);
  }
  // Takes away that many things.
  void Drop(uint32_t count);

  std::atomic<uint32_t> things;
  const bool large;  // stands in pages of its own
};

// Makes things. Their memory is aligned to 8 bytes.
class ZvBlocks {
 public:
  // Of a short list. A maker that knows how much it will cut asks for that, and kBlockHead more.
  static constexpr size_t kFirst = 512;
  static constexpr size_t kBlockHead = sizeof(ZvBlock);
  explicit ZvBlocks(size_t first = kFirst) : following_(first) {}
  ~ZvBlocks() { Close(); }
  ZvBlocks(const ZvBlocks&) = delete;
  ZvBlocks& operator=(const ZvBlocks&) = delete;

  // Null without memory.
  void* Cut(size_t size, uint32_t& place) {
    static constexpr size_t kStep = 8;
    size = (size + kStep - 1) / kStep * kStep;
    if (static_cast<size_t>(end_ - next_) < size && !Open(size)) return nullptr;
    unsigned char* const memory = next_;
    next_ += size;
    ++count_;
    place = static_cast<uint32_t>(memory - reinterpret_cast<unsigned char*>(block_));
    return memory;
  }

 private:
  bool Open(size_t size);
  void Close();

  ZvBlock* block_ = nullptr;
  unsigned char* next_ = nullptr;
  unsigned char* end_ = nullptr;
  uint32_t count_ = 0;  // of what was cut from the block
  size_t opened_ = 0;   // the size of the last block
  size_t following_;    // and of the next one
};

// Drops things of one block together, as most that go one after the other are.
class ZvDrops {
 public:
  ZvDrops() = default;
  ~ZvDrops() { Flush(); }
  ZvDrops(const ZvDrops&) = delete;
  ZvDrops& operator=(const ZvDrops&) = delete;

  void Add(void* memory, uint32_t place, [[maybe_unused]] size_t size) {
    ZvBlock* const block = ZvBlock::Of(memory, place);
    if (block != block_) {
      Flush();
      block_ = block;
    }
    ++count_;
#ifdef __SANITIZE_ADDRESS__  // else the use of what is gone would not be seen
    __asan_poison_memory_region(memory, size);
#endif
  }

 private:
  void Flush() {
    // NOLINTNEXTLINE(clang-analyzer-core.CallAndMessage): what is counted lies in a block
    if (count_ > 0) block_->Drop(count_);
    count_ = 0;
  }

  ZvBlock* block_ = nullptr;
  uint32_t count_ = 0;
};

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_BLOCKS_H
