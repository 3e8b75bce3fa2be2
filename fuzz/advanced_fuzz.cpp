// SPDX-License-Identifier: Apache-2.0
// The readers of text that people type. What a tag is told as reads back to the same tag, unless a
// word of it is empty, or holds what ends a word.
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

static bool HasPlainWords(DExpression* value) {
  if (!value->IsSExpression()) {
    auto* const word = static_cast<ByteString*>(value);
    return word->GetLength() > 0;
  }
  for (auto item = static_cast<SExpression*>(value)->Begin(); item; item.Next()) {
    if (!HasPlainWords(item.Value())) return false;
  }
  return true;
}

FUZZ_TARGET(advanced) {
  const std::string text(input.substr(0, input.find('\0')));
  Ref<SExpression> tag;
  if (SExpression::ParseTagAdvanced(tag.Out(), text.c_str(), "tag", nullptr) == 0) {
    const Text told(tag->ExportTag("tag"));
    if (told != nullptr && HasPlainWords(tag.get())) {
      Ref<SExpression> again;
      FUZZ_CHECK(SExpression::ParseTagAdvanced(again.Out(), told.get(), "tag", nullptr) == 0);
      FUZZ_CHECK(again->IsEqual(tag.get()));
    }
  } else {
    FUZZ_CHECK(!tag);
  }
  Ref<SExpression> whole;
  if (SExpression::ParseAdvanced(whole.Out(), text.c_str(), nullptr) == 0) {
    const Text told(whole->ExportTag(nullptr));
    const Text name(whole->ExportTagW("tag"));
    FUZZ_CHECK(!ExportOf(whole.get()).empty());
  } else {
    FUZZ_CHECK(!whole);
  }
  unsigned int pos = 0;
  Ref<DExpression> token;
  if (ByteString::ParseAdvanced(token.Out(), text.c_str(), pos, nullptr) == 0) {
    FUZZ_CHECK(pos <= text.size() && !token->IsSExpression());
  }
}
