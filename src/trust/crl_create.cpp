// SPDX-License-Identifier: Apache-2.0
// Making revocation lists: the unsigned list, and the sequence once somebody has signed for it.
// Signing them is the caller's work: the library holds no private key. What is made here is what
// the readers of crl.cpp and crl_sequence.cpp take.
#include <vesk2/crl.h>

#include <vesk2/hash.h>

#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

// A digest that is not complete would be written as a shorter list, which no reader takes.
[[nodiscard]] int AppendItem(SExpression* list, Hash* digest, TimeStamp* from) {
  VESK2_REQUIRE(list != nullptr && digest != nullptr && from != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(digest->GetDigest() != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> item;
  VESK2_TRY(SExpression::Create(item.Out(), "item", list->GetContext()));
  VESK2_TRY(AppendShared(item.get(), digest));
  VESK2_TRY(AppendShared(item.get(), from));
  return Append(list, std::move(item));
}

// The keyword of the other list is its first element, and no list: it is left out.
[[nodiscard]] int AppendItems(SExpression* list, const SExpression* others) {
  for (auto it = others->Begin(); it; it.Next()) {
    if (it.Value()->IsSExpression()) VESK2_TRY(AppendShared(list, it.Value()));
  }
  return 0;
}

}  // namespace

int Crl::Create(Crl*& out, Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<Crl> crl(TryNew<Crl>(ctx));
  VESK2_REQUIRE(crl, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(SExpression::Create(crl->list1, "list1", ctx));
  VESK2_TRY(SExpression::Create(crl->list2, "list2", ctx));
  // The expression shares the two lists: items that are added to them later are in it at once.
  VESK2_TRY(crl->BuildSExpression());
  out = crl.Release();
  return 0;
}

// Nobody has vouched for a list that was changed.
void Crl::ForgetVoucher() {
  if (issuerTag != nullptr) issuerTag->Free();
  issuerTag = nullptr;
}

// The proof goes first: whatever becomes of the item, what was vouched for is no longer what this
// holds.
int Crl::RevokeCertificate(Hash* digest, TimeStamp* from) {
  ForgetVoucher();
  return AppendItem(list1, digest, from);
}

int Crl::RevokeKey(Hash* digest, TimeStamp* from) {
  ForgetVoucher();
  return AppendItem(list2, digest, from);
}

// A new list must revoke what the old one did, or the replacement lets go: whoever issues lists
// begins with this.
int Crl::RevokeAllOf(const Crl* other) {
  VESK2_REQUIRE(other != nullptr && other != this && other->list2 != nullptr,
                VESK2_ERR_INVALID_PARAM);
  // Made or read, and not merely constructed.
  VESK2_REQUIRE(list2 != nullptr, VESK2_ERR_INVALID_PARAM);
  ForgetVoucher();
  VESK2_TRY(AppendItems(list1, other->list1));
  return AppendItems(list2, other->list2);
}

// Nothing is checked, so that tests and tools can make what verifiers must refuse.
int CrlSequence::Create(CrlSequence*& out, Crl* list, Cert* certificate, Signature* signedBy,
                        Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(list != nullptr && certificate != nullptr && signedBy != nullptr,
                VESK2_ERR_INVALID_PARAM);
  Ref<CrlSequence> sequence(TryNew<CrlSequence>(ctx));
  VESK2_REQUIRE(sequence, VESK2_ERR_MEM_ALLOC);
  sequence->crl = Ref<Crl>::Share(list).Release();
  sequence->cert = Ref<Cert>::Share(certificate).Release();
  sequence->signature = Ref<Signature>::Share(signedBy).Release();
  VESK2_TRY(sequence->BuildSExpression());
  out = sequence.Release();
  return 0;
}

}  // namespace ZvVesk2
