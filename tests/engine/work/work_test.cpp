// SPDX-License-Identifier: Apache-2.0
// The engine, compiled once more so that it counts what it does: the blocks of its code that it
// enters, and the bytes that it gives to the C library and to the hashes. Whatever the input is,
// that must be paid for in the budget's units; a loop that forgets to charge shows here and not as
// a machine that hangs.
#include <openssl/evp.h>

#include "tests/engine/reduce_fixture.h"
#include "tests/support/worst_inputs.h"

namespace {

struct Work {
  uint64_t blocks = 0;
  uint64_t bytes = 0;
  uint64_t hashed = 0;
};
Work work;
bool counting = false;

void CountBytes(size_t size) {
  if (counting) work.bytes += size;
}

}  // namespace

extern "C" {

void __sanitizer_cov_trace_pc() {
  if (counting) ++work.blocks;
}

#define VESK2_COUNTED(result, name, parameters, arguments, size) \
  result __real_##name parameters;                               \
  result __wrap_##name parameters;                               \
  result __wrap_##name parameters {                              \
    CountBytes(size);                                            \
    return __real_##name arguments;                              \
  }
VESK2_COUNTED(int, memcmp, (const void* a, const void* b, size_t size), (a, b, size), size)
VESK2_COUNTED(void*, memchr, (const void* a, int c, size_t size), (a, c, size), size)
VESK2_COUNTED(void*, memset, (void* a, int c, size_t size), (a, c, size), size)
VESK2_COUNTED(void*, memcpy, (void* to, const void* from, size_t size), (to, from, size), size)
VESK2_COUNTED(void*, memmove, (void* to, const void* from, size_t size), (to, from, size), size)

int __real_EVP_DigestUpdate(EVP_MD_CTX* context, const void* data, size_t size);
int __wrap_EVP_DigestUpdate(EVP_MD_CTX* context, const void* data, size_t size);
int __wrap_EVP_DigestUpdate(EVP_MD_CTX* context, const void* data, size_t size) {
  if (counting) work.hashed += size;
  return __real_EVP_DigestUpdate(context, data, size);
}
decltype(EVP_Digest) __real_EVP_Digest, __wrap_EVP_Digest;
int __wrap_EVP_Digest(const void* data, size_t size, unsigned char* digest, unsigned* length,
                      const EVP_MD* algorithm, ENGINE* engine) {
  if (counting) work.hashed += size;
  return __real_EVP_Digest(data, size, digest, length, algorithm, engine);
}

}  // extern "C"

namespace ZvVesk2::Engine {
namespace {

using vesk2test::WorstCall;
using vesk2test::WorstInput;

struct Outcome {
  spki_status status;
  size_t input;
  size_t granted;  // elements of the result
  spki_budget spent;
  Work work;
};

// With so many units left of the budget.
Outcome Reduced(const WorstInput& input, size_t bytes, uint32_t units) {
  const vesk2test::WorstLists text = input.make(bytes);
  ReduceEngine engine;
  spki_elem* lists[4] = {};
  const std::string* texts[] = {&text.acl, &text.sequence, &text.third, &text.tag};
  Outcome outcome = {};
  for (size_t i = 0; i < std::size(lists); ++i) {
    outcome.input += texts[i]->size();
    if (!texts[i]->empty()) lists[i] = engine.Parse(*texts[i]);
  }
  const auto [acl, sequence, third, tag] = lists;
  spki_elem* result = nullptr;
  engine.engine_.budget.comparisons = Limits::kMaxComparisons - units;
  work = {};
  counting = true;
  if (input.call == WorstCall::Subset) {
    spki_elem_assign(&engine.engine_, &result, spki_intersect_chain(&engine.engine_, tag, acl));
    if (result != nullptr) (void)spki_cmp_chain(&engine.engine_, result, tag);
    outcome.status = engine.engine_.budget.spent;
  } else {
    spki_elem* request = input.call == WorstCall::ReductA ? tag : nullptr;
    outcome.status = spki_reduce(&engine.engine_, acl, sequence, third, request, nullptr, &result);
  }
  counting = false;
  outcome.work = work;
  outcome.spent = engine.engine_.budget;
  outcome.spent.comparisons -= Limits::kMaxComparisons - units;
  for (spki_elem* entry = result; entry != nullptr; entry = entry->next) ++outcome.granted;
  engine.Keep(result);
  return outcome;
}

// What was paid for: a unit and a byte of the input stand for as many blocks as the dearest of
// their kind enters; tuples are dear.
double Paid(const Outcome& outcome) {
  return 60.0 * outcome.spent.comparisons + 200.0 * outcome.spent.combinations +
         500.0 * outcome.spent.tuples + 30.0 * static_cast<double>(outcome.input);
}
// In blocks: the C library gets through 16 bytes in the time of one, and a hash through one.
double Done(const Outcome& outcome) {
  return static_cast<double>(outcome.work.blocks) + static_cast<double>(outcome.work.bytes) / 16 +
         static_cast<double>(outcome.work.hashed);
}

TEST(Work, IsPaidFor) {
  for (const WorstInput& input : vesk2test::WorstInputs()) {
    const Outcome outcome = Reduced(input, vesk2test::kWorstBytes, vesk2test::kWorstUnits);
    EXPECT_LE(Done(outcome), Paid(outcome)) << input.name;
    EXPECT_EQ(1000 * input.units == vesk2test::kWorstUnits, outcome.status != 0) << input.name;
    // Tables are trees over digests, whose shape differs from run to run.
    EXPECT_NEAR(input.units, outcome.spent.comparisons / 1000.0, 1 + 0.05 * input.units)
        << input.name;
  }
}

// More than 20,000 entries, certificates or definitions, with the one that counts at the end.
TEST(Work, LargeInstallationsAreAnswered) {
  for (const WorstInput& input : vesk2test::WorstInputs()) {
    if (!input.large) continue;
    const Outcome outcome = Reduced(input, 2'200'000, Limits::kMaxComparisons);
    EXPECT_EQ(0, outcome.status) << input.name;
    EXPECT_EQ(2u, outcome.granted) << input.name;
    EXPECT_LT(outcome.spent.comparisons, 10 * outcome.input) << input.name;
  }
}

}  // namespace
}  // namespace ZvVesk2::Engine
