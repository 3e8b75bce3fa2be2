// SPDX-License-Identifier: Apache-2.0
// The digest of a file as the comparison of a tree asks for it.
#ifndef VESK2_SRC_OBJECTS_HASH_FILE_H
#define VESK2_SRC_OBJECTS_HASH_FILE_H

#include <memory>

#include <vesk2/hash.h>

#include "src/frame/handles.h"
#include "src/platform/file.h"

namespace ZvVesk2 {

constexpr unsigned kFileDigestSize = 32;

// A file to make the digest of.
struct FileToDigest {
  ZVsysutil::ZvPlace place;
  // What callbacks hear; may be null without them.
  const char* path;
};

// FileDigester makes the digests of one file after the other with the same memory. It belongs to
// one thread; each thread that takes part in a comparison has its own.
class FileDigester {
 public:
  // `callbacks` may be null.
  FileDigester(Vesk2ContextStruct* context, const Vesk2FileCallbacks* callbacks)
      : handle_(context != nullptr ? context->cryptoHandle : 0),
        callbacks_(callbacks),
        hash_(nullptr, HashFree{handle_}) {}

  // Digest is Hash::HashFile, with the same codes; `held` tells whether VESK2_ERR_READ_FILE means
  // that another process held the file until the wait was over.
  [[nodiscard]] int Digest(const FileToDigest& file, unsigned char (&digest)[kFileDigestSize],
                           bool& held);

 private:
  [[nodiscard]] int MakeReady();
  [[nodiscard]] int DigestOpened(unsigned char* digest, const Vesk2FileCallbacks* callbacks);
  template <typename Watch>
  [[nodiscard]] int Feed(Watch watch);

  uint32_t handle_;
  const Vesk2FileCallbacks* callbacks_;
  // Made for the first file, and open for one file at a time.
  ZVsysutil::ZvFileOwner file_;
  HashOwner hash_;
  std::unique_ptr<unsigned char[]> buffer_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_OBJECTS_HASH_FILE_H
