// SPDX-License-Identifier: Apache-2.0
// tag_bounds.h: the bounds of ranges in a tag that is about to be issued.
#ifndef VESK2_TOOLS_TAG_BOUNDS_H
#define VESK2_TOOLS_TAG_BOUNDS_H

#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {

// RequirePlainBounds is Trouble for a tag, null for everything, in which a bound of a range is not
// one operator and one value. The comparison of tags reads more items, or fewer, as something else
// than their writer meant, and may then grant what he ruled out: such a tag is not issued.
void RequirePlainBounds(SExpression* tag);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TAG_BOUNDS_H
