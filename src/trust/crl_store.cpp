// The CRL store: one file for each source of revocation lists that the trust roots name, holding
// the newest list that verified.
#include <vesk2/crl.h>

#include <algorithm>
#include <cstring>
#include <string_view>

#include <vesk2/acl_entry.h>
#include <vesk2/context.h>

#include "src/sexpr/storage.h"
#include "src/trust/lists.h"
#include "src/trust/scan.h"
#include "src/trust/store_write.h"

namespace ZvVesk2 {

namespace {

// ---- Names ----

// Whether the text of `tag` has a 0 byte in it: as a C string it would name another tag's file.
int HoldsZeroByte(bool& holds, SExpression* tag) {
  const unsigned int size = tag->AdvancedLength();
  const std::unique_ptr<unsigned char[]> text(TryNewArray<unsigned char>(size_t{size} + 1));
  VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
  unsigned int length = 0;
  VESK2_TRY(tag->ExportAdvanced(text.get(), length, size));
  holds = std::memchr(text.get(), 0, length) != nullptr;
  return 0;
}

// "/" becomes "%2F": what a tag says must not choose a directory, and only the last component of a
// name would count.
TextPtr EscapeSlashes(std::string_view text) {
  TextPtr escaped(TryNewArray<char>(3 * text.size() + 1));
  if (!escaped) return nullptr;
  char* out = escaped.get();
  for (const char c : text) {
    if (c == '/') {
      out = std::copy_n("%2F", 3, out);
    } else {
      *out++ = c;
    }
  }
  *out = '\0';
  return escaped;
}

// The name of the file that keeps the list of the source `tag` (may be null): the text of the tag's
// body. Success with null for a tag that names none.
int StoreName(TextPtr& name, SExpression* tag) {
  name = nullptr;
  if (tag == nullptr) return 0;
  bool holdsZeroByte = false;
  VESK2_TRY(HoldsZeroByte(holdsZeroByte, tag));
  if (holdsZeroByte) return 0;
  const TextPtr text(tag->ExportTagW("tag"));
  if (!text) {
    // No text of a tag with a body is a lack of memory.
    auto* const keyword = dynamic_cast<ByteString*>(tag->First());
    const bool hasBody = keyword != nullptr && keyword->IsEqual("tag") && tag->Count() > 1;
    return hasBody ? VESK2_ERR_MEM_ALLOC : 0;
  }
  if (std::strlen(text.get()) > Limits::kMaxStoreName) return 0;
  name = EscapeSlashes(text.get());
  return name ? 0 : VESK2_ERR_MEM_ALLOC;
}

// ---- Loading ----

// The path of a stored list.
int StoredPath(TextPtr& path, const char* name) {
  const char* const extension = CrlSequence::ExtensionName(true);
  return FilePath(path, CrlSequence::DirectoryName(true), extension, name, StorageGlobal);
}

// Appends the stored list of one source, if it can be read. A list that is there but could not be
// read for want of memory, or because another process holds it, is never taken for a missing one:
// that would bring revoked keys back.
int LoadSource(SExpression* store, SExpression* tag) {
  TextPtr name;
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

int CrlSequence::ImportStore(SExpression*& store, SExpression* aclEntries,
                             Vesk2ContextStruct* ctx) {
  store = nullptr;
  const ZVsysutil::ZvCall call;
  Ref<SExpression> loaded;
  if (aclEntries == nullptr) {
    VESK2_TRY(AclEntry::Import(loaded.Out(), ctx, nullptr));
    aclEntries = loaded.get();
  }
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
    if (!scan.Took(sequence->Import(scan.Path()))) continue;
    sequence->SetStorageType(type);
    VESK2_TRY(Append(loaded.get(), std::move(sequence)));
  }
  VESK2_TRY(scan.Result(0));
  VESK2_REQUIRE(loaded->First() != nullptr, VESK2_ERR_CRL_NOT_FOUND);
  list = loaded.Release();
  return 0;
}

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
    if (!scan.Took(candidate->Import(scan.Path()))) continue;
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

// ---- Storing ----

namespace {

// Whether the list of `fresh` takes the place of the stored one.
bool Replaces(const Cert* fresh, const Cert* stored, const TimeStamp* now) {
  // Texts of different tags can read the same; none may push another's list out.
  if (!fresh->GetTag()->IsEqual(stored->GetTag())) return false;
  const TimeStamp* const begin = fresh->GetNotBefore();
  if (begin != nullptr && now->IsBefore(begin)) return false;
  if (stored->GetNotBefore() != nullptr && stored->GetNotBefore()->IsAfter(now)) return true;
  const TimeStamp* const end = fresh->GetNotAfter();
  return end != nullptr && end->IsAfterOrEqual(stored->GetNotAfter());
}

// Whether the store should take the list: it has none at `path` that can be read, or an older one.
int IsWanted(bool& wanted, const Cert* fresh, const char* path) {
  wanted = false;
  Ref<CrlSequence> stored(TryNew<CrlSequence>(fresh->GetContext()));
  VESK2_REQUIRE(stored, VESK2_ERR_MEM_ALLOC);
  const int code = stored->Import(path);
  VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  if (code != 0) {
    wanted = true;
    return 0;
  }
  Ref<TimeStamp> now;
  VESK2_TRY(MakeNow(now, fresh->GetContext()));
  wanted = Replaces(fresh, stored->GetCert(), now.get());
  return 0;
}

}  // namespace

int CrlSequence::UpdateStore(SExpression* aclEntries) {
  VESK2_REQUIRE(First() != nullptr, VESK2_ERR_INVALID_PARAM);
  TextPtr name;
  VESK2_TRY(StoreName(name, cert->GetTag()));
  VESK2_REQUIRE(name, VESK2_ERR_INVALID_PARAM);
  // From here on the answer is a plain success: a damaged store degrades to having no list.
  SetStorageType(StorageGlobal);
  const TextPtr path(CalcPath(name.get(), StorageGlobal));
  bool wanted = false;
  if (!path || IsWanted(wanted, cert, path.get()) != 0 || !wanted) return 0;
  if (crl->GetIssuerTag() == nullptr && VerifySelf(aclEntries) != 0) return 0;
  if (SetFilePath(path.get()) == 0) static_cast<void>(WriteStored(this, path.get()));
  return 0;
}

}  // namespace ZvVesk2
