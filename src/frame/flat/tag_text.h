// SPDX-License-Identifier: Apache-2.0
// What the records of certificates and of revocation lists share: the text of a tag.
#ifndef VESK2_SRC_FRAME_FLAT_TAG_TEXT_H
#define VESK2_SRC_FRAME_FLAT_TAG_TEXT_H

#include <vesk2/expression.h>

#include "src/frame/check.h"

namespace ZvVesk2 {

// TagText makes the text of the body of `list`, (keyword body...): success with null for null and
// for another list. ExportTag alone could not tell these from a lack of memory. A tag without a
// body has no text to show, and neither has a list of another keyword.
[[nodiscard]] inline int TagText(char*& text, SExpression* list, const char* keyword) {
  text = list != nullptr ? list->ExportTag(keyword) : nullptr;
  if (list == nullptr || text != nullptr) return 0;
  auto* const head = dynamic_cast<ByteString*>(list->First());
  const bool hasBody = head != nullptr && head->IsEqual(keyword) && list->Count() > 1;
  return hasBody ? VESK2_ERR_MEM_ALLOC : 0;
}

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_FLAT_TAG_TEXT_H
