// SPDX-License-Identifier: Apache-2.0
// Records of file names. Each gives its name in both string forms, because callers of the ASCII
// functions and of the others read the same lists. The layout is an old one that programs walk by
// themselves, so that each record holds all four names, of which the library fills two.
#include "src/frame/file_item.h"

#include <cstring>
#include <memory>
#include <new>
#include <utility>

#include "src/frame/check.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

constexpr uint32_t kRecordMark = 28;  // what callers test; not the size of the record here

// Where the name of a record stands that shares its memory.
char* BehindRecord(FileItem* item) { return reinterpret_cast<char*>(item + 1); }

}  // namespace

// The names are taken over when there is a record to hold them, and not before.
FileItem* FileItemCreate(char* name, char* nameA) {
  std::unique_ptr<FileItem> item(TryNew<FileItem>());
  if (item == nullptr) return nullptr;
  item->size = kRecordMark;
  item->name = name;
  item->nameA = nameA;
  // Both forms are the same bytes here, so one array serves for both: a tree has many names.
  if (nameA == nullptr) item->nameA = name;
  if (name == nullptr) item->name = nameA;
  return item.release();
}

// One piece for both: a verified tree has a record for each of its files, and the heads and the
// rounding of two pieces would be a quarter of what they take.
FileItem* FileItemOfPath(const char* directory, const char* name) {
  const size_t room = ZVsysutil::zv_fstrlen(directory) + 1 + std::strlen(name) + 1;
  void* const piece = ::operator new(sizeof(FileItem) + room, std::nothrow);
  if (piece == nullptr) return nullptr;
  auto* const item = new (piece) FileItem{};
  item->size = kRecordMark;
  item->name = item->nameA = BehindRecord(item);
  ZVsysutil::zv_concat_path_to(item->name, room, directory, name);
  return item;
}

// A loop and no recursion: a chain has as many records as a tree has files.
unsigned int FileItemDelete(FileItem* chain) {
  unsigned int count = 0;
  while (chain != nullptr) {
    FileItem* const item = std::exchange(chain, chain->next);
    // The ASCII forms go first: they are released by comparing them with the names.
    ZVsysutil::zv_ftoa_free(item->name, item->nameA);
    ZVsysutil::zv_ftoa_free(item->name2, item->name2A);
    if (item->name != BehindRecord(item)) delete[] item->name;
    delete[] item->name2;
    // Not a delete of the record's type, whose size a longer piece would not have.
    ::operator delete(item);
    ++count;
  }
  return count;
}

}  // namespace ZvVesk2
