// SPDX-License-Identifier: Apache-2.0
// threads.h: threads that the command lends to the library, which starts none itself.
#ifndef VESK2_TOOLS_THREADS_H
#define VESK2_TOOLS_THREADS_H

#include <string>

#include "tools/vesk2/options/options.h"

#include <vesk2/manifest.h>

namespace vesk2_command {

class LentThreads {
 public:
  // --jobs; 0 until it is given.
  static void AddOption(OptionList& list, unsigned& jobs);

  // Lends `jobs` threads; if that is 0, as many as there are cores, up to 8, to a verification of
  // the manifest file `path` if it is long enough for them to pay, else none.
  LentThreads(unsigned jobs, const std::string& path);
  LentThreads(const LentThreads&) = delete;
  LentThreads& operator=(const LentThreads&) = delete;

  // For Manifest::SetTaskRunner; null where one thread does all.
  const ZvVesk2::Vesk2TaskRunner* Runner() const { return jobs_ > 1 ? &runner_ : nullptr; }

 private:
  static void Run(void* self, void (*task)(void* work), void* work);

  unsigned jobs_;
  ZvVesk2::Vesk2TaskRunner runner_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_THREADS_H
