// SPDX-License-Identifier: Apache-2.0
// See granted_tag.h. The reduction wrote the text a moment before, in one form: this is no reader
// of what strangers wrote, though it reads it as carefully.
#include "src/objects/granted_tag.h"

#include <vesk2/ref.h>

#include "src/frame/check.h"

namespace ZvVesk2 {

int ReadGrantedTag(SExpression*& out, unsigned char* data, unsigned int length,
                   Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(out == nullptr && data != nullptr && length != 0, VESK2_ERR_INVALID_PARAM);
  unsigned int pos = 0;
  VESK2_TRY(DExpression::Expect("(3:acl(5:entry", data, length, pos));
  Ref<DExpression> subject;
  VESK2_TRY(SExpression::ParseCanonical(subject.Out(), data, length, pos, ctx));
  // One digit tells (9:propagate) from a tag.
  if (length - pos > 1 && data[pos + 1] == '9') {
    Ref<DExpression> flag;
    VESK2_TRY(SExpression::ParseCanonical(flag.Out(), data, length, pos, ctx));
  }
  Ref<DExpression> tag;
  VESK2_TRY(SExpression::ParseCanonical(tag.Out(), data, length, pos, ctx));
  out = static_cast<SExpression*>(tag.Release());  // only lists are read
  return 0;
}

}  // namespace ZvVesk2
