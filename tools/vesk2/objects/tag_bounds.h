// SPDX-License-Identifier: Apache-2.0
// tag_bounds.h: tags that are compared as they are, and not issued.
#ifndef VESK2_TOOLS_TAG_BOUNDS_H
#define VESK2_TOOLS_TAG_BOUNDS_H

#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {

// RequirePlainBounds is Trouble for a tag, null for everything, in which a bound of a range is not
// one operator and one value. The comparison of tags reads more items, or fewer, as something else
// than their writer meant, and may then grant what he ruled out: such a tag is not issued.
void RequirePlainBounds(SExpression* tag);

// ParseIssuedTag is ParseTypedTag of a tag that is to be issued or trusted. Trouble also for what
// RequirePlainBounds refuses, and for one that is not one list: "install" without its parentheses
// has nothing in common with "(install)", and would be granted to nobody's use. Only the tags of
// revocation lists are made of words and a list.
Ref<SExpression> ParseIssuedTag(const std::string& text);
// The words of that, with what was probably meant; empty for a tag that is one list. A question
// about any other is answered, and a no is where they help.
std::string WhyNotOneList(SExpression& tag, const std::string& text);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TAG_BOUNDS_H
