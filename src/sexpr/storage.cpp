// SPDX-License-Identifier: Apache-2.0
// Objects as files: where an object of a class lies, and writing it there.
//
//   <root>/<directory>/<base name><extension>    in a store
//   <name><extension>                            as a path of its own
//
// The extension is appended unless the name ends in it already. So in the home store /h an entry
// "x/y/root" lies at /h/acl/root.acl, and "root.txt" at /h/acl/root.txt.acl.
//
// The rule for names is the store's guard: inside a store only the last component of a name counts,
// so that no name, whoever chose it, leads to another directory. A name without one is refused, and
// so is a path that would have to be cut.
#include <vesk2/context.h>
#include <vesk2/expression.h>

#include <cstring>
#include <initializer_list>
#include <memory>

#include "src/frame/check.h"
#include "src/platform/file.h"
#include "src/platform/text.h"
#include "src/sexpr/storage.h"

namespace ZvVesk2 {
namespace {

// The joined directory leaves room for the separator behind it.
constexpr size_t kStoreDirectoryBuffer = Limits::kPathBuffer - 2;

bool IsEmpty(const char* text) {
  return text == nullptr || ZVsysutil::zv_filenamecmp(text, "") == 0;
}

// Every type but the global one means the home store: callers pass numbers that are none.
const char* Root(StorageType type) {
  return type == StorageGlobal ? VeskConf::GetGlobalDirectory() : VeskConf::GetHomeDirectory();
}

// What lies in the home store is its user's alone; in the global one it is there for everybody.
[[nodiscard]] int MakeDirectory(const char* path, StorageType type) {
  constexpr mode_t kPrivate = 0700;
  return ZVsysutil::zv_mkdir(path,
                             type == StorageGlobal ? ZVsysutil::kZvSharedDirectory : kPrivate);
}

// Whether the last component of a name names a file; the others would lead out of the store.
bool IsFileName(const char* name) {
  for (const char* refused : {"", ".", "..", "/"}) {
    if (ZVsysutil::zv_filenamecmp(name, refused) == 0) return false;
  }
  return true;
}

// A class without a directory of its own (keys, requests) lies where its name says, whatever its
// storage type.
bool HasStore(const char* dirName, StorageType type) {
  return type != StoragePath && !IsEmpty(dirName);
}

// Writes the path of `name` in a store, without extension. False when there is no such path, or it
// would have to be cut: a cut path is another file's.
bool StorePath(char (&path)[Limits::kPathBuffer], const char* dirName, const char* name,
               StorageType type) {
  char base[Limits::kPathBuffer];
  if (!ZVsysutil::zv_basename(name, base, sizeof base) || !IsFileName(base)) return false;
  const char* root = Root(type);
  if (IsEmpty(root)) return false;  // never the current directory instead
  if (!ZVsysutil::zv_concat_path_to(path, kStoreDirectoryBuffer, root, dirName)) return false;
  size_t length = std::strlen(path);
  path[length++] = '/';
  return ZVsysutil::zv_fstrcpy(path + length, sizeof path - length, base);
}

}  // namespace

int StoreDirectory(std::unique_ptr<char[]>& out, const char* dirName, StorageType type) {
  char path[Limits::kPathBuffer] = ".";
  if (HasStore(dirName, type)) {
    const char* root = Root(type);
    VESK2_REQUIRE(!IsEmpty(root), VESK2_ERR_FIND_DIR);
    VESK2_REQUIRE(ZVsysutil::zv_concat_path_to(path, sizeof path, root, dirName),
                  VESK2_ERR_FIND_DIR);
  }
  out.reset(ZVsysutil::zv_fstrdup(path));
  return out ? 0 : VESK2_ERR_MEM_ALLOC;
}

int FilePath(std::unique_ptr<char[]>& out, const char* dirName, const char* extension,
             const char* name, StorageType type) {
  VESK2_REQUIRE(name != nullptr && extension != nullptr, VESK2_ERR_FILE_OPEN);
  char path[Limits::kPathBuffer];
  const bool whole = HasStore(dirName, type) ? StorePath(path, dirName, name, type)
                                             : ZVsysutil::zv_fstrcpy(path, sizeof path, name);
  VESK2_REQUIRE(whole, VESK2_ERR_FILE_OPEN);
  // Only this very extension counts: "a.txt" becomes "a.txt.acl".
  const char* present = ZVsysutil::zv_extname(path);
  const bool extended = present != nullptr && ZVsysutil::zv_filenamecmp(present, extension) == 0;
  out.reset(extended ? ZVsysutil::zv_fstrdup(path) : ZVsysutil::zv_concat_string(path, extension));
  return out ? 0 : VESK2_ERR_MEM_ALLOC;
}

char* SExpression::CalcDir(const char* dirName, StorageType type) {
  std::unique_ptr<char[]> directory;
  return StoreDirectory(directory, dirName, type) == 0 ? directory.release() : nullptr;
}

// Computing a path makes its directory, unlike FilePath: programs compute the path of a new object
// and write there.
char* SExpression::CalcPath(const char* dirName, const char* extension, const char* name,
                            StorageType type) {
  std::unique_ptr<char[]> path;
  if (FilePath(path, dirName, extension, name, type) != 0) return nullptr;
  if (HasStore(dirName, type)) {
    std::unique_ptr<char[]> directory;
    if (StoreDirectory(directory, dirName, type) != 0) return nullptr;
    (void)MakeDirectory(directory.get(), type);  // where it cannot be made, opening the file tells
  }
  return path.release();
}

void SExpression::SetStorageType(StorageType type) { storageType = type; }

int SExpression::SetFileName(const char* name) {
  VESK2_REQUIRE(name != nullptr, VESK2_ERR_INVALID_PARAM);
  // `name` may be the file name that is replaced.
  const std::unique_ptr<char[]> replaced(fileName);
  fileName = CalcPath(DirectoryName(), ExtensionName(), name, storageType);
  return fileName != nullptr ? 0 : VESK2_ERR_MEM_ALLOC;
}

// For a path that was computed already, or that the caller gave as it is to be used.
int SExpression::SetFilePath(const char* path) {
  VESK2_REQUIRE(path != nullptr, VESK2_ERR_INVALID_PARAM);
  const std::unique_ptr<char[]> replaced(fileName);
  fileName = ZVsysutil::zv_fstrdup(path);
  return fileName != nullptr ? 0 : VESK2_ERR_MEM_ALLOC;
}

int SExpression::CreateFileDirectory() {
  if (storageType == StoragePath) return 0;
  VESK2_REQUIRE(storageType == StorageGlobal || storageType == StorageHome, VESK2_ERR_FIND_DIR);
  if (IsEmpty(DirectoryName())) return 0;
  std::unique_ptr<char[]> directory;
  VESK2_TRY(StoreDirectory(directory, DirectoryName(), storageType));
  return MakeDirectory(directory.get(), storageType);
}

// A store's file is opened so that no link is followed: others may write beside it, and an object
// must not overwrite what a link of theirs points at. A path of its own is the caller's choice, so
// a link there is meant. The first failure is returned, and the file is closed in any case.
int SExpression::Export(const char* name) {
  VESK2_TRY(CreateFileDirectory());
  if (name != nullptr) VESK2_TRY(SetFileName(name));
  const bool isOwnPath = storageType == StoragePath || IsEmpty(DirectoryName());
  const int stored =
      storageType == StorageGlobal ? ZVsysutil::ZV_WRITE_SHARED : ZVsysutil::ZV_WRITE_STORE;
  ZVsysutil::ZvFileOwner file;
  const int opened = ZVsysutil::zv_open(file, fileName, isOwnPath ? ZVsysutil::ZV_WRITE : stored);
  // Whatever stops the opening is one code, but not a lack of memory: it is no fault of the path.
  VESK2_REQUIRE(opened != VESK2_ERR_MEM_ALLOC, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(opened == 0, VESK2_ERR_FILE_OPEN);
  const int printed = PrintCanonical(ZVsysutil::zv_stream(file.get()));
  const int closed = ZVsysutil::zv_close(file.release());
  return printed ? printed : closed;
}

bool SExpression::Exists() {
  struct stat ignored {};
  return fileName != nullptr && ZVsysutil::zv_stat(fileName, &ignored) == 0;
}

char* SExpression::BaseName() { return ZVsysutil::zv_basename(fileName); }

}  // namespace ZvVesk2
