// SPDX-License-Identifier: Apache-2.0
// The four readers of expressions. What the buffer reader accepts must print to a text that reads
// back to itself; what the others accept must be writable.
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

static void ReadBuffer(const std::string& text) {
  Ref<SExpression> read;
  if (SExpression::Import(read.Out(), Wrap(text).get(), nullptr) != 0) {
    FUZZ_CHECK(!read);
    return;
  }
  const std::string printed = Print(read.get());
  Ref<SExpression> again;
  FUZZ_CHECK(SExpression::Import(again.Out(), Wrap(printed).get(), nullptr) == 0);
  FUZZ_CHECK(Print(again.get()) == printed);
  FUZZ_CHECK(again->IsEqual(read.get()));
}

static void ReadMemory(std::string text) {
  auto* bytes = reinterpret_cast<unsigned char*>(text.data());
  const auto size = static_cast<unsigned int>(text.size());
  unsigned int pos = 0;
  Ref<DExpression> read;
  if (SExpression::ParseCanonical(read.Out(), bytes, size, pos, nullptr) == 0) {
    FUZZ_CHECK(pos <= size);
    unsigned char* out = nullptr;
    unsigned int length = 0;
    FUZZ_CHECK(static_cast<SExpression*>(read.get())->Export(out, length) == 0);
    FUZZ_CHECK(length == read->CanonicalLength());
    Vesk2Free(out);
  }
  Ref<SExpression> found;
  if (SExpression::FindSubExpression(found.Out(), bytes, size, "tag", nullptr) != 0)
    FUZZ_CHECK(!found);
}

static void ReadAdvanced(const std::string& text) {
  Ref<SExpression> read;
  if (SExpression::ParseTagAdvanced(read.Out(), text.c_str(), "tag", nullptr) != 0) return;
  Vesk2Free(read->ExportTag("tag"));
  Ref<SExpression> whole;
  if (SExpression::ParseAdvanced(whole.Out(), text.c_str(), nullptr) == 0)
    Vesk2Free(whole->ExportTag(nullptr));
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  ReadBuffer(text);
  ReadMemory(text);
  ReadAdvanced(text);
  return 0;
}
