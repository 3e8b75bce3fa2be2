// SPDX-License-Identifier: Apache-2.0
// below.h: opening and comparing what is below a directory that is held open, whatever becomes of
// the names meanwhile.
#ifndef VESK2_TOOLS_BELOW_H
#define VESK2_TOOLS_BELOW_H

#include <sys/types.h>

#include <string>

namespace vesk2_command {

// OpenBelow opens a path with the flags of open. The kernel follows no link out of the directory,
// and with O_NOFOLLOW none at all. -1 with errno.
int OpenBelow(int directory, const std::string& path, int flags, mode_t mode = 0);

// Whether a name in a directory leads to the open file, and through no link: what is about to be
// removed or replaced is compared with what is held.
bool LeadsTo(int directory, const std::string& name, int file);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_BELOW_H
