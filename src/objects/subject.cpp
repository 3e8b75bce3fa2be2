// SPDX-License-Identifier: Apache-2.0
// Subject and Principal: the choice of a class by the first two characters of the text. The choice
// is by as little of the text as ever decided it; what was chosen then reads all of it, so that a
// wrong beginning fails there.
#include <vesk2/subject.h>

#include <vesk2/hash.h>
#include <vesk2/public_key.h>

#include "src/objects/build.h"

namespace ZvVesk2 {
namespace {

// `out` is set when the object is whole: no caller sees a subject that is half read.
template <typename T, typename Base>
[[nodiscard]] int ImportAs(Base*& out, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  Ref<T> made;
  VESK2_TRY(ImportNew(made, buffer, context));
  out = made.Release();
  return 0;
}

// "(1" begins "(10:public-key", "(4" begins "(4:hash".
// "(4:name" begins like a hash, and fails as one: names are not read.
template <typename Base>
[[nodiscard]] int ImportPrincipal(Base*& out, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  if (buffer->LooksAt("(1")) return ImportAs<PublicKey>(out, buffer, context);
  if (buffer->LooksAt("(4")) return ImportAs<Hash>(out, buffer, context);
  return VESK2_ERR_PRINCIPAL;
}

}  // namespace

// A key's file is a path; no subject has a store.
Subject::Subject(Vesk2ContextStruct* ctx) : SExpression(ctx) { SetStorageType(StoragePath); }

Subject::~Subject() = default;

bool Subject::IsThresholdSubject() const { return false; }

// "(6" begins "(6:k-of-n".
int Subject::Import(Subject*& subject, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(subject == nullptr && buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  if (buffer->LooksAt("(6")) return ImportAs<ThresholdSubject>(subject, buffer, context);
  return ImportPrincipal(subject, buffer, context);
}

Principal::Principal(Vesk2ContextStruct* ctx) : Subject(ctx) {}

Principal::~Principal() = default;

int Principal::Import(Principal*& principal, ZvBuffer* buffer, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(principal == nullptr && buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  return ImportPrincipal(principal, buffer, context);
}

}  // namespace ZvVesk2
