// The comparison of a body with a directory on disk.
//
// A listed file counts by its contents alone: links are followed, and what is no regular file is
// never opened and counts as missing. Nothing is descended into that is not listed. The result
// speaks of the moment of reading; nothing keeps the tree from changing afterwards.
#include <sys/stat.h>

#include <memory>
#include <utility>

#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>

#include "src/frame/check.h"
#include "src/manifest/findings.h"
#include "src/manifest/ignore.h"
#include "src/objects/hash_file.h"
#include "src/platform/file.h"
#include "src/platform/text.h"
#include "src/platform/wait.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::zv_filenamecmp;
using ZVsysutil::zv_fstrdup;
using ZVsysutil::zv_join_path;
using ZVsysutil::ZvDir;

// The two kinds of directory entries, each in ascending order of names, each with its own merges.
struct Listing {
  Listing(PointerArray<BodyObject>& listedEntries, const PointerArray<char>& ignored)
      : listed(listedEntries), ignore(ignored) {
    listed.reset();
  }
  bool Lists(const char* name) {
    const BodyObject* entry = listed.get(0);
    while (entry != nullptr && zv_filenamecmp(name, entry->GetName()) > 0) entry = listed.get(1);
    return entry != nullptr && zv_filenamecmp(name, entry->GetName()) == 0;
  }

  PointerArray<BodyObject>& listed;
  IgnoreWalk ignore;
};

class DiskCheck {
 public:
  DiskCheck(Vesk2ContextStruct* context, Findings& findings, const Vesk2FileCallbacks* callbacks)
      : context_(context), findings_(findings), callbacks_(callbacks) {}

  // Checks one directory, the root at depth 0, and collects the statuses found in it. Trouble is
  // returned; what was found is no trouble.
  [[nodiscard]] int Directory(BodyDirectory& directory, unsigned depth, StatusSet& statuses) {
    VESK2_TRY(Files(directory, statuses));
    VESK2_TRY(Subdirectories(directory, depth, statuses));
    // The root is not searched: it may hold more than the manifest lists, the manifest itself for
    // one.
    if (depth == 0) return 0;
    return Unlisted(directory, statuses);
  }

 private:
  [[nodiscard]] int Files(BodyDirectory& directory, StatusSet& statuses);
  [[nodiscard]] int Subdirectories(BodyDirectory& directory, unsigned depth, StatusSet& statuses);
  [[nodiscard]] int Unlisted(BodyDirectory& directory, StatusSet& statuses);
  [[nodiscard]] int ReadEntries(ZvDir& disk, PointerArray<BodyObject>& entries);
  [[nodiscard]] int StatusOf(uint32_t& status, int& reason, const BodyFile& file, const char* path);

  Vesk2ContextStruct* context_;
  Findings& findings_;
  const Vesk2FileCallbacks* callbacks_;
};

int DiskCheck::StatusOf(uint32_t& status, int& reason, const BodyFile& file, const char* path) {
  unsigned char digest[kFileDigestSize];
  bool held = false;
  FileDigester digester(context_, callbacks_);
  const int code = digester.Digest({{ZVsysutil::kZvNoDirectory, path}, path}, digest, held);
  VESK2_REQUIRE(code != VESK2_ERR_USER_INTERRUPT, code);
  VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  const bool same = code == 0 && file.Equal(digest, static_cast<int>(kFileDigestSize));
  status = same ? BodyObject::Valid : BodyObject::Invalid;
  if (code == VESK2_ERR_FILE_OPEN) status = BodyObject::Missing;
  reason = held ? VESK2_ERR_FILE_OPEN : code;
  return 0;
}

int DiskCheck::Files(BodyDirectory& directory, StatusSet& statuses) {
  IgnoreWalk ignore(directory.GetIgnored());
  PointerArray<BodyObject>& files = directory.GetFiles();
  for (BodyObject* entry = files.begin(); entry != nullptr; entry = files.next()) {
    if (ignore.Ignores(entry->GetName())) continue;
    std::unique_ptr<char[]> path(zv_join_path(directory.GetName(), entry->GetName()));
    VESK2_REQUIRE(path, VESK2_ERR_MEM_ALLOC);
    uint32_t status = BodyObject::Invalid;
    int reason = 0;
    VESK2_TRY(StatusOf(status, reason, static_cast<const BodyFile&>(*entry), path.get()));
    VESK2_TRY(findings_.AddFile(directory, entry->GetName(), status, statuses, reason));
  }
  return 0;
}

