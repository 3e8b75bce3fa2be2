// SPDX-License-Identifier: Apache-2.0
// What a comparison found, and the code that a set of findings amounts to. Nothing is seen of a
// comparison that did not come to its end: Publish moves all of it at once.
#ifndef VESK2_SRC_MANIFEST_FINDINGS_H
#define VESK2_SRC_MANIFEST_FINDINGS_H

#include <memory>

#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>

namespace ZvVesk2 {

// The statuses found in one directory, or in all; and why that directory was not searched, or 0.
class StatusSet {
 public:
  int reason = 0;

  void Add(uint32_t status) { statuses_ |= status; }
  // The worst finding decides: VESK2_ERR_HASH_MISMATCH over VESK2_ERR_FILE_NOT_FOUND over
  // VESK2_ERR_EXTRA_FILES over 0.
  [[nodiscard]] int Code() const;

 private:
  uint32_t statuses_ = 0;
};

// Findings are made as the records that callers get: each list in the reverse order of its
// findings, which callers walk as it is.
class Findings {
 public:
  Findings() = default;

  // Each records an entry and adds its status to `statuses`, the directory's. `reason`: see
  // Manifest::GetReason. 0 or VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int AddFile(const BodyDirectory& directory, const char* name, uint32_t status,
                            StatusSet& statuses, int reason = 0);
  [[nodiscard]] int AddDirectory(const char* path, uint32_t status, StatusSet& statuses,
                                 int reason = 0);

 private:
  friend class Manifest;
  // The last of a list is known, so that an older list can be hung behind it.
  struct List {
    FileItemList items;
    FileItem* last = nullptr;
  };
  // Takes over the record; null stands for no memory.
  [[nodiscard]] int Add(FileItem* record, bool isDirectory, uint32_t status, StatusSet& statuses,
                        int reason);
  [[nodiscard]] int AddReason(const FileItem* item, int reason);
  List& ListOf(uint32_t status);

  List valid_, invalid_, missing_, extra_;
  std::unique_ptr<Manifest::Reason[]> reasons_;
  uint32_t reasonCount_ = 0;
  uint32_t reasonRoom_ = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_FINDINGS_H
