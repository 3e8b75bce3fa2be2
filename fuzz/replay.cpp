// SPDX-License-Identifier: Apache-2.0
// Runs a fuzz target over the files of a folder, so that every test run replays the corpora without
// libFuzzer.
#include <filesystem>
#include <fstream>
#include <iterator>

#include "fuzz/fuzz_support.h"

namespace fs = std::filesystem;

int main(int argc, char** argv) {
  if (argc != 3) return 2;
  const auto target = vesk2fuzz::Targets().find(argv[1]);
  if (target == vesk2fuzz::Targets().end()) return 2;
  int count = 0;
  for (const fs::directory_entry& entry : fs::directory_iterator(argv[2])) {
    std::ifstream file(entry.path(), std::ios::binary);
    const std::string text((std::istreambuf_iterator<char>(file)),
                           std::istreambuf_iterator<char>());
    target->second(text);
    ++count;
  }
  std::printf("%d inputs replayed\n", count);
  return count > 0 ? 0 : 1;
}
