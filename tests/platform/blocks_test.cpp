// SPDX-License-Identifier: Apache-2.0
// Things cut from blocks: each keeps its bytes until it is dropped, whatever goes before it.
#include "src/platform/blocks.h"

#include <algorithm>
#include <random>
#include <vector>

#include <gtest/gtest.h>

namespace ZVsysutil {
namespace {

struct Thing {
  unsigned char* bytes;
  size_t size;
  uint32_t place;
  unsigned char mark;
};

bool IsWhole(const Thing& thing) {
  const auto marked = [&](unsigned char byte) { return byte == thing.mark; };
  return std::all_of(thing.bytes, thing.bytes + thing.size, marked);
}

// As many as fill blocks of every size, those of large pages too; among them some that are larger
// than any block.
std::vector<Thing> CutMany(std::mt19937& random) {
  ZvBlocks blocks;
  std::vector<Thing> things;
  for (size_t total = 0; total < size_t{24} << 20; total += things.back().size) {
    const size_t size = things.size() % 400 == 399 ? size_t{5} << 20 : 1 + random() % 20'000;
    Thing thing = {nullptr, size, 0, static_cast<unsigned char>(random())};
    thing.bytes = static_cast<unsigned char*>(blocks.Cut(size, thing.place));
    std::fill_n(thing.bytes, size, thing.mark);
    things.push_back(thing);
  }
  return things;
}

TEST(Blocks, ThingsGoInAnyOrder) {
  std::mt19937 random(1);
  std::vector<Thing> things = CutMany(random);
  std::ranges::shuffle(things, random);
  ZvDrops drops;
  for (const Thing& thing : things) {
    EXPECT_TRUE(IsWhole(thing));
    EXPECT_EQ(reinterpret_cast<uintptr_t>(thing.bytes) % 8, 0u);
    drops.Add(thing.bytes, thing.place, thing.size);
  }
}

}  // namespace
}  // namespace ZVsysutil
