// SPDX-License-Identifier: Apache-2.0
// Records of file names as the library makes them by the million (see <vesk2/file_item.h>).
#ifndef VESK2_SRC_FRAME_FILE_ITEM_H
#define VESK2_SRC_FRAME_FILE_ITEM_H

#include <vesk2/file_item.h>

namespace ZvVesk2 {

// Makes a record whose name is `directory` (may be null) joined with `name`. Record and name are
// one piece of memory, which FileItemDelete knows. Null without memory.
FileItem* FileItemOfPath(const char* directory, const char* name);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_FILE_ITEM_H
