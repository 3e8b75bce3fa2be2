// SPDX-License-Identifier: Apache-2.0
// The comparison of a body with a directory on disk.
//
// A listed file counts by its contents alone: links are followed, and what is no regular file is
// never opened and counts as missing. Nothing is descended into that is not listed. The result
// speaks of the moment of reading; nothing keeps the tree from changing afterwards. Two steps: all
// listed files are hashed, by any number of threads, in whatever order they come; then what was
// found is told in the order of the listing, by one. So the results do not depend on who was
// faster.
#include <atomic>
#include <cstring>
#include <memory>
#include <utility>

#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>

#include "src/frame/check.h"
#include "src/manifest/body_disk.h"
#include "src/manifest/findings.h"
#include "src/manifest/ignore.h"
#include "src/objects/hash_file.h"
#include "src/platform/lock.h"
#include "src/platform/text.h"
#include "src/platform/wait.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::ZvLocked;

// Hashes the listed files. Any number of threads take part in it. The lock guards the walk; files
// are taken without it, and a file's state is written by the one thread that took it.
class FileHashing {
 public:
  FileHashing(BodyDirectory& root, const Manifest& manifest, const Vesk2TaskRunner* runner,
              ZVsysutil::ZvCall& call)
      : walk_(root), shared_(runner != nullptr), manifest_(manifest), call_(call) {}

  // Hashes all; the calling thread goes on when the runner's are done, or alone.
  [[nodiscard]] int Run(const Vesk2TaskRunner* runner) {
    if (runner != nullptr) runner->run(runner->user, TakePart, this);
    TakePart(this);
    return trouble_;
  }
  DiskWalk& Walk() { return walk_; }

 private:
  static void TakePart(void* self) { static_cast<FileHashing*>(self)->TakePart(); }
  void TakePart();
  bool Exchange(FilesToHash& files, int code);
  [[nodiscard]] int Prepare();
  [[nodiscard]] int Hash(const FilesToHash& files, FileDigester& digester);
  [[nodiscard]] int HashOne(int& state, const FilesToHash& files, const BodyFile& file,
                            FileDigester& digester);

  ZVsysutil::ZvLock lock_;  // of the walk
  DiskWalk walk_;
  const bool shared_;  // more than one thread may take part
  std::atomic<int> trouble_ = 0;
  const Manifest& manifest_;
  ZVsysutil::ZvCall& call_;
};

// Each thread has its own digester, and so its buffers, for all its files. It waits within the
// call's allowance: a tree of held files must not stop as many waits as there are threads.
void FileHashing::TakePart() {
  const ZVsysutil::ZvCall call(call_);
  FileDigester digester(manifest_.GetContext(), manifest_.GetFileCallbacks());
  FilesToHash files;
  int code = 0;
  while (Exchange(files, code)) code = Hash(files, digester);
}

// Gives a directory back, with what came of it, for another; false when there is no more to do. The
// first trouble ends it for all: what the others still do is not asked about.
bool FileHashing::Exchange(FilesToHash& files, int code) {
  const ZvLocked locked(lock_);
  walk_.Done(files);
  files = {};
  if (trouble_ == 0) trouble_ = code;
  if (trouble_ == 0) trouble_ = walk_.Next(files);
  return trouble_ == 0 && files.found != nullptr;
}

int FileHashing::Prepare() {
  const ZvLocked locked(lock_);
  return walk_.Prepare();
}

// One file after the other that no other thread takes, until none is left. Who takes the middle one
// lists the next directory: the others have enough to do meanwhile.
int FileHashing::Hash(const FilesToHash& files, FileDigester& digester) {
  DirectoryFound& found = *files.found;
  for (uint32_t i = found.Take(); i < found.Count() && trouble_ == 0; i = found.Take()) {
    if (shared_ && i == found.Count() / 2) VESK2_TRY(Prepare());
    int& state = found.files[i];
    const BodyObject* const file = found.directory->GetFiles().at(i);
    if (state == kIgnored) continue;
    VESK2_TRY(HashOne(state, files, static_cast<const BodyFile&>(*file), digester));
  }
  return 0;
}

