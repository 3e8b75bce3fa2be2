// SPDX-License-Identifier: Apache-2.0
// Recording findings, and handing them to the manifest's four lists. A finding costs one record,
// which holds its name. Reasons are few and are kept apart, sorted by record, so that a million
// records need no member for them.
#include "src/manifest/findings.h"

#include <algorithm>
#include <utility>

#include <vesk2/manifest.h>

#include "src/frame/check.h"
#include "src/frame/file_item.h"
#include "src/platform/text.h"

namespace ZvVesk2 {

// What is wrong comes before what is missing, and that before what is too much: a caller who looks
// at the code alone sees the worst.
int StatusSet::Code() const {
  if (statuses_ & BodyObject::Invalid) return VESK2_ERR_HASH_MISMATCH;
  if (statuses_ & BodyObject::Missing) return VESK2_ERR_FILE_NOT_FOUND;
  if (statuses_ & BodyObject::Extra) return VESK2_ERR_EXTRA_FILES;
  return 0;
}

int Findings::AddFile(const BodyDirectory& directory, const char* name, uint32_t status,
                      StatusSet& statuses, int reason) {
  return Add(FileItemOfPath(directory.GetName(), name), false, status, statuses, reason);
}

int Findings::AddDirectory(const char* path, uint32_t status, StatusSet& statuses, int reason) {
  return Add(FileItemOfPath(nullptr, path), true, status, statuses, reason);
}

// The fourth is for what is too much, and there is no fifth.
Findings::List& Findings::ListOf(uint32_t status) {
  if (status == BodyObject::Valid) return valid_;
  if (status == BodyObject::Invalid) return invalid_;
  return status == BodyObject::Missing ? missing_ : extra_;
}

// The record goes to the front, which costs nothing however long the list is.
int Findings::Add(FileItem* record, bool isDirectory, uint32_t status, StatusSet& statuses,
                  int reason) {
  FileItemList made(record);
  VESK2_REQUIRE(made, VESK2_ERR_MEM_ALLOC);
  made->isDirectory = isDirectory ? 1 : 0;
  if (reason != 0) VESK2_TRY(AddReason(made.get(), reason));
  List& list = ListOf(status);
  // The first finding stays the last of the list.
  if (list.last == nullptr) list.last = made.get();
  made->next = list.items.release();
  list.items = std::move(made);
  statuses.Add(status);
  return 0;
}

// Grows by doubling: in a tree that cannot be read every file has one.
int Findings::AddReason(const FileItem* item, int reason) {
  if (reasonCount_ == reasonRoom_) {
    const uint32_t room = reasonRoom_ > 0 ? 2 * reasonRoom_ : 16;
    std::unique_ptr<Manifest::Reason[]> grown(TryNewArray<Manifest::Reason>(room));
    VESK2_REQUIRE(grown, VESK2_ERR_MEM_ALLOC);
    std::copy_n(reasons_.get(), reasonCount_, grown.get());
    reasons_ = std::move(grown);
    reasonRoom_ = room;
  }
  reasons_[reasonCount_++] = {item, reason};
  return 0;
}

namespace {

// By address: it is only looked for, never told in order.
[[nodiscard]] int CompareEntries(const void* a, const void* b) {
  const FileItem* const left = static_cast<const Manifest::Reason*>(a)->entry;
  const FileItem* const right = static_cast<const Manifest::Reason*>(b)->entry;
  if (left == right) return 0;
  return left < right ? -1 : 1;
}

}  // namespace

// Earlier records stay, behind the new ones: Verify and Compare add to what is there.
int Manifest::Publish(Findings& findings) {
  // All is made before anything is handed over: the lists change whole or not at all. Both sets
  // together, sorted anew: records of earlier calls are still asked about.
  const uint32_t size = reasonCount + findings.reasonCount_;
  std::unique_ptr<Reason[]> merged(TryNewArray<Reason>(size));
  VESK2_REQUIRE(merged, VESK2_ERR_MEM_ALLOC);
  Reason* const end = std::copy_n(reasons.get(), reasonCount, merged.get());
  std::copy_n(findings.reasons_.get(), findings.reasonCount_, end);
  ZVsysutil::zv_sort(merged.get(), size, sizeof(Reason), CompareEntries);
  reasons = std::move(merged);
  reasonCount = size;
  const auto publish = [](FileItemList& list, Findings::List& found) {
    if (found.last == nullptr) return;
    found.last->next = list.release();
    list = std::move(found.items);
  };
  publish(valid, findings.valid_);
  publish(invalid, findings.invalid_);
  publish(missing, findings.missing_);
  publish(extra, findings.extra_);
  return 0;
}

// Searched by halves, for who asks about each record of a long list.
int Manifest::GetReason(const FileItem* entry) const {
  const Reason* const end = reasons.get() + reasonCount;
  const Reason* const found = std::lower_bound(
      static_cast<const Reason*>(reasons.get()), end, entry,
      [](const Reason& reason, const FileItem* sought) { return reason.entry < sought; });
  return found != end && found->entry == entry ? found->code : 0;
}

}  // namespace ZvVesk2
