// Asking a loaded CRL store whether an object was revoked.
#include <vesk2/crl.h>

#include <array>
#include <cstring>
#include <memory>
#include <string_view>

#include <vesk2/hash.h>

#include "src/sexpr/same.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

using Bytes = std::basic_string_view<unsigned char>;

// Digests of the object that is asked about, each computed once however many items there are.
class Digests {
 public:
  explicit Digests(DExpression* object) : object_(object) {}

  // Whether an item's hash names the object. Its digest is taken with display hints (as its owner
  // hashed it) and without (as the reduction identifies it): adding hints to a key must not take it
  // off the list. An object that is itself a hash is also compared as it stands, since it names
  // what the item names.
  int Match(bool& matches, const Hash* named) {
    matches = false;
    const Bytes wanted = View(named->GetDigest());
    if (wanted.empty() || !IsKnown(named->GetAlgorithm())) return 0;
    for (const bool ignoreHints : {true, false}) {
      Bytes digest;
      VESK2_TRY(Compute(digest, named->GetAlgorithm(), ignoreHints));
      if (digest == wanted) matches = true;
    }
    auto* const hash = dynamic_cast<Hash*>(object_);
    if (hash != nullptr && hash->GetAlgorithm() == named->GetAlgorithm()) {
      if (View(hash->GetDigest()) == wanted) matches = true;
    }
    return 0;
  }

 private:
  static constexpr size_t kAlgorithms = 4;  // ids 0 to 3, of which 1 is none

  struct Digest {
    std::unique_ptr<unsigned char[]> bytes;
    unsigned int length = 0;
  };

  static bool IsKnown(ZvclmHashID id) {
    return id == ZVCLM_HASH_SHA1 || id == ZVCLM_HASH_SHA256 || id == ZVCLM_HASH_RMD160;
  }
  static Bytes View(const ByteString* value) {
    return value != nullptr ? Bytes(value->GetData(), value->GetLength()) : Bytes();
  }

  int Compute(Bytes& out, ZvclmHashID id, bool ignoreHints) {
    Digest& digest = digests_[static_cast<size_t>(id)][ignoreHints ? 1 : 0];
    if (!digest.bytes) {
      unsigned char* bytes = nullptr;
      VESK2_TRY(object_->ComputeHash(bytes, digest.length, id, ignoreHints));
      digest.bytes.reset(bytes);
    }
    out = Bytes(digest.bytes.get(), digest.length);
    return 0;
  }

  DExpression* object_;
  std::array<std::array<Digest, 2>, kAlgorithms> digests_;
};

// Whether a stamp has the full form "####-##-##_##:##:##", so that comparing it means something.
bool IsStamp(const TimeStamp* stamp) {
  constexpr std::string_view kForm = "####-##-##_##:##:##";
  if (stamp->GetLength() != kForm.size()) return false;
  for (size_t i = 0; i < kForm.size(); ++i) {
    const unsigned char c = stamp->GetData()[i];
    if (kForm[i] == '#' ? c < '0' || c > '9' : c != kForm[i]) return false;
  }
  return true;
}

// One question, put to the sequences of a store one after the other.
class StatusCheck {
 public:
  StatusCheck(bool critical, SExpression* acls, SExpression* object, TimeStamp* notBefore)
      : critical_(critical), acls_(acls), digests_(object), notBefore_(notBefore) {}

  // Ask puts the question to one sequence: the revocation code when it revokes the object, 0 when
  // the next one is to be asked.
  int Ask(CrlSequence* sequence) {
    SExpression* const list =
        critical_ ? sequence->GetCrl()->GetList2() : sequence->GetCrl()->GetList1();
    // A list that names nothing counts as absent.
    if (list->Count() < 2) return 0;
    for (auto it = list->Begin(); it; it.Next()) {
      auto* const item = dynamic_cast<SExpression*>(it.Value());
      if (item == nullptr) continue;
      bool matches = false;
      VESK2_TRY(MatchItem(matches, item));
      if (!matches) continue;
      // Asked once: a sequence that does not verify is done with.
      bool verified = false;
      VESK2_TRY(Verify(verified, sequence));
      if (!verified) return 0;
      if (Counts(item)) return critical_ ? VESK2_ERR_KEY_REVOKED : VESK2_ERR_CERT_REVOKED;
    }
    return critical_ ? 0 : NoteEnd(sequence);
  }

