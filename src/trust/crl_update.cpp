// SPDX-License-Identifier: Apache-2.0
// See crl_update.h. What is written here decides which keys pass on this machine, so that a list is
// replaced whole, by one that was proved, or not at all. Two writers of one source both succeed,
// and the later stays; each has judged what it found.
#include "src/trust/crl_update.h"

#include <vesk2/crl.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <string_view>

#include <vesk2/acl_entry.h>
#include <vesk2/context.h>

#include "src/platform/replace.h"
#include "src/sexpr/storage.h"
#include "src/trust/revocation_lists.h"
#include "src/trust/store_write.h"

namespace ZvVesk2 {
namespace {

// Whether the text of `tag` has a 0 byte in it: as a C string it would name another tag's file. A
// list of the one source in the place of the other's would take that one's revocations away.
[[nodiscard]] int HoldsZeroByte(bool& holds, SExpression* tag) {
  unsigned int size = tag->AdvancedLength();
  VESK2_REQUIRE(size < UINT_MAX, VESK2_ERR_BUFFER_OVERFLOW);
  ++size;  // an empty list needs it
  const std::unique_ptr<unsigned char[]> text(TryNewArray<unsigned char>(size));
  VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
  unsigned int length = 0;
  VESK2_TRY(tag->ExportAdvanced(text.get(), length, size));
  holds = std::memchr(text.get(), 0, length) != nullptr;
  return 0;
}

// "/" becomes "%2F": what a tag says must not choose a directory, and only the last component of a
// name would count. No more is escaped: the names are read by people, and "%2F" itself in a tag is
// told apart by the tag in the file.
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

}  // namespace

// Success without a name is no list; a lack of memory must not look like it, or the list would
// count as missing.
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
  TextPtr escaped = EscapeSlashes(text.get());
  VESK2_REQUIRE(escaped, VESK2_ERR_MEM_ALLOC);
  // What is measured is the name that the file would have: a longer one could never be written.
  if (std::strlen(escaped.get()) <= Limits::kMaxStoreName) name = std::move(escaped);
  return 0;
}

int StoredPath(TextPtr& path, const char* name) {
  const char* const extension = CrlSequence::ExtensionName(true);
  return FilePath(path, CrlSequence::DirectoryName(true), extension, name, StorageGlobal);
}

namespace {

// Whether the list of `fresh` takes the place of the stored one. An equal end is enough, so that an
// issuer can put out a list again before it ends; an older list with that end can be played back
// so. A stored one from the future would keep every list of today out, and goes for any that has
// begun, even one that has ended.
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
// A stored list that cannot be read says nothing, so that the first that verifies takes its place,
// whatever its period: an administrator restores a store by it. One that was merely not read
// (memory, a lease) stays.
[[nodiscard]] int IsWanted(bool& wanted, const Cert* fresh, const char* path) {
  wanted = false;
  Ref<CrlSequence> stored(TryNew<CrlSequence>(fresh->GetContext()));
  VESK2_REQUIRE(stored, VESK2_ERR_MEM_ALLOC);
  const int code = stored->Import(path);
  VESK2_REQUIRE(!IsNoAbsence(code), code);
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

// What programs ask in order to look at, or watch, the file. It makes no directory.
int CrlSequence::StorePath(char*& out, SExpression* tag) {
  VESK2_REQUIRE(out == nullptr, VESK2_ERR_INVALID_PARAM);
  TextPtr name;
  VESK2_TRY(StoreName(name, tag));
  if (!name || *VeskConf::GetGlobalDirectory() == '\0') return 0;
  TextPtr path;
  VESK2_TRY(StoredPath(path, name.get()));
  out = path.release();
  return 0;
}

int CrlSequence::UpdateStore(SExpression* aclEntries) {
  VESK2_REQUIRE(First() != nullptr, VESK2_ERR_INVALID_PARAM);
  TextPtr name;
  VESK2_TRY(StoreName(name, cert->GetTag()));
  VESK2_REQUIRE(name, VESK2_ERR_INVALID_PARAM);
  // From here on the answer is a plain success: a damaged store degrades to having no list.
  SetStorageType(StorageGlobal);
  TextPtr path;
  if (StoredPath(path, name.get()) != 0) return 0;
  bool wanted = false;
  // Asked before the list is proved: reading is cheaper than a signature, and most lists that are
  // offered are there already.
  if (IsWanted(wanted, cert, path.get()) != 0 || !wanted) return 0;
  if (crl->GetIssuerTag() == nullptr && VerifySelf(aclEntries) != 0) return 0;
  if (CreateFileDirectory() != 0 || SetFilePath(path.get()) != 0) return 0;
  ZVsysutil::zv_remove_leftovers(TextPtr(CalcDir(StorageGlobal)).get());
  static_cast<void>(WriteStored(this, path.get(), true));
  return 0;
}

// Each offer reads the stored list, which may be large. A list that is carried many times is
// offered the first and the last time: those between cannot change what is stored in the end.
int RevocationLists::Store(SExpression* carried) {
  VESK2_TRY(Load());
  for (Source& list : lists_.All()) VESK2_TRY(Prove(list));
  TagIndex<CrlSequence*> proved;
  VESK2_TRY(proved.Reserve(carried->Count()));
  for (auto it = carried->Begin(); it; it.Next()) {
    auto* const list = dynamic_cast<CrlSequence*>(it.Value());
    if (list == nullptr || list->First() == nullptr) continue;
    if (list->GetCrl()->GetIssuerTag() != nullptr) VESK2_TRY(proved.Add(list->GetCert(), list));
  }
  proved.Sort();
  for (auto it = carried->Begin(); it; it.Next()) {
    auto* const list = dynamic_cast<CrlSequence*>(it.Value());
    if (list == nullptr || list->First() == nullptr) continue;
    bool hashed = false;
    TagDigest digest;
    VESK2_TRY(DigestTag(hashed, digest, list->GetCert()));
    const auto same = hashed ? proved.Find(digest) : decltype(proved.Find(digest))();
    if (same.empty() || (list != same.front().value && list != same.back().value)) continue;
    static_cast<void>(list->UpdateStore(acls_));
  }
  return 0;
}

}  // namespace ZvVesk2
