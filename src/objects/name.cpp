// SPDX-License-Identifier: Apache-2.0
// Name: a subject that programs build and that is never read from text. (Its canonical form begins
// like a hash, and the readers take it for one.) The reduction resolves names that it finds in
// canonical text; this class is how a program writes one there.
#include <vesk2/subject.h>

#include "src/objects/build.h"

namespace ZvVesk2 {

Name::Name(Vesk2ContextStruct* ctx) : Subject(ctx) {}

Name::~Name() {
  if (name != nullptr) name->Free();
}

int Name::Import(ZvBuffer*) { return VESK2_ERR_NOT_IMPLEMENTED; }

// The list gets a copy of the text and the field another, which GetName hands out.
int Name::Set(const char* text) {
  VESK2_REQUIRE(name == nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<ByteString> made(TryNew<ByteString>(GetContext()));
  VESK2_REQUIRE(made, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(made->Set(text, ByteString::BsNone));
  name = made.Release();
  VESK2_TRY(Insert("name"));
  return Insert(text);
}

const ByteString* Name::GetName() const { return name; }

}  // namespace ZvVesk2
