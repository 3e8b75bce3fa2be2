// The comparisons that vesk2_bench makes. Each sets the library's way of doing a thing against the
// plainest fast way to do it with libcrypto and system calls alone.
#ifndef VESK2_BENCH_BENCH_H
#define VESK2_BENCH_BENCH_H

#include <cstdint>

namespace bench {

struct Comparison {
  const char* name;       // of the library's way
  const char* reference;  // of the other
  int64_t repetitions;
  int64_t iterations;  // of one repetition
  int64_t bytes;       // that one iteration goes through; 0 for none
  // Makes what both ways work on and tells whether both do it right.
  bool (*prepare)();
  void (*clean)();
  // One iteration each; false for a wrong result.
  bool (*library)();
  bool (*bare)();
};

extern const Comparison kHashFile;
extern const Comparison kCertVerify;

}  // namespace bench

#endif  // VESK2_BENCH_BENCH_H
