// Recording findings, and handing them to the manifest's four lists.
#include "src/manifest/findings.h"

#include <utility>

#include <vesk2/manifest.h>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {

int StatusSet::Code() const {
  if (statuses_ & BodyObject::Invalid) return VESK2_ERR_HASH_MISMATCH;
  if (statuses_ & BodyObject::Missing) return VESK2_ERR_FILE_NOT_FOUND;
  if (statuses_ & BodyObject::Extra) return VESK2_ERR_EXTRA_FILES;
  return 0;
}

int Findings::AddFile(const BodyDirectory& directory, const char* name, uint32_t status,
                      StatusSet& statuses) {
  std::unique_ptr<char[]> path(ZVsysutil::zv_join_path(directory.GetName(), name));
  return Add(std::move(path), false, status, statuses);
}

int Findings::AddDirectory(const char* path, uint32_t status, StatusSet& statuses) {
  std::unique_ptr<char[]> copy(ZVsysutil::zv_fstrdup(path));
  return Add(std::move(copy), true, status, statuses);
}

int Findings::Add(std::unique_ptr<char[]> name, bool isDirectory, uint32_t status,
                  StatusSet& statuses) {
  VESK2_REQUIRE(name, VESK2_ERR_MEM_ALLOC);
  std::unique_ptr<BodyObject> record(TryNew<BodyObject>(context_));
  VESK2_REQUIRE(record, VESK2_ERR_MEM_ALLOC);
  record->SetName(name.release());
  record->SetIsDirectory(isDirectory);
  record->SetStatus(status);
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

int Manifest::Publish(Findings& findings) {
  // All items are made before any is handed over: the lists change whole or not at all.
  FileItemList made;
  FileItem** tail = nullptr;
  for (BodyObject* record = findings.Records().begin(); record != nullptr;
       record = findings.Records().next()) {
    std::unique_ptr<char[]> name(record->TakeName());
    FileItem* const item = FileItemCreate(name.get(), nullptr);
    VESK2_REQUIRE(item != nullptr, VESK2_ERR_MEM_ALLOC);
    static_cast<void>(name.release());
    item->isDirectory = record->GetIsDirectory() ? 1 : 0;
    if (tail == nullptr) {
      made.reset(item);
    } else {
      *tail = item;
    }
    tail = &item->next;
  }
  // Each list ends up in the reverse order of the findings; callers walk it as it is.
  for (BodyObject* record = findings.Records().begin(); record != nullptr;
       record = findings.Records().next()) {
    FileItem* const item = made.release();
    made.reset(std::exchange(item->next, nullptr));
    FileItemList& list = ListOf(record->GetStatus());
    item->next = list.release();
    list.reset(item);
  }
  return 0;
}

}  // namespace ZvVesk2
