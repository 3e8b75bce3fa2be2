// SPDX-License-Identifier: Apache-2.0
// file_lock.h: one at a time changes a file that is read, changed and replaced whole.
#ifndef VESK2_TOOLS_FILE_LOCK_H
#define VESK2_TOOLS_FILE_LOCK_H

#include <string>

#include "tools/vesk2/files/descriptor.h"

namespace vesk2_command {

// While it lives, nobody else has the lock PATH.lock, a file that stays. Trouble when somebody else
// keeps it for longer than kLockWait seconds.
class FileLock {
 public:
  static constexpr unsigned kLockWait = 60;
  explicit FileLock(const std::string& path);

 private:
  Descriptor file_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FILE_LOCK_H
