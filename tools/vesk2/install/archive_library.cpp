// SPDX-License-Identifier: Apache-2.0
#include "tools/vesk2/install/archive_library.h"

#include <dlfcn.h>

#include <optional>

#include "tools/vesk2/install/source.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// The library's own promise of what stays compatible; version 3 of it has no other name.
constexpr char kName[] = "libarchive.so.13";
static_assert(ARCHIVE_VERSION_NUMBER / 1000000 == 3);

template <typename Function>
bool Find(void* library, const char* name, Function& function) {
  function = reinterpret_cast<Function>(dlsym(library, name));
  return function != nullptr;
}

std::optional<ArchiveLibrary> Load() {
  // It stays: what it registered at the start of the process points into it.
  void* const library = dlopen(kName, RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE);
  if (library == nullptr) return std::nullopt;
  ArchiveLibrary found;
  bool whole = true;
#define VESK2_FIND(name) whole = Find(library, #name, found.name) && whole;
  VESK2_ARCHIVE_FUNCTIONS(VESK2_FIND)
#undef VESK2_FIND
  if (!whole) return std::nullopt;
  return found;
}

const std::optional<ArchiveLibrary>& Loaded() {
  static const std::optional<ArchiveLibrary> library = Load();
  return library;
}

}  // namespace

void LoadArchiveLibrary() { static_cast<void>(Loaded()); }

const ArchiveLibrary& Archives() {
  if (!Loaded()) throw Trouble(std::string("archives cannot be read: ") + kName + " is missing");
  return *Loaded();
}

}  // namespace vesk2_command
