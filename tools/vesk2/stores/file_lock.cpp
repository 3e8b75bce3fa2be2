// SPDX-License-Identifier: Apache-2.0
// file_lock.cpp: locks beside files.
#include "tools/vesk2/stores/file_lock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "tools/vesk2/files/files.h"

namespace vesk2_command {

FileLock::FileLock(const std::string& path) {
  const std::string name = path + ".lock";
  constexpr int kFlags = O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY;
  file_.Take(open(name.c_str(), kFlags, 0600));
  if (file_.get() < 0) throw FileTrouble(name, std::strerror(errno), "io");
  constexpr unsigned kTries = 10;  // a second
  for (unsigned tries = 0; flock(file_.get(), LOCK_EX | LOCK_NB) != 0; ++tries) {
    if (errno != EWOULDBLOCK && errno != EINTR) throw FileTrouble(name, std::strerror(errno), "io");
    if (tries == kLockWait * kTries) throw FileTrouble(name, "held by another process", "io");
    usleep(1'000'000 / kTries);
  }
}

}  // namespace vesk2_command
