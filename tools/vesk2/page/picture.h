// SPDX-License-Identifier: Apache-2.0
// picture.h: a graph as SVG, from the store at the top down to the answer.
#ifndef VESK2_TOOLS_PICTURE_H
#define VESK2_TOOLS_PICTURE_H

#include "tools/vesk2/page/graph.h"
#include "tools/vesk2/page/markup.h"

namespace vesk2_command {

// The most edges that are drawn: nobody could look at more.
inline constexpr size_t kMostDrawn = 120;

// Draw adds the picture; the texts in it are cut to their boxes, and whole where a pointer rests on
// them.
void Draw(Markup& page, const Graph& graph);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_PICTURE_H
