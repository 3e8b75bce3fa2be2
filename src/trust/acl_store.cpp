// Loading entries from files: one, or every one of the store.
#include <vesk2/acl_entry.h>

#include <cstring>

#include "src/platform/file.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

using ZVsysutil::ZvDir;

int AclEntry::Import(const char* name) { return ImportFile(name, false); }

int AclEntry::ImportFile(const char* name, bool listed) {
  VESK2_REQUIRE(name != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  if (std::strchr(name, '/') != nullptr) {
    SetStorageType(StoragePath);
    VESK2_TRY(SetFilePath(name));
  } else {
    SetStorageType(StorageGlobal);
    VESK2_TRY(SetFileName(name));
  }
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, GetFileName(), VESK2_ERR_FILE_OPEN, listed));
  return Import(buffer.get());
}

int AclEntry::LoadDirectory(SExpression* list, const char* directory) {
  ZvDir dir;
  VESK2_TRY(dir.open(directory, "*.acl"));
  int status = 0;
  while (const char* path = dir.read(true)) {
    Ref<AclEntry> entry(TryNew<AclEntry>(list->GetContext()));
    VESK2_REQUIRE(entry, VESK2_ERR_MEM_ALLOC);
    status = entry->ImportFile(path, dir.isRegular());
    if (status == 0) VESK2_TRY(Append(list, std::move(entry)));
    // An entry that is missing for lack of memory may be the one that names a revocation list.
    if (LacksMemory(status)) return VESK2_ERR_MEM_ALLOC;
  }
  return dir.failed() ? VESK2_ERR_MEM_ALLOC : status;
}

int AclEntry::Import(SExpression*& out, Vesk2ContextStruct* ctx, const char* extraDir) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression> list;
  VESK2_TRY(SExpression::Create(list.Out(), "acl", ctx));

  const TextPtr store(CalcDir(StorageGlobal));
  const int stored = LoadDirectory(list.get(), store.get());
  VESK2_REQUIRE(stored != VESK2_ERR_MEM_ALLOC, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(stored == 0 || extraDir != nullptr, VESK2_ERR_FILE_NOT_FOUND);
  if (extraDir != nullptr) {
    VESK2_REQUIRE(LoadDirectory(list.get(), extraDir) != VESK2_ERR_MEM_ALLOC, VESK2_ERR_MEM_ALLOC);
  }
  VESK2_REQUIRE(list->Count() > 1, VESK2_ERR_FILE_NOT_FOUND);
  out = list.Release();
  return 0;
}

}  // namespace ZvVesk2
