// SPDX-License-Identifier: Apache-2.0
// file_item.h: making and deleting FileItem records (vesk2.h), for programs that hand names to
// Manifest::SetIgnoredEntries and free what CertFind gave.
#ifndef VESK2_FILE_ITEM_H
#define VESK2_FILE_ITEM_H

#include <vesk2.h>

namespace ZvVesk2 {

using ::FileItem;

// FileItemCreate makes a record, which takes over `name` and `nameA`, arrays from new[]; whichever
// is missing is derived from the other, and may then be the same array. Null without memory, with
// both still the caller's.
VESK2_API FileItem* FileItemCreate(char* name, char* nameA);

// FileItemDelete frees a chain of such records, names included, and returns the number of records
// freed (0 for null). Not for the lists that a Manifest holds.
VESK2_API unsigned int FileItemDelete(FileItem* chain);

}  // namespace ZvVesk2

#endif  // VESK2_FILE_ITEM_H
