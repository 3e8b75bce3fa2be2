// SPDX-License-Identifier: Apache-2.0
// The two store roots. They are process-wide because every object of a process lives in the same
// stores. Nothing guards them: they are set before the first thread starts, or a program races with
// itself. Both are empty at first, and an empty root means no store, never the current directory.
#include <vesk2/context.h>

#include "src/platform/text.h"

namespace ZvVesk2 {

char VeskConf::home_dir[Limits::kPathBuffer];
char VeskConf::global_dir[Limits::kPathBuffer];

// A root that is too long is kept cut, as callers read it back; no such path can be opened.
void VeskConf::SetHomeDirectory(const char* directory) {
  ZVsysutil::zv_fstrcpy(home_dir, sizeof home_dir, directory);
}

void VeskConf::SetGlobalDirectory(const char* directory) {
  ZVsysutil::zv_fstrcpy(global_dir, sizeof global_dir, directory);
}

// The array itself: what is handed out changes with the next setting.
const char* VeskConf::GetHomeDirectory() { return home_dir; }

const char* VeskConf::GetGlobalDirectory() { return global_dir; }

}  // namespace ZvVesk2