// Opened from the directory that was listed, where there is one, so that nobody can put another
// tree in its place between two files. Why a file was not read is its state and not an error: the
// other files are compared all the same.
int FileHashing::HashOne(int& state, const FilesToHash& files, const BodyFile& file,
                         FileDigester& digester) {
  const char* const directory = files.found->directory->GetName();
  char joined[kLongestPath + 1];  // of which only some have need
  const bool asked = files.open == nullptr || manifest_.GetFileCallbacks() != nullptr;
  // What nobody can name is not there, however it is opened.
  const char* path = nullptr;
  if (asked && ZVsysutil::zv_concat_path_to(joined, sizeof joined, directory, file.GetName()))
    path = joined;
  FileToDigest wanted = {{ZVsysutil::kZvNoDirectory, path}, path};
  if (files.open != nullptr) {
    wanted.place = {files.open->listing.Descriptor(), file.GetName(), state == kSeenRegular};
    if (files.open->prefix + std::strlen(file.GetName()) > kLongestPath)
      wanted.place.name = nullptr;
  }
  unsigned char digest[kFileDigestSize];
  bool held = false;
  const int code = digester.Digest(wanted, digest, held);
  // These two end the verification; nothing was decided about the file.
  VESK2_REQUIRE(code != VESK2_ERR_USER_INTERRUPT, code);
  VESK2_REQUIRE(!LacksMemory(code), VESK2_ERR_MEM_ALLOC);
  state = held ? static_cast<int>(kHeldByOther) : code;
  if (code == 0 && !file.Equal(digest, static_cast<int>(kFileDigestSize))) state = kDiffers;
  return 0;
}

// Records what was found, in the order of a recursion through the listed directories. The recursion
// goes as deep as the listing nests, which its reader bounds.
class FindingTree {
 public:
  // Of files that were told of, the listing forgets what it says, unless it is to be kept: a
  // million records then stand where a million entries stood.
  FindingTree(DiskWalk& walk, Findings& findings, bool keepListing)
      : walk_(walk), findings_(findings), keepListing_(keepListing) {}

  // Collects the statuses found in one directory.
  [[nodiscard]] int Directory(StatusSet& statuses) {
    const std::unique_ptr<DirectoryFound> found = walk_.TakeFound();
    VESK2_TRY(Files(*found, statuses));
    if (!keepListing_) found->directory->GetFiles().clear();
    VESK2_TRY(Subdirectories(*found->directory, statuses));
    return Unlisted(*found, statuses);
  }

 private:
  [[nodiscard]] int Files(const DirectoryFound& found, StatusSet& statuses);
  [[nodiscard]] int Subdirectories(BodyDirectory& directory, StatusSet& statuses);
  [[nodiscard]] int Unlisted(DirectoryFound& found, StatusSet& statuses);

  DiskWalk& walk_;
  Findings& findings_;
  const bool keepListing_;
};

// A file that could not be opened is missing, as what is no regular file is: both are not there as
// a file. One that another process held is there, and so has changed as far as can be told. Both
// carry the reason.
int FindingTree::Files(const DirectoryFound& found, StatusSet& statuses) {
  const PointerArray<BodyObject>& files = found.directory->GetFiles();
  for (uint32_t i = 0; i < files.GetCount(); ++i) {
    const int state = found.files[i];
    if (state == kIgnored) continue;
    uint32_t status = state == kSame ? BodyObject::Valid : BodyObject::Invalid;
    if (state == VESK2_ERR_FILE_OPEN) status = BodyObject::Missing;
    const int reason = state == kHeldByOther ? static_cast<int>(VESK2_ERR_FILE_OPEN) : state;
    VESK2_TRY(findings_.AddFile(*found.directory, files.at(i)->GetName(), status, statuses,
                                state == kDiffers ? 0 : reason));
  }
  return 0;
}

