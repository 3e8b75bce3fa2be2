// SPDX-License-Identifier: Apache-2.0
// stage.cpp: making an installation ready.
#include "tools/vesk2/install/stage.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <vector>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/leftovers.h"
#include "tools/vesk2/install/below.h"
#include "tools/vesk2/tree/names.h"

namespace vesk2_command {
namespace {

constexpr int kDirectory = O_RDONLY | O_DIRECTORY | O_NOFOLLOW;

std::string PathIn(int parent, const std::string& name) {
  return "/proc/self/fd/" + std::to_string(parent) + "/" + name;
}

}  // namespace

// ---- The directory -----------------------------------------------------------------------------

DrawnDirectory::DrawnDirectory(int parent, const std::string& above, const std::string& name)
    : parent_(parent) {
  // Whoever removes leftovers can find it before it is locked, and remove it: it is made anew.
  constexpr int kAttempts = 8;
  const std::string stem = StemOf(name);
  int error = EEXIST;
  for (int i = 0; i < kAttempts && error == EEXIST; ++i) error = Draw(stem);
  if (error != 0) throw FileTrouble(Join(above, name), std::strerror(error), "io");
}

// 0, EEXIST for a name that somebody else had or took, or another error.
int DrawnDirectory::Draw(const std::string& stem) {
  const std::string name = DrawName(stem);
  if (name.empty()) return EIO;
  if (mkdirat(parent_, name.c_str(), 0700) != 0) return errno;
  file_.Take(OpenBelow(parent_, name, kDirectory));
  int error = file_.get() >= 0 || errno == ENOENT ? 0 : errno;
  // Where there are no locks, nobody gets one.
  const bool taken = flock(file_.get(), LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK;
  if (error == 0 && (taken || !LeadsTo(parent_, name, file_.get()))) error = EEXIST;
  if (error == 0) {
    name_ = name;
  } else {
    (void)unlinkat(parent_, name.c_str(), AT_REMOVEDIR);
  }
  return error;
}

DrawnDirectory::~DrawnDirectory() {
  if (!name_.empty()) RemoveDrawn(parent_, name_, file_.get());
}

bool RemoveDrawn(int parent, const std::string& name, int file) {
  if (!LeadsTo(parent, name, file)) return false;
  std::error_code error;
  std::filesystem::remove_all(PathIn(parent, name), error);  // which follows no link
  return !error;
}

void RemoveLeftovers(int parent, const std::string& name) {
  const std::string stem = StemOf(name);
  std::vector<Name> names;
  (void)ReadNames(PathIn(parent, "."),
                  names);  // a leftover that stays is only a directory too many
  for (const Name& each : names) {
    if (!IsLeftover(each.text, stem)) continue;
    const Descriptor file(OpenBelow(parent, each.text, kDirectory));
    if (file.get() < 0 || flock(file.get(), LOCK_EX | LOCK_NB) != 0) continue;
    RemoveDrawn(parent, each.text, file.get());
  }
}

// ---- The stage ---------------------------------------------------------------------------------

namespace {

mode_t GetUmask() {
  const mode_t mask = umask(077);
  umask(mask);
  return mask;
}

}  // namespace

Stage::Stage(int parent, const std::string& above, const std::string& name)
    : above_(above), umask_(GetUmask()), directory_(parent, above, name) {
  DrawnDirectory other(parent, above, name);
  const std::string first = directory_.name();
  const std::string second = other.name();
  if (renameat2(parent, first.c_str(), parent, second.c_str(), RENAME_EXCHANGE) != 0) {
    throw FileTrouble(Join(above, name),
                      std::string("directories cannot be exchanged here: ") + std::strerror(errno),
                      "cannot-exchange");
  }
  directory_.Rename(second);
  other.Rename(first);
}

void Stage::Fail(const std::string& path) const {
  throw FileTrouble(Join(Join(above_, directory_.name()), path), std::strerror(errno), "io");
}

mode_t Stage::Mode(mode_t usual) const { return (usual & ~umask_) | (usual & 0700); }

void Stage::MakeDirectories(const Wanted& wanted) {
  for (const auto& [path, kind] : wanted.entries()) {
    if (kind != EntryKind::kDirectory) continue;
    if (mkdirat(directory_.file(), path.c_str(), 0700) != 0) Fail(path);
  }
}

void Stage::WriteFile(const std::string& path, bool executable,
                      const std::function<std::string_view()>& next) {
  constexpr int kFlags = O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW;
  const Descriptor file(OpenBelow(directory_.file(), path, kFlags, 0600));
  if (file.get() < 0) Fail(path);
  for (std::string_view bytes = next(); !bytes.empty(); bytes = next()) {
    while (!bytes.empty()) {
      const ssize_t written = write(file.get(), bytes.data(), bytes.size());
      if (written < 0 && errno == EINTR) continue;
      if (written <= 0) Fail(path);
      bytes.remove_prefix(static_cast<size_t>(written));
    }
  }
  if (fchmod(file.get(), Mode(executable ? 0755 : 0644)) != 0 || fsync(file.get()) != 0) Fail(path);
}

// What is in a directory is on the disk before it is opened to others, the stage itself last.
void Stage::Finish(const Wanted& wanted) {
  const auto finish = [&](int file, const std::string& path) {
    if (fchmod(file, Mode(0755)) != 0 || fsync(file) != 0) Fail(path);
  };
  for (auto entry = wanted.entries().rbegin(); entry != wanted.entries().rend(); ++entry) {
    if (entry->second != EntryKind::kDirectory) continue;
    const Descriptor directory(OpenBelow(directory_.file(), entry->first, kDirectory));
    if (directory.get() < 0) Fail(entry->first);
    finish(directory.get(), entry->first);
  }
  finish(directory_.file(), "");
}

}  // namespace vesk2_command
