// SPDX-License-Identifier: Apache-2.0
// Who owns what a call is given, by the three words of the headers: it shares, it takes over (after
// success only), or it adopts (whatever it answers). The sanitizers see what is freed twice or
// never.
#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>
#include <vesk2/public_key.h>

#include <functional>
#include <tuple>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

enum class Word { Shares, TakesOver };

Ref<Hash> NewHash() { return Read<Hash>(HashOf("x")); }

// Hands `value` to a call that succeeds, or fails as late as it can, and keeps what it made.
using Call = std::function<int(Ref<SExpression>& made, Hash* value, bool succeeds)>;

TEST(Ownership, OfReferences) {
  const Ref<Hash> other = NewHash();
  const Ref<SExpression> tag = Parse(Tag("ftp"));
  const Ref<TimeStamp> stamp = Stamp(kPast);
  const auto keep = [](Ref<SExpression>& made, SExpression* list) { made.Reset(list); };
  const std::tuple<const char*, Word, Call> cases[] = {
      {"SExpression::Insert", Word::TakesOver,
       [&](auto& made, Hash* value, bool succeeds) {
         keep(made, new SExpression(nullptr));
         return succeeds ? made->Insert(value) : made->Insert(static_cast<DExpression*>(nullptr));
       }},
      {"AclEntry::Create", Word::TakesOver,
       [&](auto& made, Hash* value, bool succeeds) {
         AclEntry* entry = nullptr;
         SExpression* const granted = Ref<SExpression>::Share(tag.get()).Release();
         const int code = AclEntry::Create(entry, value, true, succeeds ? granted : nullptr,
                                           nullptr, nullptr, 0, nullptr);
         if (code != 0) granted->Free();
         keep(made, entry);
         return code;
       }},
      {"Signature::Create", Word::TakesOver,
       [&](auto& made, Hash* value, bool succeeds) {
         unsigned char bytes[Limits::kMaxByteString + 1] = {};
         Signature* signature = nullptr;
         Hash* const signer = Ref<Hash>::Share(other.get()).Release();
         const int code = Signature::Create(signature, value, signer, "a", bytes,
                                            succeeds ? 1 : sizeof bytes, nullptr);
         if (code != 0) signer->Free();
         keep(made, signature);
         return code;
       }},
      {"Cert::Set", Word::Shares,
       [&](auto& made, Hash* value, bool succeeds) {
         auto* const cert = new ZvVesk2::Cert(nullptr);
         keep(made, cert);
         return cert->Set(succeeds ? other.get() : nullptr, value, true, nullptr, nullptr, nullptr,
                          nullptr, nullptr);
       }},
      {"Crl::RevokeKey", Word::Shares,
       [&](auto& made, Hash* value, bool succeeds) {
         Crl* crl = nullptr;
         EXPECT_EQ(Crl::Create(crl, nullptr), 0);
         keep(made, crl);
         return crl->RevokeKey(value, succeeds ? stamp.get() : nullptr);
       }},
  };
  for (const auto& [name, word, call] : cases) {
    for (const bool succeeds : {true, false}) {
      const Ref<Hash> watched = NewHash();
      Ref<Hash> given = Ref<Hash>::Share(watched.get());
      Ref<SExpression> made;
      EXPECT_EQ(call(made, given.get(), succeeds) == 0, succeeds) << name;
      if (succeeds && word == Word::TakesOver) static_cast<void>(given.Release());
      made.Reset();
      EXPECT_EQ(watched->GetRefCount(), given ? 2 : 1) << name << succeeds;
    }
  }
}

ZVCLMPublicKeyData* NewKey() {
  ZVCLMRSAKeyData record;
  const unsigned char three[] = {3};
  ZVCLMPublicKeyData* key = nullptr;
  EXPECT_EQ(zvclm_RSAKeyStructInit(ZVCLM_DATA_RSA, &record), 0);
  for (ZVCLMBigInt** number : {&record.n, &record.e}) {
    EXPECT_EQ(zvclm_BigIntFromBuffer(number, three, sizeof three), 0);
  }
  EXPECT_EQ(zvclm_PublicKeyDefine(&key, ZVCLM_KEY_RSA, ZVCLM_DATA_RSA, &record, 0, 0), 0);
  EXPECT_EQ(zvclm_RSAKeyStructZeroize(ZVCLM_DATA_RSA, &record), 0);
  return key;
}

TEST(Ownership, OfArraysAndKeys) {
  const Ref<Hash> hash(new Hash(nullptr));
  EXPECT_EQ(hash->Set(ZVCLM_HASH_NONE, new unsigned char[20], 20), VESK2_ERR_HASH_ID);
  EXPECT_EQ(hash->Set(ZVCLM_HASH_SHA1, new unsigned char[20](), 20), 0);
  EXPECT_EQ(hash->Set(ZVCLM_HASH_SHA1, new unsigned char[20], 20), VESK2_ERR_INVALID_PARAM);

  const Ref<PublicKey> key(new PublicKey(nullptr));
  EXPECT_EQ(key->SetRSA(NewKey()), 0);
  EXPECT_NE(Ref<PublicKey>(new PublicKey(nullptr))->SetDSA(NewKey()), 0);
  ZVCLMPublicKeyData* const refused = NewKey();  // there is no place for it
  EXPECT_EQ(key->SetRSA(refused), VESK2_ERR_INVALID_PARAM);
  zvclm_PublicKeyFree(refused, 0);
}

}  // namespace
}  // namespace vesk2test
