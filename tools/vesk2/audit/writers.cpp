// SPDX-License-Identifier: Apache-2.0
// writers.cpp: who else can write the stores. Who can write an entry decides what is trusted; who
// can write a directory above can put another one in its place.
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <set>

#include "tools/vesk2/audit/checks.h"
#include "tools/vesk2/files/stores.h"

namespace vesk2_command {
namespace {

// Files and directories, each looked at once, whose owners are root, whoever asks, and `owner`.
class Writers {
 public:
  Writers(Findings& findings, uid_t owner) : findings_(findings), owner_(owner) {}

  // A directory of a store with what is in it, and what lies above.
  void LookAtStore(const std::string& directory) {
    std::error_code error;
    const std::filesystem::path real = std::filesystem::canonical(directory, error);
    if (error) return;  // not there, or told by who reads it
    for (std::filesystem::path above = real; above.has_relative_path();
         above = above.parent_path()) {
      LookAt(above);
    }
    LookAt("/");
    std::filesystem::directory_iterator each(real, error);
    for (; !error && each != std::filesystem::directory_iterator(); each.increment(error)) {
      LookAtFile(each->path());
    }
  }

 private:
  // A link is as good as what it leads to, and as the directory in which that lies.
  void LookAtFile(const std::filesystem::path& path) {
    std::error_code error;
    const std::filesystem::path real = std::filesystem::canonical(path, error);
    if (error) return;
    LookAt(real);
    for (std::filesystem::path above = real.parent_path(); above.has_relative_path();
         above = above.parent_path()) {
      LookAt(above);
    }
  }

  void LookAt(const std::filesystem::path& path) {
    struct stat status = {};
    if (!seen_.insert(path).second || stat(path.c_str(), &status) != 0) return;
    const std::string name = path.string();
    if (status.st_uid != 0 && status.st_uid != geteuid() && status.st_uid != owner_) {
      findings_.Add(
          "writable", name,
          "it belongs to the user " + std::to_string(status.st_uid) + ", who can change it");
    }
    // Of a directory with the sticky bit, others cannot replace what is not theirs.
    if (S_ISDIR(status.st_mode) && (status.st_mode & S_ISVTX) != 0) return;
    if ((status.st_mode & S_IWOTH) != 0) {
      findings_.Add("writable", name, "everybody can write it");
    } else if ((status.st_mode & S_IWGRP) != 0 && status.st_gid != 0) {
      findings_.Add("writable", name,
                    "the group " + std::to_string(status.st_gid) + " can write it");
    }
  }

  Findings& findings_;
  const uid_t owner_;
  std::set<std::filesystem::path> seen_;
};

// The user's store is its owner's, also when root looks at it.
uid_t OwnerOf(const std::string& path) {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 ? status.st_uid : geteuid();
}

}  // namespace

void CheckWriters(Findings& findings) {
  const std::string global = GlobalRoot(GetStoreOptions()).path;
  Writers machine(findings, 0);
  for (const char* below : {"", "/acl", "/cert"}) machine.LookAtStore(global + below);
  const std::string home = HomeRoot(GetStoreOptions()).path;
  if (home.empty() || home == global) return;
  Writers user(findings, OwnerOf(home));
  for (const char* below : {"", "/cert"}) user.LookAtStore(home + below);
}

}  // namespace vesk2_command
