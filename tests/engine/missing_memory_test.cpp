// SPDX-License-Identifier: Apache-2.0
// Reductions for which the memory does not suffice.
#include "tests/engine/reduce_fixture.h"

namespace ZvVesk2::Engine {
namespace {

// Whatever allocation fails, of the parser, the tags or the tuples, the answer is that failure.
TEST(MissingMemory, IsReportedAndGrantsNothing) {
  const std::string prop =
      "(propagate)(tag (x (* set (* prefix ab) b (y (*) z)) (* range alpha (ge a))))";
  const std::string mine = "(tag (x (* set abc [h]b (y z)) (* prefix \x01\xff)))";
  const std::string n = Name(A, "n");
  const Input input = {
      Entry(KOfN(2, 2, B + n), prop) + Entry(A, prop),
      Cert(n, C, "") + Cert(C, R, mine + Dates("1", "2")) + Cert(B, R, mine) + Cert(A, R, prop)};
  std::string expected, text;
  ASSERT_EQ(0, ReduceEngine().Reduce(input, &expected));
  for (long n_th = 0; text.empty(); ++n_th) {
    ReduceEngine engine;
    engine.allocator_.fail_after = n_th;
    const spki_status status = engine.Reduce(input, &text);
    ASSERT_EQ(text.empty() ? SPKI_ERR_NO_MEM : 0, status) << n_th;
  }
  EXPECT_EQ(expected, text);
}

}  // namespace
}  // namespace ZvVesk2::Engine