// Inside first: what is in a directory decides about it.
int FindingTree::Subdirectories(BodyDirectory& directory, StatusSet& statuses) {
  IgnoreWalk ignore(directory.GetIgnored());
  PointerArray<BodyObject>& subdirectories = directory.GetSubdirectories();
  for (BodyObject* entry = subdirectories.begin(); entry != nullptr;
       entry = subdirectories.next()) {
    if (ignore.Ignores(entry->GetName())) continue;
    StatusSet inside;
    VESK2_TRY(Directory(inside));
    // A directory that only holds too much is itself recorded as too much; any other finding, a
    // missing file too, makes it invalid.
    uint32_t status = BodyObject::Invalid;
    if (inside.Code() == VESK2_ERR_EXTRA_FILES) status = BodyObject::Extra;
    if (inside.Code() == 0) status = BodyObject::Valid;
    VESK2_TRY(findings_.AddDirectory(entry->GetName(), status, statuses, inside.reason));
  }
  return 0;
}

// What the disk holds and nobody listed. An unlisted directory is named and not looked into: how
// much is in it is nobody's promise, and may be without end.
int FindingTree::Unlisted(DirectoryFound& found, StatusSet& statuses) {
  // The parent records it once more: callers see such a directory twice.
  if (found.reason != 0) {
    statuses.reason = found.reason;
    return findings_.AddDirectory(found.directory->GetName(), BodyObject::Invalid, statuses,
                                  found.reason);
  }
  // Each kind comes in ascending order of names, so each has a walk of its own.
  IgnoreWalk ignoredFiles(found.directory->GetIgnored());
  IgnoreWalk ignoredDirectories(found.directory->GetIgnored());
  for (const BodyObject* entry = found.unlisted.begin(); entry != nullptr;
       entry = found.unlisted.next()) {
    const char* const name = entry->GetName();
    const bool isDirectory = entry->GetIsDirectory();
    if ((isDirectory ? ignoredDirectories : ignoredFiles).Ignores(name)) continue;
    VESK2_TRY(isDirectory ? findings_.AddDirectory(name, BodyObject::Extra, statuses)
                          : findings_.AddFile(*found.directory, name, BodyObject::Extra, statuses));
  }
  return 0;
}

size_t CountFiles(BodyDirectory& directory) {
  size_t files = directory.GetFiles().GetCount();
  auto& below = directory.GetSubdirectories();
  for (BodyObject* each = below.begin(); each != nullptr; each = below.next()) {
    files += CountFiles(static_cast<BodyDirectory&>(*each));
  }
  return files;
}

}  // namespace

// Reading and comparing are two halves, since VerifyManifest tells in between how far the listing
// made sense.
int Manifest::Verify(ZvBuffer* body, const char* directoryPath) {
  std::unique_ptr<BodyDirectory> root;
  VESK2_TRY(ParseListing(root, body, directoryPath));
  return CheckListing(std::move(root));
}

// The root is named by the directory as the caller wrote it, so that results are paths that he can
// open.
int Manifest::ParseListing(std::unique_ptr<BodyDirectory>& out, ZvBuffer* body,
                           const char* directoryPath) {
  VESK2_REQUIRE(body != nullptr && directoryPath != nullptr, VESK2_ERR_PARAM_NULL);
  PointerArray<char> ignoreList;
  VESK2_TRY(BuildIgnoreList(directoryPath, ignoreList));
  std::unique_ptr<BodyDirectory> root(TryNew<BodyDirectory>(context));
  VESK2_REQUIRE(root, VESK2_ERR_MEM_ALLOC);
  root->SetName(ZVsysutil::zv_fstrdup(directoryPath));
  VESK2_REQUIRE(root->GetName() != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(root->ParseBody(body, &ignoreList));
  out = std::move(root);
  return 0;
}

// Findings are published when all of them are there. The listing is kept for who wants evidence,
// also of a comparison that was broken off.
int Manifest::CheckListing(std::unique_ptr<BodyDirectory> root) {
  ZVsysutil::ZvCall call;
  Findings findings;
  StatusSet statuses;
  listedFiles = CountFiles(*root);
  const Vesk2TaskRunner* const runner = taskRunner.run != nullptr ? &taskRunner : nullptr;
  FileHashing hashing(*root, *this, runner, call);
  int checked = hashing.Run(runner);
  const bool keep = evidence != nullptr;
  if (checked == 0) checked = FindingTree(hashing.Walk(), findings, keep).Directory(statuses);
  if (keep) listing = std::move(root);
  VESK2_TRY(checked);
  VESK2_TRY(Publish(findings));
  return statuses.Code();
}

}  // namespace ZvVesk2
