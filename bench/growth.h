// SPDX-License-Identifier: Apache-2.0
// How the work grows with what is asked about.
#ifndef VESK2_BENCH_GROWTH_H
#define VESK2_BENCH_GROWTH_H

namespace bench {

// Prints one line for each number of files, entries and certificates; 1 after a wrong result.
int RunGrowth();

}  // namespace bench

#endif  // VESK2_BENCH_GROWTH_H
