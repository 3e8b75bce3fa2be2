// SPDX-License-Identifier: Apache-2.0
// Hashing files.
#include <vesk2/hash.h>

#include "bench/bench.h"
#include "bench/floor/floor.h"

namespace bench {
namespace {

int Started(void*, const char*, uint64_t) { return 0; }
int Told(void*, uint64_t) { return 0; }
void Ended(void*, const char*, int) {}

Outcome HashFile(const Effort& effort, bool told) {
  const Place place("hash");
  const size_t size = effort.Of(size_t{512} << 20, size_t{256} << 20);
  std::string bytes(size, '\0');
  uint32_t state = 1;
  for (char& byte : bytes) byte = static_cast<char>((state = state * 1664525 + 1013904223) >> 24);
  const std::string path = place.Write("file", bytes);
  bytes = {};
  const Vesk2FileCallbacks callbacks = {sizeof callbacks, nullptr, Started, Told, Ended};
  floor::Digest ours{};
  floor::Digest theirs{};
  return Ratio(
      effort,
      [&] {
        auto length = static_cast<unsigned>(ours.size());
        return ZvVesk2::Hash::HashFile(path.c_str(), ours.data(), &length, nullptr,
                                       told ? &callbacks : nullptr) == 0;
      },
      [&] { return floor::HashFile(path.c_str(), theirs) && ours == theirs; });
}

}  // namespace

Figures HashFigures() {
  return {
      {"H1a", "HashFile, one large file", "read 64 KiB, EVP update", 1.12,
       [](const Effort& effort) { return HashFile(effort, false); }},
      {"H1b", "the same with callbacks", "the same", 1.12,
       [](const Effort& effort) { return HashFile(effort, true); }},
  };
}

}  // namespace bench
