// SPDX-License-Identifier: Apache-2.0
// Where objects are stored, for the library's own use: unlike SExpression::CalcDir and CalcPath,
// these tell why there is no such place, and make no directory. A look at a store leaves it as it
// is.
#ifndef VESK2_SRC_SEXPR_STORAGE_H
#define VESK2_SRC_SEXPR_STORAGE_H

#include <memory>

#include <vesk2/expression.h>

namespace ZvVesk2 {

// Why there is none matters: a store that is not configured has nothing in it, but one whose path
// could not be allocated may hold the revocation that decides.

// StoreDirectory is CalcDir. VESK2_ERR_FIND_DIR when the root is not set or the path is too long,
// VESK2_ERR_MEM_ALLOC.
[[nodiscard]] int StoreDirectory(std::unique_ptr<char[]>& out, const char* dirName,
                                 StorageType type);
// FilePath is CalcPath. VESK2_ERR_FILE_OPEN where CalcPath gives no path for another reason than a
// lack of memory, which is VESK2_ERR_MEM_ALLOC.
[[nodiscard]] int FilePath(std::unique_ptr<char[]>& out, const char* dirName, const char* extension,
                           const char* name, StorageType type);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_SEXPR_STORAGE_H
