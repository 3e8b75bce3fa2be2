// SPDX-License-Identifier: Apache-2.0
// terminal.h: a line that nobody is to see, typed on the terminal of this process.
#ifndef VESK2_TOOLS_TERMINAL_H
#define VESK2_TOOLS_TERMINAL_H

#include <string>

#include "tools/vesk2/files/descriptor.h"

namespace vesk2_command {

class Terminal {
 public:
  Terminal();
  // Without one nobody can be asked: standard input is somebody's data.
  bool IsThere() const { return file_.get() >= 0; }
  // Ask shows the prompt, and returns the length of the line that was typed, which ends with a 0 in
  // `out`; -1 for none, or one that has no room. What is typed is not shown. A signal that comes
  // meanwhile puts the terminal back as it was, and then ends the process as it would have.
  int Ask(const std::string& prompt, char* out, int size) const;

 private:
  Descriptor file_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TERMINAL_H
