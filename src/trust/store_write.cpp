// SPDX-License-Identifier: Apache-2.0
// See store_write.h. The temporary file, its lock and the renaming are the platform's (replace.h).
#include "src/trust/store_write.h"

#include "src/frame/check.h"
#include "src/platform/file.h"
#include "src/platform/replace.h"

namespace ZvVesk2 {

int WriteStored(SExpression* object, const char* path, bool replace) {
  ZVsysutil::ZvReplacement file;
  VESK2_TRY(file.Open(path, ZVsysutil::kZvSharedFile));
  VESK2_TRY(object->PrintCanonical(file.Stream()));
  return file.Keep(replace);
}

}  // namespace ZvVesk2
