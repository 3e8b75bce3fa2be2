// SPDX-License-Identifier: Apache-2.0
// Reading, writing and hashing expressions, beside libgcrypt's where that is installed.
#include <vesk2.h>
#include <vesk2/expression.h>

#include <cstdlib>
#include <cstring>

#include "bench/bench.h"
#include "bench/floor/floor.h"
#include "tests/support/test_key.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

#ifdef VESK2_GCRYPT
#include <gcrypt.h>
#endif

namespace bench {
namespace {

using namespace ZvVesk2;

// A list of some `size` bytes, of grants as they stand in tags: short lists of short strings.
std::string Dense(size_t size) {
  std::string text = "(3:tag";
  for (unsigned i = 0; text.size() + 40 < size; ++i) {
    text += "(4:file" + vesk2test::Str(std::to_string(i)) + "(1:*6:prefix5:/usr/))";
  }
  return text + ")";
}

// So many times that something like this many bytes are worked on.
size_t Times(const Effort& effort, size_t size) {
  return 1 + effort.Of(size_t{32} << 20, size_t{8} << 20) / size;
}

#ifdef VESK2_GCRYPT

struct PeerFree {
  void operator()(gcry_sexp_t list) const { gcry_sexp_release(list); }
};
using PeerList = std::unique_ptr<gcry_sexp, PeerFree>;

PeerList ReadByPeer(const std::string& text) {
  static const bool ready = gcry_check_version(nullptr) != nullptr &&
                            gcry_control(GCRYCTL_INITIALIZATION_FINISHED, 0) == 0;
  gcry_sexp_t list = nullptr;
  if (!ready || gcry_sexp_new(&list, text.data(), text.size(), 1) != 0) return nullptr;
  return PeerList(list);
}

Outcome Import(const Effort& effort, size_t size) {
  const std::string text = Dense(size);
  const size_t times = Times(effort, size);
  return Ratio(
      effort,
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) right = right && vesk2test::Parse(text);
        return right;
      },
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) right = right && ReadByPeer(text) != nullptr;
        return right;
      });
}

bool WriteByPeer(gcry_sexp_t list, const std::string& wanted) {
  const size_t size = gcry_sexp_sprint(list, GCRYSEXP_FMT_CANON, nullptr, 0);
  const std::unique_ptr<char[]> bytes(new char[size]);
  const size_t written = gcry_sexp_sprint(list, GCRYSEXP_FMT_CANON, bytes.get(), size);
  return written == wanted.size() && bytes[written - 1] == ')';
}

Outcome Export(const Effort& effort, size_t size) {
  const std::string text = Dense(size);
  const size_t times = Times(effort, size);
  const Ref<SExpression> ours = vesk2test::Parse(text);
  const PeerList theirs = ReadByPeer(text);
  return Ratio(
      effort,
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) {
          unsigned char* bytes = nullptr;
          unsigned length = 0;
          right = right && ours->Export(bytes, length) == 0 && length == text.size() &&
                  bytes[length - 1] == ')';
          Vesk2Free(bytes);
        }
        return right;
      },
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) right = right && WriteByPeer(theirs.get(), text);
        return right;
      });
}

#else

Outcome Import(const Effort&, size_t) { return NotInstalled("libgcrypt"); }
Outcome Export(const Effort&, size_t) { return NotInstalled("libgcrypt"); }

#endif

Outcome ComputeHash(const Effort& effort, const std::string& text) {
  const Ref<SExpression> list = vesk2test::Parse(text);
  const size_t times = effort.Of(50'000, 10'000);
  floor::Sha256 hash;
  return Ratio(
      effort,
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) {
          unsigned char* digest = nullptr;
          unsigned length = 0;
          right = right && list->ComputeHash(digest, length, ZVCLM_HASH_SHA256, false) == 0;
          Vesk2Free(digest);
        }
        return right;
      },
      [&] {
        floor::Digest digest{};
        for (size_t i = 0; i < times; ++i) {
          hash.Start();
          hash.Add(text.data(), text.size());
          digest = hash.End();
        }
        return std::memcmp(digest.data(), vesk2test::Digest(text).data(), digest.size()) == 0;
      });
}

// A set of strings, none of which is in another set of another start, and in another order.
std::string Set(size_t count, size_t first) {
  std::string text = "(3:tag(1:*3:set";
  for (size_t i = 0; i < count; ++i) text += vesk2test::Str("s" + std::to_string(first + i * 7));
  return text + "))";
}

// What two sets have in common that share half of their strings.
Outcome Intersection(const Effort& effort) {
  constexpr size_t kMany = 4'000, kFew = 1'000;
  const auto intersect = [](const Ref<SExpression>& a, const Ref<SExpression>& b, size_t times) {
    bool right = true;
    for (size_t i = 0; i < times; ++i) right = right && !a->IsSubset(b.get());
    return right;
  };
  const auto sets = [](size_t count, size_t first) { return vesk2test::Parse(Set(count, first)); };
  const Ref<SExpression> many[] = {sets(kMany, 0), sets(kMany, kMany / 2 * 7)};
  const Ref<SExpression> few[] = {sets(kFew, 0), sets(kFew, kFew / 2 * 7)};
  const size_t times = effort.Of(20, 5);
  return Ratio(
      effort, [&] { return intersect(many[0], many[1], times); },
      [&] { return intersect(few[0], few[1], times); });
}

std::string ACertificate() {
  return vesk2test::Cert({.issuer = vesk2test::TestKey::Rsa(0).Public(),
                          .subject = vesk2test::TestKey::Rsa(1).Public(),
                          .tag = vesk2test::Tag("(install (app calc))"),
                          .propagate = true,
                          .notBefore = "2024-01-01_00:00:00",
                          .notAfter = "2034-01-01_00:00:00"});
}

}  // namespace

Figures ExpressionFigures() {
  constexpr size_t kSmall = 1 << 10, kMiddle = 100 << 10, kLarge = 8 << 20;
  return {
      {"H3a", "ComputeHash, 600 bytes of short strings", "EVP digest of the bytes, fetched once",
       2.0, [](const Effort& effort) { return ComputeHash(effort, Dense(600)); }},
      {"H3b", "of a certificate", "the same", 1.9,
       [](const Effort& effort) { return ComputeHash(effort, ACertificate()); }},
      {"P1a", "canonical import and release, 1 KiB", "gcry_sexp_new and release", 1.5,
       [](const Effort& effort) { return Import(effort, kSmall); }},
      {"P1b", "of 100 KiB", "the same", 1.5,
       [](const Effort& effort) { return Import(effort, kMiddle); }},
      {"P1c", "of 8 MiB", "the same", 2.0,
       [](const Effort& effort) { return Import(effort, kLarge); }},
      {"P2a", "export into a new array, 1 KiB", "gcry_sexp_sprint", 0.40,
       [](const Effort& effort) { return Export(effort, kSmall); }},
      {"P2b", "of 100 KiB", "the same", 0.40,
       [](const Effort& effort) { return Export(effort, kMiddle); }},
      {"P2c", "of 8 MiB", "the same", 0.40,
       [](const Effort& effort) { return Export(effort, kLarge); }},
      {"I1", "two sets intersected, of 4,000 over 1,000", "ratio", 6, Intersection},
  };
}

}  // namespace bench
