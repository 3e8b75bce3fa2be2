// SPDX-License-Identifier: Apache-2.0
// leftovers.cpp: drawing temporary names, and removing what has one.
#include "tools/vesk2/files/leftovers.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <memory>

#include "tools/vesk2/files/descriptor.h"

namespace vesk2_command {
namespace {

constexpr std::string_view kMark = ".tmp-";
constexpr size_t kRandomBytes = 16;
constexpr size_t kMaxFileName = 255;

struct Close {
  void operator()(DIR* directory) const { closedir(directory); }
};

// The lock says that its writer is dead; the second look, that the name is still the file's. The
// directory may hold anything by such a name.
void RemoveIfDead(int directory, const char* name) {
  constexpr int kFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC | O_NOCTTY;
  const Descriptor file(openat(directory, name, kFlags));
  if (file.get() < 0 || flock(file.get(), LOCK_EX | LOCK_NB) != 0) return;
  struct stat opened = {};
  struct stat named = {};
  const bool same = fstat(file.get(), &opened) == 0 &&
                    fstatat(directory, name, &named, AT_SYMLINK_NOFOLLOW) == 0 &&
                    opened.st_dev == named.st_dev && opened.st_ino == named.st_ino;
  if (same && S_ISREG(opened.st_mode)) (void)unlinkat(directory, name, 0);
}

}  // namespace

// A name that would grow too long is shortened, the mark and the random part never are.
std::string StemOf(const std::string& name) {
  constexpr size_t kMost = kMaxFileName - kMark.size() - 2 * kRandomBytes;
  return name.substr(0, kMost) + std::string(kMark);
}

std::string DrawName(const std::string& stem) {
  unsigned char random[kRandomBytes];
  if (getrandom(random, sizeof random, 0) != sizeof random) return {};
  std::string name = stem;
  for (const unsigned char byte : random) {
    name += "0123456789abcdef"[byte >> 4];
    name += "0123456789abcdef"[byte & 15];
  }
  return name;
}

bool IsLeftover(std::string_view name, const std::string& stem) {
  return name.size() == stem.size() + 2 * kRandomBytes && name.starts_with(stem) &&
         name.find_first_not_of("0123456789abcdef", stem.size()) == std::string_view::npos;
}

void RemoveLeftoverFiles(const std::string& path) {
  const std::filesystem::path parent = std::filesystem::path(path).parent_path();
  const std::unique_ptr<DIR, Close> directory(opendir(parent.empty() ? "." : parent.c_str()));
  if (!directory) return;
  const std::string stem = StemOf(std::filesystem::path(path).filename());
  while (const dirent* const entry = readdir(directory.get())) {
    if (IsLeftover(entry->d_name, stem)) RemoveIfDead(dirfd(directory.get()), entry->d_name);
  }
}

}  // namespace vesk2_command
