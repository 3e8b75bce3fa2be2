// SPDX-License-Identifier: Apache-2.0
// Scan: the files of a directory whose names match a pattern, one at a time, in byte order of the
// names. Every search of a store goes by the same rule: a file that cannot be read is passed over,
// but not one that was not read for want of memory or because another process holds it. It may be
// the one that matters, so it ends the scan, and the search with it.
//
//   Scan scan;
//   VESK2_TRY(scan.OpenStore(AclEntry::DirectoryName(true), "*.acl", StorageGlobal));
//   while (scan.Next()) {
//     if (!scan.Took(scan.Read(<an empty object>, <the code of a file that cannot be read>)))
//     continue;
//     ...
//   }
//   return scan.Result(<what it means that there is no more>);
#ifndef VESK2_SRC_TRUST_SCAN_H
#define VESK2_SRC_TRUST_SCAN_H

#include "src/frame/check.h"
#include "src/frame/handles.h"
#include "src/platform/file.h"
#include "src/platform/wait.h"
#include "src/sexpr/storage.h"

namespace ZvVesk2 {

class Scan {
 public:
  // VESK2_ERR_FIND_DIR for a null, absent or unreadable directory, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Open(const char* directory, const char* pattern) {
    return files_.open(directory, pattern);
  }
  // The same of a store. VESK2_ERR_FIND_DIR also when its root is not set.
  [[nodiscard]] int OpenStore(const char* name, const char* pattern, StorageType type) {
    std::unique_ptr<char[]> directory;
    VESK2_TRY(StoreDirectory(directory, name, type));
    return Open(directory.get(), pattern);
  }

  // Next moves on to another file; false at the end, and when the scan was ended. A null path is
  // the end, or a lack of memory, which the listing tells apart.
  [[nodiscard]] bool Next() {
    path_ = IsNoAbsence(last_) ? nullptr : files_.read(true);
    if (files_.failed()) last_ = VESK2_ERR_MEM_ALLOC;
    return path_ != nullptr;
  }
  // Took hears how reading the file went, and tells whether there is something to look at.
  [[nodiscard]] bool Took(int code) {
    last_ = code;
    return code == 0;
  }

  // Read has an object imported from the file, which is opened from the directory: nobody can put
  // another directory in its place between two files. `failure` as in WrapFile.
  template <typename Object>
  [[nodiscard]] int Read(Object& object, int failure) const {
    BufferOwner buffer;
    VESK2_TRY(WrapFile(buffer, files_.place(), failure));
    return object.Import(buffer.get());
  }
  // The file's path, borrowed until the next call of Next.
  const char* Path() const { return path_; }
  // The code of the file read last.
  [[nodiscard]] int Last() const { return last_; }
  // What a scan that came to its end answers: `atEnd`, unless it was ended before.
  [[nodiscard]] int Result(int atEnd) const {
    return IsNoAbsence(last_) ? InOwnWords(last_) : atEnd;
  }

 private:
  ZVsysutil::ZvCall call_;  // one wait for all files
  ZVsysutil::ZvDir files_;
  const char* path_ = nullptr;
  int last_ = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_SCAN_H
