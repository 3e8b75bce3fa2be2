// SPDX-License-Identifier: Apache-2.0
// Chains of certificates, and stores that trust their root.
#ifndef VESK2_BENCH_CHAIN_H
#define VESK2_BENCH_CHAIN_H

#include <vector>

#include "bench/bench.h"
#include "bench/floor/floor.h"

namespace bench {

// Makes `place` a store of that many entries, of which the last trusts the root of the chains to
// install; each of the others trusts another key. The library is told that it is its store.
void FillStore(const Place& place, size_t entries);
// Writes a chain in which each key lets the next one install, and returns its path. The signatures
// go to `made` if that is not null. `source` gives the tag of each certificate's revocation lists.
std::string WriteChain(const Place& place, unsigned certificates,
                       std::vector<floor::Signed>* made = nullptr,
                       std::string (*source)(unsigned) = nullptr);

}  // namespace bench

#endif  // VESK2_BENCH_CHAIN_H