int DiskCheck::Subdirectories(BodyDirectory& directory, unsigned depth, StatusSet& statuses) {
  IgnoreWalk ignore(directory.GetIgnored());
  PointerArray<BodyObject>& subdirectories = directory.GetSubdirectories();
  for (BodyObject* entry = subdirectories.begin(); entry != nullptr;
       entry = subdirectories.next()) {
    if (ignore.Ignores(entry->GetName())) continue;
    StatusSet inside;
    VESK2_TRY(Directory(static_cast<BodyDirectory&>(*entry), depth + 1, inside));
    // A directory that only holds too much is itself recorded as too much; any other finding, a
    // missing file too, makes it invalid.
    uint32_t status = BodyObject::Invalid;
    if (inside.Code() == VESK2_ERR_EXTRA_FILES) status = BodyObject::Extra;
    if (inside.Code() == 0) status = BodyObject::Valid;
    VESK2_TRY(findings_.AddDirectory(entry->GetName(), status, statuses, inside.reason));
  }
  return 0;
}

// Reads a directory into records, a file under its bare name and a directory under its path, the
// way in which a body names them.
int DiskCheck::ReadEntries(ZvDir& disk, PointerArray<BodyObject>& entries) {
  while (const char* const path = disk.read(true)) {
    struct stat about {};
    const int code = ZVsysutil::zv_stat(path, &about);
    VESK2_REQUIRE(code != VESK2_ERR_MEM_ALLOC, code);
    const bool isDirectory = code == 0 && S_ISDIR(about.st_mode);
    std::unique_ptr<BodyObject> entry(TryNew<BodyObject>(context_));
    VESK2_REQUIRE(entry, VESK2_ERR_MEM_ALLOC);
    entry->SetIsDirectory(isDirectory);
    entry->SetName(zv_fstrdup(isDirectory ? path : BareName(path)));
    VESK2_REQUIRE(entry->GetName() != nullptr && entries.push(entry.get()), VESK2_ERR_MEM_ALLOC);
    static_cast<void>(entry.release());
  }
  VESK2_REQUIRE(!disk.failed(), VESK2_ERR_MEM_ALLOC);
  entries.sort(BodyObject::Cmp);
  return 0;
}

int DiskCheck::Unlisted(BodyDirectory& directory, StatusSet& statuses) {
  PointerArray<BodyObject> entries;
  {
    ZvDir disk;
    const int code = disk.open(directory.GetName(), "*");
    VESK2_REQUIRE(code != VESK2_ERR_MEM_ALLOC, code);
    // The parent records it once more: such a directory stands twice in the list.
    if (code != 0) {
      statuses.reason = code;
      return findings_.AddDirectory(directory.GetName(), BodyObject::Invalid, statuses, code);
    }
    VESK2_TRY(ReadEntries(disk, entries));
  }
  Listing files(directory.GetFiles(), directory.GetIgnored());
  Listing subdirectories(directory.GetSubdirectories(), directory.GetIgnored());
  for (const BodyObject* entry = entries.begin(); entry != nullptr; entry = entries.next()) {
    const char* const name = entry->GetName();
    Listing& kind = entry->GetIsDirectory() ? subdirectories : files;
    if (kind.ignore.Ignores(name) || kind.Lists(name)) continue;
    VESK2_TRY(entry->GetIsDirectory()
                  ? findings_.AddDirectory(name, BodyObject::Extra, statuses)
                  : findings_.AddFile(directory, name, BodyObject::Extra, statuses));
  }
  return 0;
}

}  // namespace

int Manifest::Verify(ZvBuffer* body, const char* directoryPath) {
  VESK2_REQUIRE(body != nullptr && directoryPath != nullptr, VESK2_ERR_PARAM_NULL);
  const ZVsysutil::ZvCall call;
  PointerArray<char> ignoreList;
  VESK2_TRY(BuildIgnoreList(directoryPath, ignoreList));
  std::unique_ptr<BodyDirectory> parsed(TryNew<BodyDirectory>(context));
  VESK2_REQUIRE(parsed, VESK2_ERR_MEM_ALLOC);
  BodyDirectory& root = *parsed;
  root.SetName(zv_fstrdup(directoryPath));
  VESK2_REQUIRE(root.GetName() != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(root.ParseBody(body, &ignoreList));

  Findings findings(context);
  StatusSet statuses;
  const int checked = DiskCheck(context, findings, GetFileCallbacks()).Directory(root, 0, statuses);
  if (evidence != nullptr) listing = std::move(parsed);
  VESK2_TRY(checked);
  VESK2_TRY(Publish(findings));
  return statuses.Code();
}

}  // namespace ZvVesk2
