// SPDX-License-Identifier: Apache-2.0
// How long the worst inputs hold the machine, and how much of it.
#ifndef VESK2_BENCH_WORST_H
#define VESK2_BENCH_WORST_H

namespace bench {

// Prints one line for each input and size; 1 when one is out of its bounds.
int RunWorst();

}  // namespace bench

#endif  // VESK2_BENCH_WORST_H
