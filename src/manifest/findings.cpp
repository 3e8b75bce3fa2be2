// Recording findings, and handing them to the manifest's four lists.
#include "src/manifest/findings.h"

#include <algorithm>
#include <utility>

#include <vesk2/manifest.h>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {

Finding::~Finding() = default;

int StatusSet::Code() const {
  if (statuses_ & BodyObject::Invalid) return VESK2_ERR_HASH_MISMATCH;
  if (statuses_ & BodyObject::Missing) return VESK2_ERR_FILE_NOT_FOUND;
  if (statuses_ & BodyObject::Extra) return VESK2_ERR_EXTRA_FILES;
  return 0;
}

int Findings::AddFile(const BodyDirectory& directory, const char* name, uint32_t status,
                      StatusSet& statuses, int reason) {
  std::unique_ptr<char[]> path(ZVsysutil::zv_join_path(directory.GetName(), name));
  return Add(std::move(path), false, status, statuses, reason);
}

int Findings::AddDirectory(const char* path, uint32_t status, StatusSet& statuses, int reason) {
  std::unique_ptr<char[]> copy(ZVsysutil::zv_fstrdup(path));
  return Add(std::move(copy), true, status, statuses, reason);
}

int Findings::Add(std::unique_ptr<char[]> name, bool isDirectory, uint32_t status,
                  StatusSet& statuses, int reason) {
  VESK2_REQUIRE(name, VESK2_ERR_MEM_ALLOC);
  std::unique_ptr<Finding> record(TryNew<Finding>(context_));
  VESK2_REQUIRE(record, VESK2_ERR_MEM_ALLOC);
  record->SetName(name.release());
  record->SetIsDirectory(isDirectory);
  record->SetStatus(status);
  record->reason = reason;
  VESK2_REQUIRE(records_.push(record.get()), VESK2_ERR_MEM_ALLOC);
  static_cast<void>(record.release());
  statuses.Add(status);
  return 0;
}

FileItemList& Manifest::ListOf(uint32_t status) {
  if (status == BodyObject::Valid) return valid;
  if (status == BodyObject::Invalid) return invalid;
  return status == BodyObject::Missing ? missing : extra;
}

namespace {

// Makes a chain of items in the order of the findings.
[[nodiscard]] int MakeItems(Findings& findings, FileItemList& made) {
  FileItem** tail = nullptr;
  for (uint32_t i = 0; i < findings.Count(); ++i) {
    Finding& record = findings.At(i);
    std::unique_ptr<char[]> name(record.TakeName());
    FileItem* const item = FileItemCreate(name.get(), nullptr);
    VESK2_REQUIRE(item != nullptr, VESK2_ERR_MEM_ALLOC);
    static_cast<void>(name.release());
    item->isDirectory = record.GetIsDirectory() ? 1 : 0;
    if (tail == nullptr) {
      made.reset(item);
    } else {
      *tail = item;
    }
    tail = &item->next;
  }
  return 0;
}

[[nodiscard]] int CompareEntries(const void* a, const void* b) {
  const FileItem* const left = static_cast<const Manifest::Reason*>(a)->entry;
  const FileItem* const right = static_cast<const Manifest::Reason*>(b)->entry;
  if (left == right) return 0;
  return left < right ? -1 : 1;
}

// Adds the reasons of the findings to the `count` there are; `item` is the first of their chain.
[[nodiscard]] int AddReasons(std::unique_ptr<Manifest::Reason[]>& reasons, uint32_t& count,
                             Findings& findings, const FileItem* item) {
  uint32_t size = count;
  for (uint32_t i = 0; i < findings.Count(); ++i) size += findings.At(i).reason != 0 ? 1 : 0;
  std::unique_ptr<Manifest::Reason[]> made(TryNewArray<Manifest::Reason>(size));
  VESK2_REQUIRE(made, VESK2_ERR_MEM_ALLOC);
  Manifest::Reason* end = std::copy_n(reasons.get(), count, made.get());
  for (uint32_t i = 0; i < findings.Count(); ++i, item = item->next) {
    if (findings.At(i).reason != 0) *end++ = {item, findings.At(i).reason};
  }
  ZVsysutil::zv_sort(made.get(), size, sizeof(Manifest::Reason), CompareEntries);
  reasons = std::move(made);
  count = size;
  return 0;
}

}  // namespace

int Manifest::Publish(Findings& findings) {
  // All is made before anything is handed over: the lists change whole or not at all.
  FileItemList made;
  VESK2_TRY(MakeItems(findings, made));
  VESK2_TRY(AddReasons(reasons, reasonCount, findings, made.get()));
  // Each list ends up in the reverse order of the findings; callers walk it as it is.
  for (uint32_t i = 0; i < findings.Count(); ++i) {
    FileItem* const item = made.release();
    made.reset(std::exchange(item->next, nullptr));
    FileItemList& list = ListOf(findings.At(i).GetStatus());
    item->next = list.release();
    list.reset(item);
  }
  return 0;
}

int Manifest::GetReason(const FileItem* entry) const {
  const Reason* const end = reasons.get() + reasonCount;
  const Reason* const found = std::lower_bound(
      static_cast<const Reason*>(reasons.get()), end, entry,
      [](const Reason& reason, const FileItem* sought) { return reason.entry < sought; });
  return found != end && found->entry == entry ? found->code : 0;
}

}  // namespace ZvVesk2
