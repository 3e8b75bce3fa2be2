// SPDX-License-Identifier: Apache-2.0
// The manifest object: its settings, and the order of work of the two verifications. The proof of a
// manifest is ManifestReader's; what is done here is what belongs to the object: settings that
// outlive a verification, results that must not outlive it.
#include <vesk2/manifest.h>

#include <utility>

#include <vesk2/manifest_body.h>

#include "src/frame/check.h"
#include "src/frame/handles.h"
#include "src/manifest/manifest_reader.h"
#include "src/platform/text.h"
#include "src/platform/wait.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::zv_filenamecmp;
using ZVsysutil::zv_fstrdup;
using ZVsysutil::zv_join_path;
using ZVsysutil::zv_strdup;

// As the entries of a body are ordered: both are walked side by side.
[[nodiscard]] int ComparePaths(const void* a, const void* b) {
  return zv_filenamecmp(*static_cast<const char* const*>(a), *static_cast<const char* const*>(b));
}

// Copies the names of a record, to the front of `list`. The order is reversed by it, as it has
// always been for who reads the list back.
[[nodiscard]] int PushCopy(const FileItem& item, FileItemList& list) {
  std::unique_ptr<char[]> name(zv_fstrdup(item.name));
  std::unique_ptr<char[]> nameA(zv_strdup(item.nameA));
  VESK2_REQUIRE((name || item.name == nullptr) && (nameA || item.nameA == nullptr),
                VESK2_ERR_MEM_ALLOC);
  FileItem* const copy = FileItemCreate(name.get(), nameA.get());
  VESK2_REQUIRE(copy != nullptr, VESK2_ERR_MEM_ALLOC);
  static_cast<void>(name.release());
  static_cast<void>(nameA.release());
  copy->next = list.release();
  list.reset(copy);
  return 0;
}

// ReadManifest with an owner for the body.
[[nodiscard]] int ReadBody(Manifest& manifest, bool verifyChain, long notBefore, long notAfter,
                           BufferOwner& body) {
  ZvBuffer* read = nullptr;
  const int code = manifest.ReadManifest(verifyChain, notBefore, notAfter, &read);
  body.reset(read);
  return code;
}

}  // namespace

Manifest::Manifest(Vesk2ContextStruct* ctx) : context(ctx) {}
Manifest::~Manifest() = default;

// Nothing is opened or tested but the tag: paths may name what does not exist yet.
int Manifest::Initialize(const char* directoryPath, const char* path, const char* tagText) {
  VESK2_REQUIRE(directoryPath != nullptr && path != nullptr && tagText != nullptr,
                VESK2_ERR_INVALID_PARAM);
  directory.reset(zv_fstrdup(directoryPath));
  manifestPath.reset(zv_fstrdup(path));
  VESK2_REQUIRE(directory && manifestPath, VESK2_ERR_MEM_ALLOC);
  return SExpression::ParseTagAdvanced(tag.Out(), tagText, "tag", context);
}

// A setting that was lost must not be forgotten: without the directory, and the sources of
// revocation that its entries name, the verification would be another one, and could say yes.
int Manifest::CopyExtraAclDirectory(const char* text) {
  SetExtraAclDirectory(zv_fstrdup(text));
  lostSetting = text != nullptr && extraAclDirectory == nullptr;
  return lostSetting ? VESK2_ERR_MEM_ALLOC : 0;
}

// All or none: with part of the names ignored the result would be none that anyone asked for.
// Without any it can only find more.
int Manifest::SetIgnoredEntries(const FileItem* list) {
  FileItemList copies;
  const FileItem* item = list;
  int code = 0;
  for (; item != nullptr && code == 0; item = item->next) {
    if (item->name != nullptr || item->nameA != nullptr) code = PushCopy(*item, copies);
  }
  if (code != 0) copies.reset();
  ignoredEntries = std::move(copies);
  return code;
}

// The size tells which members the caller knows of.
int Manifest::SetFileCallbacks(const Vesk2FileCallbacks* callbacks) {
  VESK2_REQUIRE(callbacks == nullptr || callbacks->size == sizeof *callbacks,
                VESK2_ERR_INVALID_PARAM);
  fileCallbacks = callbacks != nullptr ? *callbacks : Vesk2FileCallbacks{};
  return 0;
}

// Paths as the listing makes them, from the same base by the same join, so that both can be
// compared byte by byte.
int Manifest::BuildIgnoreList(const char* base, PointerArray<char>& list) const {
  for (const FileItem* item = ignoredEntries.get(); item != nullptr; item = item->next) {
    std::unique_ptr<char[]> path(zv_join_path(base, item->name));
    VESK2_REQUIRE(path && list.push(path.get()), VESK2_ERR_MEM_ALLOC);
    static_cast<void>(path.release());
  }
  list.sort(ComparePaths);
  return 0;
}

