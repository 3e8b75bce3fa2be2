// SPDX-License-Identifier: Apache-2.0
// ThresholdSubject: any k of n keys. It is only held here. Counting k distinct keys is the
// reduction's work, which also refuses counts that make no sense.
#include <vesk2/public_key.h>

#include "src/objects/build.h"

namespace ZvVesk2 {
namespace {

// The elements before the members: keyword, k and n.
constexpr int kHeadElements = 3;

// Fewer elements mean no members: a list that was never filled.
SExpression::Iterator Members(const SExpression& list) {
  SExpression::Iterator element = list.Begin();
  for (int i = 0; i < kHeadElements && element; ++i) element.Next();
  return element;
}

// One count: a raw byte, the first of its text. A raw byte, and no digits: "2" is 50.
[[nodiscard]] int ReadCount(unsigned int& count, ZvBuffer* buffer, ByteString* text) {
  VESK2_TRY(text->Import(buffer));
  VESK2_REQUIRE(text->GetLength() > 0, VESK2_ERR_PARSE_FILE);
  count = text->GetData()[0];
  return 0;
}

}  // namespace

ThresholdSubject::ThresholdSubject(Vesk2ContextStruct* ctx) : Subject(ctx) {}

ThresholdSubject::~ThresholdSubject() = default;

bool ThresholdSubject::IsThresholdSubject() const { return true; }

// Counts over 255 have no form; the fields keep them for the caller's own use, and the list, which
// is what counts, has their low bytes.
int ThresholdSubject::Set(unsigned int newK, unsigned int newN) {
  VESK2_REQUIRE(First() == nullptr, VESK2_ERR_INVALID_PARAM);
  const auto byteK = static_cast<unsigned char>(newK);
  const auto byteN = static_cast<unsigned char>(newN);
  Ref<ByteString> textK(TryNew<ByteString>(GetContext()));
  Ref<ByteString> textN(TryNew<ByteString>(GetContext()));
  VESK2_REQUIRE(textK && textN, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(textK->Set(&byteK, 1, ByteString::BsNum));
  VESK2_TRY(textN->Set(&byteN, 1, ByteString::BsNum));
  VESK2_TRY(Insert("k-of-n"));
  VESK2_TRY(Append(this, std::move(textK)));
  VESK2_TRY(Append(this, std::move(textN)));
  k = newK;
  n = newN;
  return 0;
}

// (k-of-n <k> <n> <key>...): "(6:k-of-n" <k> <n> n public keys ")". Only the first byte of each
// count is read, and the list is the one that Set writes: a certificate verifies when its signer
// hashed the counts in that form. Members are keys, not hashes: HasMember compares them as they
// stand, and a key named in two ways would be two members.
int ThresholdSubject::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect("(6:k-of-n"));
  Ref<ByteString> text(TryNew<ByteString>(GetContext()));
  VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
  unsigned int newK = 0;
  unsigned int newN = 0;
  VESK2_TRY(ReadCount(newK, buffer, text.get()));
  VESK2_TRY(ReadCount(newN, buffer, text.get()));
  VESK2_TRY(Set(newK, newN));
  for (unsigned int i = 0; i < n; ++i) {
    Ref<PublicKey> member;
    VESK2_TRY(ImportNew(member, buffer, GetContext()));
    VESK2_TRY(Append(this, std::move(member)));
  }
  return buffer->Expect(")");
}

// Linear, over at most 255 keys of a text that was read.
bool ThresholdSubject::HasMember(Principal* principal) {
  for (Iterator element = Members(*this); element; element.Next()) {
    if (element.Value()->IsEqual(principal)) return true;
  }
  return false;
}

// Shared: the members stay in the group as well.
int ThresholdSubject::GetSubjects(SExpression*& members) {
  VESK2_REQUIRE(members == nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> list(TryNew<SExpression>(GetContext()));
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  for (Iterator element = Members(*this); element; element.Next()) {
    VESK2_TRY(Append(list.get(), Ref<DExpression>::Share(element.Value())));
  }
  members = list.Release();
  return 0;
}

unsigned int ThresholdSubject::GetK() const { return k; }
unsigned int ThresholdSubject::GetN() const { return n; }

}  // namespace ZvVesk2
