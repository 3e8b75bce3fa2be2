// SPDX-License-Identifier: Apache-2.0
// tag_gap.h: where one tag reaches beyond another. The library says whether it does; this looks for
// the place, asking the library about ever smaller parts, and puts it into words.
#ifndef VESK2_TOOLS_TAG_GAP_H
#define VESK2_TOOLS_TAG_GAP_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {

// The two parts that do not meet. Positions count from 1, and for the outermost list from the
// element behind the tag's keyword; none is the whole.
struct TagGap {
  std::vector<size_t> path;
  std::string place;    // "(install (app ...))"; empty at the top
  std::string asked;    // escaped; empty where the asked list ends too early
  std::string granted;  // escaped
  std::string reason;   // a stable word
  std::string words;    // "calc is not mail"

  // "at PLACE: WORDS"
  std::string Text() const;
};

// FindGap explains why `asked` does not lie within `granted`, two tags with the same keyword: the
// caller knows that it does not (SExpression::IsSubset).
TagGap FindGap(SExpression& asked, SExpression& granted);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TAG_GAP_H
