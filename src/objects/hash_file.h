// The digest of a file as the comparison of a tree asks for it.
#ifndef VESK2_SRC_OBJECTS_HASH_FILE_H
#define VESK2_SRC_OBJECTS_HASH_FILE_H

#include <vesk2/hash.h>

namespace ZvVesk2 {

constexpr unsigned kFileDigestSize = 32;

// DigestFile is Hash::HashFile, with the same codes; `held` tells whether VESK2_ERR_READ_FILE means
// that another process held the file until the wait was over.
[[nodiscard]] int DigestFile(const char* path, unsigned char (&digest)[kFileDigestSize], bool& held,
                             Vesk2ContextStruct* context, const Vesk2FileCallbacks* callbacks);

}  // namespace ZvVesk2

#endif  // VESK2_SRC_OBJECTS_HASH_FILE_H