// Before each read: what getters tell afterwards is of that read or nothing.
void Manifest::ClearRead() {
  version.Reset();
  type.Reset();
  signingTime.Reset();
  readPosition = 0;
}

void Manifest::ClearResults() {
  valid.reset();
  invalid.reset();
  missing.reset();
  extra.reset();
  reasons.reset();
  reasonCount = 0;
  listing.reset();
  listedFiles = 0;
}

// The lost setting matters to who asks about authority only.
int Manifest::ReadManifest(bool verifyChain, long notBefore, long notAfter, ZvBuffer** body) {
  if (body != nullptr) *body = nullptr;
  VESK2_REQUIRE(!verifyChain || !lostSetting, VESK2_ERR_MEM_ALLOC);
  return ManifestReader(*this, verifyChain, notBefore, notAfter).Read(body);
}

// Authority first, then the tree: no file of the tree is opened for a manifest that nobody may
// believe. The answer about unlisted entries is changed here and nowhere else, so that the lists
// tell of them either way.
int Manifest::VerifyManifest(long notBefore, long notAfter) {
  const ZVsysutil::ZvCall call;
  // A failure on the way must not leave the findings of an earlier verification to be read.
  ClearResults();
  BufferOwner body;
  VESK2_TRY(ReadBody(*this, true, notBefore, notAfter, body));
  // From here on the position tells how far the body made sense; it lies before the final ")". The
  // body's own position counts from its first byte; people are told the byte of the file.
  const size_t bodyStart = readPosition - 1 - body->Remaining();
  std::unique_ptr<BodyDirectory> root;
  int code = ParseListing(root, body.get(), directory.get());
  readPosition = bodyStart + body->Position();
  body.reset();  // as large as the listing itself
  if (code == 0) code = CheckListing(std::move(root));
  if (code == VESK2_ERR_EXTRA_FILES && !failOnExtraEntries) return 0;
  return code;
}

// The reader refuses what is damaged, and asks no store. The results of an earlier comparison stay
// until both are read.
int Manifest::CompareManifest(const char* otherManifestPath) {
  const ZVsysutil::ZvCall call;
  BufferOwner body1;
  VESK2_TRY(ReadBody(*this, false, 0, 0, body1));
  BufferOwner body2;
  {
    // No chain is verified here, so any tag will do.
    Manifest other(context);
    VESK2_TRY(other.Initialize(directory.get(), otherManifestPath, "(null)"));
    VESK2_TRY(ReadBody(other, false, 0, 0, body2));
  }
  ClearResults();
  return Compare(body1.get(), body2.get());
}

void Manifest::SetFailOnExtraEntries(bool value) { failOnExtraEntries = value; }
void Manifest::SetStoreUpdate(bool value) { storeUpdate = value; }
void Manifest::SetTaskRunner(const Vesk2TaskRunner* runner) {
  taskRunner = runner != nullptr ? *runner : Vesk2TaskRunner{};
}
void Manifest::SetEvidence(Evidence* borrowed) { evidence = borrowed; }
Vesk2ContextStruct* Manifest::GetContext() const { return context; }
const char* Manifest::GetDirectory() const { return directory.get(); }
const char* Manifest::GetManifestPath() const { return manifestPath.get(); }
SExpression* Manifest::GetTag() const { return tag.get(); }
bool Manifest::GetFailOnExtraEntries() const { return failOnExtraEntries; }
const char* Manifest::GetExtraAclDirectory() const { return extraAclDirectory.get(); }
bool Manifest::GetStoreUpdate() const { return storeUpdate; }
FileItem* Manifest::GetValid() const { return valid.get(); }
FileItem* Manifest::GetInvalid() const { return invalid.get(); }
FileItem* Manifest::GetMissing() const { return missing.get(); }
FileItem* Manifest::GetExtra() const { return extra.get(); }
FileItem* Manifest::GetIgnoredEntries() const { return ignoredEntries.get(); }
SExpression* Manifest::GetVersion() const { return version.get(); }
SExpression* Manifest::GetType() const { return type.get(); }
TimeStamp* Manifest::GetSigningTime() const { return signingTime.get(); }
size_t Manifest::GetReadPosition() const { return readPosition; }
size_t Manifest::CountListedFiles() const { return listedFiles; }
BodyDirectory* Manifest::GetListing() const { return listing.get(); }
// A setting that is made takes back the trouble of one that was lost.
void Manifest::SetExtraAclDirectory(char* owned) {
  extraAclDirectory.reset(owned);
  lostSetting = false;
}
const Vesk2FileCallbacks* Manifest::GetFileCallbacks() const {
  return fileCallbacks.size != 0 ? &fileCallbacks : nullptr;
}

}  // namespace ZvVesk2
