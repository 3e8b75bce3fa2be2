// Hostile credentials: whatever they multiply, the reduction ends, and ends as a failure.
#include "tests/engine/reduce_fixture.h"

namespace ZvVesk2::Engine {
namespace {

const std::string R = Key("R");
const std::string A = Key("A");
const std::string B = Key("B");

// A reduction that has done most of its work already, so that the tests are quick.
void SpendMost(spki_engine* engine) {
  engine->budget.comparisons = Limits::kMaxComparisons - 2'000'000;
}

TEST_F(ReduceTest, TuplesThatMultiply) {
  std::string words;
  for (int i = 0; i < 24; ++i) words += " w" + std::to_string(i) + " ";
  std::string certs = Cert(B, A, "(propagate)(tag (*))");
  // Each certificate leaves out one word: every subset of words is a grant of its own.
  for (int i = 0; i < 24; ++i) {
    std::string some = words;
    const std::string word = " w" + std::to_string(i) + " ";
    some.erase(some.find(word), word.size());
    certs += Cert(A, B, "(propagate)(tag (* set" + some + "))");
  }
  SpendMost(&engine_);
  Fails({Entry(R), certs, ""}, SPKI_ERR_NO_MEM);
}

// Each certificate grants twice what the one behind it does, by sharing it: in the end that is a
// tag which nobody can write out.
TEST_F(ReduceTest, TagsThatMultiply) {
  constexpr int kDepth = 40;
  const auto nested = [](std::string inner, int depth) {
    for (int i = 0; i < depth; ++i) inner = "(x c " + inner + ")";
    return inner;
  };
  std::string certs;
  for (int i = 0; i < kDepth; ++i) {
    certs += Cert(Key("K" + std::to_string(i)), Key("K" + std::to_string(i + 1)),
                  "(propagate)(tag " + nested("(x c (* set (x c (*)) (x c (*) q e)) q)", i) + ")");
  }
  certs += Cert(Key("K40"), R, "(tag " + nested("z", kDepth + 2) + ")");
  SpendMost(&engine_);
  Fails({Entry(Key("K0"), "(propagate)(tag (*))"), certs}, SPKI_ERR_NO_MEM);
}

// Principals of one bucket, and grants of one issuer, are looked for one after the other.
TEST_F(ReduceTest, CrowdedTables) {
  std::string certs;
  std::string entries;
  for (int i = 0; i < 3000; ++i) {
    const std::string number = std::to_string(i);
    certs += Cert("(hash sha1 " + std::string(20 - number.size(), 'h') + number + ")", A);
    entries += Entry(A, "(tag " + number + ")");
  }
  SpendMost(&engine_);
  Fails({Entry(R), certs}, SPKI_ERR_NO_MEM);
  engine_.budget.spent = 0;
  SpendMost(&engine_);
  Fails({entries}, SPKI_ERR_NO_MEM);
}

// Derived grants nest as deep as the chain is long.
TEST_F(ReduceTest, LongChains) {
  constexpr int kLength = 20'000;
  std::string certs;
  for (int i = 0; i < kLength; ++i) {
    certs += Cert(Key(std::to_string(i)), Key(std::to_string(i + 1)), "(propagate)(tag x)");
  }
  const std::string last = Key(std::to_string(kLength));
  Grants({Entry(Key("0"), "(propagate)(tag x)"), certs, last}, Entry(last, "(propagate)(tag x)"));
}

TEST_F(ReduceTest, MemoryThatRunsOut) {
  const std::string prop = "(propagate)(tag (* set a b))";
  const std::string name = "(name " + A + " n)";
  const Input input = {Entry(KOfN(2, 2, B + name), prop) + Entry(A, prop),
                       Cert(name, Key("C"), "") + Cert(Key("C"), R, prop + Dates("1", "2")) +
                           Cert(B, R, prop) + Cert(A, R, prop)};
  std::string expected;
  ASSERT_EQ(0, Run(input, &expected));
  std::string text;
  for (long n = 0; text.empty(); ++n) {
    // The parser's share of the memory is there from before.
    spki_elem* acl = Chain("(acl " + input.acl + ")");
    spki_elem* sequence = Chain("(sequence " + input.certs + ")");
    spki_elem* third = Chain(input.third);
    spki_elem* result = nullptr;
    allocator_.fail_after = n;
    const spki_status status =
        spki_reduce(&engine_, acl, sequence, third, nullptr, nullptr, &result);
    allocator_.fail_after = -1;
    engine_.budget.spent = 0;
    ASSERT_EQ(status == 0, result != nullptr);
    ASSERT_TRUE(status == 0 || status == SPKI_ERR_NO_MEM) << n << ": " << status;
    if (result != nullptr) text = Consume(result);
  }
  EXPECT_EQ(expected, text);
}

}  // namespace
}  // namespace ZvVesk2::Engine
