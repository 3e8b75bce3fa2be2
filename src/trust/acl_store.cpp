// SPDX-License-Identifier: Apache-2.0
// Loading entries from files: one, or every one of the store. An entry that is passed over takes
// with it the trust that it gives, which is a refusal too many, and the source of revocation lists
// that it names, which is a refusal too few. Malformed files are passed over all the same, as one
// bad file must not stop a machine; what was only not read is an error.
#include <vesk2/acl_entry.h>

#include <cstring>

#include "src/trust/lists.h"
#include "src/trust/scan.h"

namespace ZvVesk2 {

// A "/" makes it a path, as names in a store have none: nobody reaches outside the store by a name,
// and a path needs no store.
int AclEntry::Import(const char* name) {
  VESK2_REQUIRE(name != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  if (std::strchr(name, '/') != nullptr) {
    SetStorageType(StoragePath);
    VESK2_TRY(SetFilePath(name));
  } else {
    SetStorageType(StorageGlobal);
    TextPtr path;
    VESK2_TRY(FilePath(path, DirectoryName(), ExtensionName(), name, StorageGlobal));
    VESK2_TRY(SetFilePath(path.get()));
  }
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, GetFileName(), VESK2_ERR_FILE_OPEN));
  return Import(buffer.get());
}

// Each entry keeps the path that it was read from: explanations name it, and InstallAcls tells the
// store's own by it. The result is that of the last file: a bad one there is reported although
// those before it were loaded, and a bad one before it is passed over.
int AclEntry::LoadDirectory(SExpression* list, const char* directory) {
  Scan scan;
  VESK2_TRY(scan.Open(directory, "*.acl"));
  while (scan.Next()) {
    Ref<AclEntry> entry(TryNew<AclEntry>(list->GetContext()));
    VESK2_REQUIRE(entry, VESK2_ERR_MEM_ALLOC);
    if (!scan.Took(scan.Read(*entry, VESK2_ERR_FILE_OPEN))) continue;
    entry->SetStorageType(StoragePath);
    VESK2_TRY(entry->SetFilePath(scan.Path()));
    VESK2_TRY(Append(list, std::move(entry)));
  }
  return scan.Result(scan.Last());
}

int AclEntry::Import(SExpression*& out, Vesk2ContextStruct* ctx, const char* extraDir) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  const ZVsysutil::ZvCall call;
  Ref<SExpression> list;
  VESK2_TRY(SExpression::Create(list.Out(), "acl", ctx));

  TextPtr store;
  // No root and no directory are one thing: a machine without a store.
  int stored = StoreDirectory(store, DirectoryName(true), StorageGlobal);
  if (stored == 0) stored = LoadDirectory(list.get(), store.get());
  VESK2_REQUIRE(!IsNoAbsence(stored), stored);
  // With a directory of his own the caller can do without the store; without both nobody is
  // trusted.
  VESK2_REQUIRE(stored == 0 || extraDir != nullptr, VESK2_ERR_FILE_NOT_FOUND);
  if (extraDir != nullptr) {
    const int extra = LoadDirectory(list.get(), extraDir);
    VESK2_REQUIRE(!IsNoAbsence(extra), extra);
  }
  VESK2_REQUIRE(list->Count() > 1, VESK2_ERR_FILE_NOT_FOUND);
  out = list.Release();
  return 0;
}

}  // namespace ZvVesk2
