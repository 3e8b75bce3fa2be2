// SPDX-License-Identifier: Apache-2.0
// Installing trust roots: copying into the store what it lacks. Every "*.acl" file of the directory
// that is handed in can become a root of trust, so that who calls this trusts its writer with
// everything. What is in the store already is never changed: an entry is replaced only by removing
// it first.
#include <vesk2/acl_entry.h>

#include "src/platform/file.h"
#include "src/platform/replace.h"
#include "src/platform/text.h"
#include "src/sexpr/storage.h"
#include "src/trust/lists.h"
#include "src/trust/store_write.h"
#include "src/trust/tag_index.h"

namespace ZvVesk2 {
namespace {

// Whether the entry was read from the store: its path is where the store would put it. One that
// counted as new for want of memory would be installed a second time. Asked by path, as loading
// hands out the store's entries and those of the directory in one list. (The directory may be the
// store itself, or another road to it.)
[[nodiscard]] int IsStored(bool& stored, const AclEntry* entry) {
  TextPtr path;
  const int code = FilePath(path, AclEntry::DirectoryName(true), AclEntry::ExtensionName(true),
                            entry->GetFileName(), StorageGlobal);
  VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  stored = code == 0 && ZVsysutil::zv_filenamecmp(path.get(), entry->GetFileName()) == 0;
  return 0;
}

// Parts the loaded entries into those of the store and the others, both in the order in which they
// were loaded.
[[nodiscard]] int Split(SExpression* loaded, SExpression* stored, SExpression* added) {
  for (auto it = loaded->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry == nullptr) continue;
    bool isStored = false;
    VESK2_TRY(IsStored(isStored, entry));
    VESK2_TRY(AppendShared(isStored ? stored : added, entry));
  }
  return 0;
}

// Only whether a tag is there is asked.
struct Nothing {};
// Of n entries with m in the store this costs n + m digests; comparing each with each would cost n
// times m, of which a directory with many files chooses one factor.
using StoredTags = TagIndex<Nothing>;

[[nodiscard]] int IndexTags(StoredTags& tags, SExpression* entries) {
  VESK2_TRY(tags.Reserve(entries->Count()));
  for (auto it = entries->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry != nullptr) VESK2_TRY(tags.Add(entry->GetTag(), {}));
  }
  tags.Sort();
  return 0;
}

// Writes the entry into the store under its file's name, unless another trust root has that name,
// or its tag. Only the tag is compared: an entry with a stored tag and another subject stays out.
// The name is tested first for a clear answer; what decides is the writing, which never replaces.
[[nodiscard]] int Install(AclEntry* entry, StoredTags& tags) {
  bool hashed = false;
  TagDigest digest;
  VESK2_TRY(DigestTag(hashed, digest, entry->GetTag()));
  if (hashed && !tags.Find(digest).empty()) return 0;
  const TextPtr name(ZVsysutil::zv_fstrdup(entry->GetFileName()));
  VESK2_REQUIRE(name, VESK2_ERR_MEM_ALLOC);
  entry->SetStorageType(StorageGlobal);
  VESK2_TRY(entry->SetFileName(name.get()));
  // A name that is taken, by whatever it is, keeps the entry out.
  struct stat there {};
  const int code = ZVsysutil::zv_stat(entry->GetFileName(), &there);
  VESK2_REQUIRE(code == VESK2_ERR_STAT_FILE, code);
  return WriteStored(entry, entry->GetFileName(), false);
}

// All is loaded before anything is written: when memory or descriptors run out half-way, the store
// must not hold a part that passes for all.
[[nodiscard]] int InstallAll(const char* dir, Vesk2ContextStruct* ctx) {
  Ref<SExpression> stored;
  Ref<SExpression> added;
  VESK2_TRY(SExpression::Create(stored.Out(), "acls", ctx));
  VESK2_TRY(SExpression::Create(added.Out(), "acls", ctx));
  Ref<SExpression> loaded;
  VESK2_TRY(AclEntry::Import(loaded.Out(), ctx, dir));
  VESK2_TRY(Split(loaded.get(), stored.get(), added.get()));

  StoredTags tags;
  VESK2_TRY(IndexTags(tags, stored.get()));

  // What earlier writers left when they were killed.
  ZVsysutil::zv_remove_leftovers(TextPtr(AclEntry::CalcDir(StorageGlobal)).get());
  for (auto it = added->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    // One entry that cannot be written does not keep the others out.
    if (entry != nullptr) static_cast<void>(Install(entry, tags));
  }
  return 0;
}

}  // namespace

int AclEntry::InstallAcls(const char* dir, Vesk2ContextStruct* ctx) {
  // What can be installed is; an entry that cannot is no failure of the call.
  static_cast<void>(InstallAll(dir, ctx));
  return 0;
}

}  // namespace ZvVesk2
