// SPDX-License-Identifier: Apache-2.0
// line.h: the one line on standard error that is drawn over again and again, and is gone before
// anything else is written.
#ifndef VESK2_TOOLS_LINE_H
#define VESK2_TOOLS_LINE_H

#include <string>

namespace vesk2_command {

// DrawLine puts `text`, cut to the terminal's width, in place of the line.
void DrawLine(const std::string& text);
// EraseLine erases the line if one is drawn. It may be called by a signal handler.
void EraseLine();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_LINE_H
