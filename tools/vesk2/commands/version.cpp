// SPDX-License-Identifier: Apache-2.0
// version.cpp: vesk2 version.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/say/report.h"

#include <vesk2.h>

namespace vesk2_command {

Action DefineVersion(OptionList&) {
  return [] {
    const std::string build = Vesk2VersionExtra();
    Say("vesk2 " + LibraryVersion() + " (" + Escape(build) + ")");
    Result() = {{"version", LibraryVersion()}, {"build", Escape(build)}};
    return kYes;
  };
}

}  // namespace vesk2_command
