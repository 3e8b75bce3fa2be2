// SPDX-License-Identifier: Apache-2.0
// Loading revocation lists: those of the sources that the trust roots name from the store, and
// those of a directory. Missing, unreadable and malformed lists are absent: one file must not stop
// all verification. With such a list goes what it revokes, which is the store's administrator's to
// see. What is there and was not read is never absent.
#include <vesk2/crl.h>

#include <vesk2/acl_entry.h>
#include <vesk2/context.h>

#include "src/trust/crl_update.h"
#include "src/trust/lists.h"
#include "src/trust/scan.h"

namespace ZvVesk2 {

namespace {

// Appends the stored list of one source, if it can be read. A list that is there but could not be
// read for want of memory, or because another process holds it, is never taken for a missing one:
// that would bring revoked keys back.
[[nodiscard]] int LoadSource(SExpression* store, SExpression* tag) {
  TextPtr name;
  // A tag that names no file has no list, and without a root nobody has.
  VESK2_TRY(StoreName(name, tag));
  if (!name || *VeskConf::GetGlobalDirectory() == '\0') return 0;
  TextPtr path;
  VESK2_TRY(StoredPath(path, name.get()));
  Ref<CrlSequence> sequence(TryNew<CrlSequence>(store->GetContext()));
  VESK2_REQUIRE(sequence, VESK2_ERR_MEM_ALLOC);
  const int code = sequence->Import(path.get());
  VESK2_REQUIRE(!IsNoAbsence(code), InOwnWords(code));
  return code == 0 ? Append(store, std::move(sequence)) : 0;
}

}  // namespace

// One read for each source that an entry names, twice for one that two entries name: the lists are
// few, and proving them asks for each once.
int CrlSequence::ImportStore(SExpression*& store, SExpression* aclEntries,
                             Vesk2ContextStruct* ctx) {
  store = nullptr;
  const ZVsysutil::ZvCall call;
  Ref<SExpression> loaded;
  if (aclEntries == nullptr) {
    VESK2_TRY(AclEntry::Import(loaded.Out(), ctx, nullptr));
    aclEntries = loaded.get();
  }
  // Not even a keyword: nobody loaded this.
  VESK2_REQUIRE(aclEntries->First() != nullptr, VESK2_ERR_INVALID_PARAM);

  Ref<SExpression> list(TryNew<SExpression>(ctx));
  VESK2_REQUIRE(list, VESK2_ERR_MEM_ALLOC);
  for (auto it = aclEntries->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry == nullptr || !EndsInRevoke(entry->GetTag())) continue;
    VESK2_TRY(LoadSource(list.get(), entry->GetTag()));
  }
  store = list.Release();
  return 0;
}

// For what was brought from outside. Nothing is believed of it yet, and a file that is no list does
// not keep the others from being offered.
int CrlSequence::ImportDir(SExpression*& list, const char* dir, StorageType type,
                           Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(list == nullptr, VESK2_ERR_INVALID_PARAM);
  Scan scan;
  const int opened = scan.Open(dir, "*.crl");
  VESK2_REQUIRE(!IsNoAbsence(opened), opened);
  VESK2_REQUIRE(opened == 0, VESK2_ERR_FILE_NOT_FOUND);
  Ref<SExpression> loaded(TryNew<SExpression>(ctx));
  VESK2_REQUIRE(loaded, VESK2_ERR_MEM_ALLOC);
  while (scan.Next()) {
    Ref<CrlSequence> sequence(TryNew<CrlSequence>(ctx));
    VESK2_REQUIRE(sequence, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(sequence->SetFilePath(scan.Path()));
    if (!scan.Took(scan.Read(*sequence, VESK2_ERR_FILE_NOT_FOUND))) continue;
    sequence->SetStorageType(type);
    VESK2_TRY(Append(loaded.get(), std::move(sequence)));
  }
  VESK2_TRY(scan.Result(0));
  VESK2_REQUIRE(loaded->First() != nullptr, VESK2_ERR_CRL_NOT_FOUND);
  list = loaded.Release();
  return 0;
}

// The entries are loaded once for all: which lists are believed must not change half-way.
int CrlSequence::ImportDirAndStore(const char* dir, Vesk2ContextStruct* ctx) {
  const ZVsysutil::ZvCall call;
  Ref<SExpression> acls;
  VESK2_TRY(AclEntry::Import(acls.Out(), ctx, nullptr));
  Ref<SExpression> sequences;
  VESK2_TRY(ImportDir(sequences.Out(), dir, StorageGlobal, ctx));
  for (auto it = sequences->Begin(); it; it.Next()) {
    auto* sequence = dynamic_cast<CrlSequence*>(it.Value());
    // A list that cannot be stored does not keep the others out.
    if (sequence != nullptr) static_cast<void>(sequence->UpdateStore(acls.get()));
  }
  return 0;
}

// Looks at every file and not only at the one that the tag names: a list may have been put there by
// hand. Nothing is proved.
int CrlSequence::Find(CrlSequence*& out, SExpression* tag) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_PARAM_NOT_NULL);
  VESK2_REQUIRE(tag != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<SExpression> wanted;
  VESK2_TRY(MakeTag(wanted, tag));
  Scan scan;
  VESK2_TRY(scan.OpenStore(DirectoryName(true), "*.crl", StorageGlobal));

  int status = 0;
  Ref<CrlSequence> candidate;
  while (scan.Next()) {
    candidate.Reset(TryNew<CrlSequence>(tag->GetContext()));
    VESK2_REQUIRE(candidate, VESK2_ERR_MEM_ALLOC);
    status = VESK2_ERR_ACL_ENTRY_NOT_FOUND;
    candidate->SetStorageType(StoragePath);
    VESK2_TRY(candidate->SetFilePath(scan.Path()));
    if (!scan.Took(scan.Read(*candidate, VESK2_ERR_FILE_NOT_FOUND))) continue;
    if (wanted->IsEqual(candidate->GetCert()->GetTag())) {
      status = 0;
      break;
    }
  }
  VESK2_TRY(scan.Result(0));
  // Found or not, callers expect the last candidate, and free it.
  out = candidate.Release();
  return status;
}

}  // namespace ZvVesk2
