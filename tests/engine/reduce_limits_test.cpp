// Hostile credentials: whatever they multiply, the reduction ends, and ends as a failure.
#include "tests/engine/reduce_fixture.h"

namespace ZvVesk2::Engine {
namespace {

class HostileTest : public ReduceTest {
 protected:
  // With most of the work done already, so that the tests are quick.
  void Exhausts(const Input& input) {
    engine_.budget.spent = 0;
    engine_.budget.comparisons = Limits::kMaxComparisons - 2'000'000;
    Fails(SPKI_ERR_NO_MEM, input);
  }
};

TEST_F(HostileTest, TuplesThatMultiply) {
  std::string certs = Cert(B, A, "(propagate)(tag (*))");
  // Each certificate leaves out one word: every subset of words is a grant of its own.
  for (int i = 0; i < 24; ++i) {
    std::string words;
    for (int j = 0; j < 24; ++j) words += j == i ? "" : " w" + std::to_string(j);
    certs += Cert(A, B, "(propagate)(tag (* set" + words + "))");
  }
  Exhausts({Entry(R), certs, ""});
}

// Each certificate grants twice what the one behind it does, by sharing it: in the end that is a
// tag which nobody can write out.
TEST_F(HostileTest, TagsThatMultiply) {
  constexpr int kDepth = 40;
  const auto nested = [](std::string inner, int depth) {
    for (int i = 0; i < depth; ++i) inner = "(x c " + inner + ")";
    return inner;
  };
  const auto key = [](int i) { return Key("K" + std::to_string(i)); };
  std::string certs = Cert(key(kDepth), R, "(tag " + nested("z", kDepth + 2) + ")");
  for (int i = kDepth - 1; i >= 0; --i) {
    const std::string tag = nested("(x c (* set (x c (*)) (x c (*) q e)) q)", i);
    certs = Cert(key(i), key(i + 1), "(propagate)(tag " + tag + ")") + certs;
  }
  Exhausts({Entry(key(0), "(propagate)(tag (*))"), certs});
}

// Principals of one bucket, and grants of one issuer, are looked for one after the other.
TEST_F(HostileTest, CrowdedTables) {
  std::string certs, entries;
  for (int i = 10'000; i < 13'000; ++i) {
    certs += Cert("(hash sha1 hhhhhhhhhhhhhhh" + std::to_string(i) + ")", A);
    entries += Entry(A, "(tag " + std::to_string(i) + ")");
  }
  Exhausts({Entry(R), certs});
  Exhausts({entries});
}

// Derived grants nest as deep as the chain is long.
TEST_F(HostileTest, LongChains) {
  constexpr int kLength = 20'000;
  std::string certs;
  for (int i = 0; i < kLength; ++i) {
    certs += Cert(Key(std::to_string(i)), Key(std::to_string(i + 1)), kProp);
  }
  const std::string last = Key(std::to_string(kLength));
  Grants(Entry(last, kProp), {Entry(Key("0"), kProp), certs, last});
}

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
