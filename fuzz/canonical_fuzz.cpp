// SPDX-License-Identifier: Apache-2.0
// The buffer reader: what it accepts is written as it was read, and reads back. Without its hints
// it is what the engine and the reader of memory see.
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(canonical) {
  const Buffer buffer = Wrap(input);
  Ref<SExpression> read;
  if (SExpression::Import(read.Out(), buffer.get(), nullptr) != 0) {
    FUZZ_CHECK(!read);
    return;
  }
  const std::string printed = Print(read.get());
  FUZZ_CHECK(printed == WithoutZeros(input.substr(0, buffer->Position())));
  const std::string plain = ExportOf(read.get());
  for (const std::string& text : {printed, plain}) {
    Ref<SExpression> again;
    FUZZ_CHECK(SExpression::Import(again.Out(), Wrap(text).get(), nullptr) == 0);
    FUZZ_CHECK(Print(again.get()) == text);
    FUZZ_CHECK(again->IsEqual(read.get()) && read->IsEqual(again.get()));
  }
}