  // Result is the answer when no sequence revoked the object.
  int Result() const {
    if (critical_) return 0;
    VESK2_REQUIRE(latest_ != nullptr, VESK2_ERR_CRL_NOT_FOUND);
    return notBefore_ != nullptr && latest_->IsBefore(notBefore_) ? VESK2_ERR_NOT_AFTER : 0;
  }

 private:
  // An item is (item HASH DATE).
  int MatchItem(bool& matches, SExpression* item) {
    matches = false;
    auto it = item->Begin();
    if (it) it.Next();
    auto* const named = it ? dynamic_cast<Hash*>(it.Value()) : nullptr;
    return named != nullptr ? digests_.Match(matches, named) : 0;
  }

  int Verify(bool& verified, CrlSequence* sequence) const {
    verified = sequence->GetCrl()->GetIssuerTag() != nullptr;
    if (verified) return 0;
    const int code = sequence->VerifySelf(acls_);
    verified = code == 0;
    return LacksMemory(code) ? VESK2_ERR_MEM_ALLOC : 0;
  }

  // Whether a matching item revokes: always when critical or when no period is asked about, else
  // from its date on. A date that cannot be compared counts.
  bool Counts(SExpression* item) const {
    if (critical_ || notBefore_ == nullptr) return true;
    auto* const date = dynamic_cast<TimeStamp*>(item->Last());
    if (date == nullptr || !IsStamp(date) || !IsStamp(notBefore_)) return true;
    return date->IsBeforeOrEqual(notBefore_);
  }

  // Remembers the latest end of a period. Where some list covers the period that is asked about,
  // its end lies after the start, so nothing else need be kept. Only a verified one counts: a
  // forged sequence must not stand in for one that has run out.
  int NoteEnd(CrlSequence* sequence) {
    const TimeStamp* const end = sequence->GetCert()->GetNotAfter();
    if (end == nullptr) return 0;
    bool verified = false;
    VESK2_TRY(Verify(verified, sequence));
    if (verified && (latest_ == nullptr || end->IsAfter(latest_))) latest_ = end;
    return 0;
  }

  bool critical_;
  SExpression* acls_;
  Digests digests_;
  const TimeStamp* notBefore_;
  const TimeStamp* latest_ = nullptr;
};

int CheckStatus(StatusCheck& check, SExpression* store, SExpression* tag) {
  if (store == nullptr) return check.Result();
  for (auto it = store->Begin(); it; it.Next()) {
    auto* const sequence = dynamic_cast<CrlSequence*>(it.Value());
    // A sequence whose import failed has no list.
    if (sequence == nullptr || sequence->First() == nullptr) continue;
    bool asked = tag == nullptr;
    if (!asked) VESK2_TRY(CompareValues(asked, tag, sequence->GetCert()->GetTag()));
    if (asked) VESK2_TRY(check.Ask(sequence));
  }
  return check.Result();
}

}  // namespace

int CrlSequence::CheckStatusCritical(SExpression* aclEntries, SExpression* store, SExpression* tag,
                                     SExpression* object) {
  VESK2_REQUIRE(object != nullptr, VESK2_ERR_PARAM_NULL);
  StatusCheck check(true, aclEntries, object, nullptr);
  return CheckStatus(check, store, tag);
}

int CrlSequence::CheckStatusNonCritical(SExpression* aclEntries, SExpression* store,
                                        SExpression* tag, SExpression* object, TimeStamp* notBefore,
                                        TimeStamp*) {
  VESK2_REQUIRE(object != nullptr, VESK2_ERR_PARAM_NULL);
  StatusCheck check(false, aclEntries, object, notBefore);
  return CheckStatus(check, store, tag);
}

}  // namespace ZvVesk2
