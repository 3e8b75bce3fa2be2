// SPDX-License-Identifier: Apache-2.0
// Writing files of the global store: whole or not at all, and readable by all. A list that is lost
// half-way through its replacement, or that only its writer can read, would bring every key back
// that it revoked.
#ifndef VESK2_SRC_TRUST_STORE_WRITE_H
#define VESK2_SRC_TRUST_STORE_WRITE_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

// Writes the object, with hints, to a new file beside `path`, flushes it to the disk and moves it
// into the place of `path` (of the link, if that is one), or with `replace` unset only where there
// is nothing. After a failure `path` is as it was. VESK2_ERR_MEM_ALLOC, VESK2_ERR_FILE_OPEN,
// VESK2_ERR_WRITE_FILE.
[[nodiscard]] int WriteStored(SExpression* object, const char* path, bool replace);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_STORE_WRITE_H
