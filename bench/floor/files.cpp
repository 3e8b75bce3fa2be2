// SPDX-License-Identifier: Apache-2.0
// Files and directories.
#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <string_view>

#include "bench/floor/floor.h"

namespace bench::floor {
namespace {

constexpr size_t kBlock = size_t{64} << 10;

// Reads a file to its end into a hash. A short read that brings all that the file held is the last.
bool HashOpen(int fd, size_t size, std::vector<unsigned char>& block, Sha256& hash,
              Digest& digest) {
  hash.Start();
  size_t taken = 0;
  ssize_t count = 0;
  while ((count = read(fd, block.data(), block.size())) > 0) {
    hash.Add(block.data(), static_cast<size_t>(count));
    taken += static_cast<size_t>(count);
    if (static_cast<size_t>(count) < block.size() && taken == size) break;
  }
  digest = hash.End();
  return count >= 0;
}

}  // namespace

bool HashFile(const char* path, Digest& digest) {
  std::vector<unsigned char> block(kBlock);
  Sha256 hash;
  struct stat about {};
  const int fd = open(path, O_RDONLY | O_CLOEXEC);
  const bool whole = fd >= 0 && fstat(fd, &about) == 0 &&
                     HashOpen(fd, static_cast<size_t>(about.st_size), block, hash, digest);
  close(fd);
  return whole;
}

bool CompareTree(const std::vector<ListedDirectory>& tree) {
  std::vector<unsigned char> block(kBlock);
  std::vector<std::string> names;
  Sha256 hash;
  bool same = true;
  for (const ListedDirectory& directory : tree) {
    DIR* const dir = opendir(directory.path.c_str());
    if (dir == nullptr) return false;
    names.clear();
    while (const dirent* entry = readdir(dir)) {
      if (entry->d_type == DT_REG) names.emplace_back(entry->d_name);
    }
    std::ranges::sort(names);
    same = same && names.size() == directory.files.size();
    for (size_t i = 0; same && i < names.size(); ++i) {
      const ListedFile& file = directory.files[i];
      const int fd = openat(dirfd(dir), names[i].c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW);
      struct stat about {};
      Digest digest;
      same = names[i] == file.name && fd >= 0 && fstat(fd, &about) == 0 &&
             HashOpen(fd, static_cast<size_t>(about.st_size), block, hash, digest) &&
             digest == file.digest;
      close(fd);
    }
    closedir(dir);
  }
  return same;
}

size_t ScanStore(const char* directory) {
  DIR* const dir = opendir(directory);
  if (dir == nullptr) return 0;
  size_t count = 0;
  while (const dirent* entry = readdir(dir)) {
    if (entry->d_type != DT_REG) continue;
    const int fd = openat(dirfd(dir), entry->d_name, O_RDONLY | O_CLOEXEC);
    std::array<char, 4096> block;
    if (fd >= 0 && read(fd, block.data(), block.size()) > 0) ++count;
    close(fd);
  }
  closedir(dir);
  return count;
}

}  // namespace bench::floor
