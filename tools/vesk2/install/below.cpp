// SPDX-License-Identifier: Apache-2.0
// below.cpp: paths that cannot leave a directory.
#include "tools/vesk2/install/below.h"

#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>

namespace vesk2_command {

int OpenBelow(int directory, const std::string& path, int flags, mode_t mode) {
  constexpr int kAttempts = 100;  // somebody renames directories while they are walked
  open_how how = {};
  how.flags = static_cast<unsigned>(flags | O_CLOEXEC);
  how.mode = mode;
  how.resolve = RESOLVE_BENEATH | RESOLVE_NO_MAGICLINKS |
                ((flags & O_NOFOLLOW) != 0 ? RESOLVE_NO_SYMLINKS : 0U);
  long file = -1;
  for (int i = 0; i < kAttempts; ++i) {
    file = syscall(SYS_openat2, directory, path.c_str(), &how, sizeof how);
    if (file >= 0 || (errno != EAGAIN && errno != EINTR)) break;
  }
  return static_cast<int>(file);
}

bool LeadsTo(int directory, const std::string& name, int file) {
  struct stat named = {};
  struct stat opened = {};
  return fstatat(directory, name.c_str(), &named, AT_SYMLINK_NOFOLLOW) == 0 &&
         fstat(file, &opened) == 0 && named.st_dev == opened.st_dev &&
         named.st_ino == opened.st_ino;
}

}  // namespace vesk2_command
