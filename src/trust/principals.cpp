// SPDX-License-Identifier: Apache-2.0
// See principals.h. A key is known by its digest, so that an entry that names it by key, by hash or
// within a group is found with one search; without the index a large store and a long chain would
// cost their product.
#include "src/trust/principals.h"

#include <algorithm>

#include <vesk2/acl_entry.h>

#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

// Those by which a hash can name a key. A key is filed under each, as an entry may use any.
constexpr ZvclmHashID kAlgorithms[] = {ZVCLM_HASH_SHA256, ZVCLM_HASH_SHA1, ZVCLM_HASH_RMD160};

}  // namespace

// The digest of a key; of a hash what it says itself, whatever the algorithm asked for. Not known
// when the digest is none that names a key. Hints do not count, as they do not in the reduction.
int Principals::DigestOf(bool& known, Digest& digest, DExpression* key, ZvclmHashID algorithm) {
  digest = {algorithm, {}};
  if (const auto* hash = dynamic_cast<Hash*>(key)) {
    const ByteString* const bytes = hash->GetDigest();
    known = bytes != nullptr && bytes->GetLength() <= digest.bytes.size();
    digest.algorithm = hash->GetAlgorithm();
    if (known) std::copy_n(bytes->GetData(), bytes->GetLength(), digest.bytes.begin());
    return 0;
  }
  unsigned char* bytes = nullptr;
  unsigned int length = 0;
  const int code = key->ComputeHash(bytes, length, algorithm, true);
  const std::unique_ptr<unsigned char[]> owner(bytes);
  VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  known = code == 0 && length <= digest.bytes.size();
  if (known) std::copy_n(bytes, length, digest.bytes.begin());
  return 0;
}

// Sorted by digest and then by certificate: the run of one key lists the certificates that it
// issued in their order.
int Principals::Load(const Evidence& evidence) {
  certs_ = evidence.CountCerts();
  count_ = 0;
  marks_.reset(TryNewArray<Mark>((certs_ + 1) * std::size(kAlgorithms)));
  VESK2_REQUIRE(marks_, VESK2_ERR_MEM_ALLOC);
  for (size_t i = 0; i < certs_; ++i) VESK2_TRY(Add(evidence.GetCert(i)->GetIssuer(), i));
  if (certs_ > 0) VESK2_TRY(Add(evidence.GetCert(0)->GetSubject(), certs_));
  std::sort(marks_.get(), marks_.get() + count_, [](const Mark& a, const Mark& b) {
    return a.digest != b.digest ? a.digest < b.digest : a.cert < b.cert;
  });
  return 0;
}

// One mark for each digest that the key can be named by; a hash is only what it says.
int Principals::Add(DExpression* key, size_t cert) {
  const bool isHash = dynamic_cast<Hash*>(key) != nullptr;
  for (const ZvclmHashID algorithm : kAlgorithms) {
    Mark& mark = marks_[count_];
    bool known = false;
    VESK2_TRY(DigestOf(known, mark.digest, key, algorithm));
    mark.cert = cert;
    if (known) ++count_;
    // It has one digest, whatever is asked for.
    if (isHash) break;
  }
  return 0;
}

// By SHA-256, which every key of the chain is filed under; a hash is looked for as it stands.
int Principals::Find(std::span<const Mark>& marks, DExpression* key) const {
  marks = {};
  Digest digest;
  bool known = false;
  VESK2_TRY(DigestOf(known, digest, key, ZVCLM_HASH_SHA256));
  if (!known) return 0;
  struct Less {
    bool operator()(const Mark& mark, const Digest& wanted) const { return mark.digest < wanted; }
    bool operator()(const Digest& wanted, const Mark& mark) const { return wanted < mark.digest; }
  };
  const auto [first, last] = std::equal_range(marks_.get(), marks_.get() + count_, digest, Less());
  marks = {first, last};
  return 0;
}

// A k-of-n is as good as its best member, for the question whether it has to do with the chain.
template <typename Matches>
int Principals::Any(bool& any, Subject* subject, Matches matches) const {
  any = false;
  std::span<const Mark> marks;
  auto* const threshold = dynamic_cast<ThresholdSubject*>(subject);
  // A key or a hash.
  if (threshold == nullptr) {
    VESK2_TRY(Find(marks, subject));
    any = matches(marks);
    return 0;
  }
  Ref<SExpression> members;
  VESK2_TRY(threshold->GetSubjects(members.Out()));
  for (auto it = members->Begin(); it && !any; it.Next()) {
    VESK2_TRY(Find(marks, it.Value()));
    any = matches(marks);
  }
  return 0;
}

int Principals::Names(bool& named, Subject* subject) const {
  return Any(named, subject, [](std::span<const Mark> marks) { return !marks.empty(); });
}

// The mark of the first subject has the number behind the last certificate, and is no issuer's.
int Principals::NamesIssuer(bool& named, Subject* subject) const {
  return NamesOtherIssuer(named, subject, certs_);
}

int Principals::NamesOtherIssuer(bool& named, Subject* subject, size_t cert) const {
  return Any(named, subject, [&](std::span<const Mark> marks) {
    // In the order of certificates: two are not issuers of others, at most.
    const size_t few = std::min<size_t>(marks.size(), 3);
    return std::any_of(marks.begin(), marks.begin() + static_cast<std::ptrdiff_t>(few),
                       [&](const Mark& mark) { return mark.cert < certs_ && mark.cert != cert; });
  });
}

// Members, not marks: a key that issued ten certificates is one key.
int Principals::CountMembers(size_t& count, ThresholdSubject* subject) const {
  count = 0;
  Ref<SExpression> members;
  VESK2_TRY(subject->GetSubjects(members.Out()));
  for (auto it = members->Begin(); it; it.Next()) {
    std::span<const Mark> marks;
    VESK2_TRY(Find(marks, it.Value()));
    if (!marks.empty()) ++count;
  }
  return 0;
}

// So that a text names each key once.
int Principals::IsFirstOf(bool& first, Principal* issuer, size_t cert) const {
  std::span<const Mark> marks;
  VESK2_TRY(Find(marks, issuer));
  first = marks.empty() || marks.front().cert == cert;
  return 0;
}

// In the order of the store, sharing the entries: what an explanation and an editor of entries look
// at, instead of all.
int Evidence::RelevantEntries(SExpression*& out) const {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> relevant(TryNew<SExpression>(context));
  VESK2_REQUIRE(relevant, VESK2_ERR_MEM_ALLOC);
  Principals principals;
  VESK2_TRY(principals.Load(*this));
  if (entries) {
    for (auto it = entries->Begin(); it; it.Next()) {
      auto* const entry = dynamic_cast<AclEntry*>(it.Value());
      bool named = false;
      if (entry != nullptr) VESK2_TRY(principals.Names(named, entry->GetSubject()));
      if (named) VESK2_TRY(AppendShared(relevant.get(), entry));
    }
  }
  out = relevant.Release();
  return 0;
}

}  // namespace ZvVesk2
