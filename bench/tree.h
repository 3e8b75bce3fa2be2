// SPDX-License-Identifier: Apache-2.0
// A signed tree of many files, on disk.
#ifndef VESK2_BENCH_TREE_H
#define VESK2_BENCH_TREE_H

#include <vector>

#include "bench/bench.h"
#include "bench/floor/floor.h"

namespace bench {

struct Tree {
  // 100 files a directory, of `bytes` bytes each.
  Tree(size_t files, size_t bytes);
  // Verifies it by the library; false for anything but a yes. `jobs` threads hash the files.
  bool Verify(unsigned jobs = 1) const;
  // The command that does the same, and lists of the tree as other programs want them.
  std::vector<std::string> Command() const;
  std::string SumList() const;
  std::string MtreeList() const;
  size_t Entries() const { return files + listed.size(); }

  const size_t files;
  const size_t bytes;
  const Place place;
  const std::string root;
  std::string manifest;
  std::vector<floor::ListedDirectory> listed;
};

// The tree of that size, made when it is asked for first and gone at the end of the program.
const Tree& TheTree(size_t files, size_t bytes);

}  // namespace bench

#endif  // VESK2_BENCH_TREE_H
