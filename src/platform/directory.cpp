// ZvDir: the names of one directory, all read and sorted when it is opened.
#include <dirent.h>
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <memory>
#include <new>
#include <string_view>

#include "src/platform/file.h"
#include "src/platform/text.h"

namespace ZVsysutil {
namespace {

struct DirCloser {
  void operator()(DIR* dir) const { closedir(dir); }
};

// "*" and what follows it: a suffix. Anything else is a name.
bool Matches(std::string_view pattern, std::string_view name) {
  if (name == "." || name == "..") return false;
  if (!pattern.starts_with('*')) return name == pattern;
  return name.ends_with(pattern.substr(1));
}

}  // namespace

int ZvDir::open(const char* directory, const char* pattern) {
  close();
  const int code = Load(directory, pattern);
  if (code != 0) close();
  return code;
}

int ZvDir::Load(const char* directory, const char* pattern) {
  if (directory == nullptr || pattern == nullptr) return VESK2_ERR_FIND_DIR;
  const std::unique_ptr<DIR, DirCloser> dir(opendir(directory));
  if (dir == nullptr) return zv_error_code(errno, VESK2_ERR_FIND_DIR);
  directory_ = zv_fstrdup(directory);
  if (directory_ == nullptr) return VESK2_ERR_MEM_ALLOC;
  errno = 0;
  while (const dirent* entry = readdir(dir.get())) {
    if (Matches(pattern, entry->d_name)) {
      if (const int code = Add(entry->d_name, entry->d_type == DT_REG)) return code;
    }
    errno = 0;
  }
  // A list cut short would hide files.
  if (errno != 0) return zv_error_code(errno, VESK2_ERR_FIND_DIR);
  zv_sort(entries_, count_, sizeof(Entry), [](const void* a, const void* b) {
    return std::strcmp(static_cast<const Entry*>(a)->name, static_cast<const Entry*>(b)->name);
  });
  return 0;
}

int ZvDir::Add(const char* name, bool regular) {
  if (count_ == capacity_) {
    const size_t larger = capacity_ > 0 ? 2 * capacity_ : 32;
    Entry* entries = new (std::nothrow) Entry[larger];
    if (entries == nullptr) return VESK2_ERR_MEM_ALLOC;
    std::copy_n(entries_, count_, entries);
    delete[] entries_;
    entries_ = entries;
    capacity_ = larger;
  }
  char* copy = zv_fstrdup(name);
  if (copy == nullptr) return VESK2_ERR_MEM_ALLOC;
  entries_[count_++] = {copy, regular};
  return 0;
}

const char* ZvDir::read(bool fullPath) {
  failed_ = false;
  if (cursor_ == count_) return nullptr;
  const char* name = entries_[cursor_++].name;
  if (!fullPath) return name;
  delete[] path_;
  path_ = zv_join_path(directory_, name);
  failed_ = path_ == nullptr;
  return path_;
}

void ZvDir::close() {
  for (size_t i = 0; i < count_; ++i) delete[] entries_[i].name;
  delete[] entries_;
  delete[] directory_;
  delete[] path_;
  entries_ = nullptr;
  directory_ = nullptr;
  path_ = nullptr;
  count_ = capacity_ = cursor_ = 0;
  failed_ = false;
}

}  // namespace ZVsysutil
