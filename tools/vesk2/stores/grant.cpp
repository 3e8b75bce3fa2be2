// SPDX-License-Identifier: Apache-2.0
// grant.cpp: entries of the ACL store.
#include "tools/vesk2/stores/grant.h"

#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/say/shell_words.h"

#include <vesk2/limits.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

// The library would drop directories from a name, and make the store even for a dry run.
std::string PathOf(const std::string& name) { return EntryPath(name, "--name " + Escape(name)); }

// A name that was given as a file's.
std::string NameWithout(const std::string& name) {
  return name.ends_with(".acl") ? name.substr(0, name.size() - 4) : name;
}

bool IsAlready(const std::string& path, const std::string& bytes) {
  std::error_code error;
  return std::filesystem::is_regular_file(path, error) &&
         std::filesystem::file_size(path, error) == bytes.size() && !error &&
         ReadFile(path, ZvVesk2::Limits::kMaxFile) == bytes;
}

// One entry that cannot be read back would stop the whole store from loading.
void ReadBack(const std::string& temporary) {
  const Ref<AclEntry> again(new AclEntry(nullptr));
  Check(again->Import(temporary.c_str()), "checking the new entry");
}

}  // namespace

std::string EntryPath(const std::string& name, const std::string& what) {
  if (name.find('/') != std::string::npos) throw Trouble(what + ": a name, not a path", "usage");
  if (name.empty() || name == "." || name == "..") {
    throw Trouble(what + ": cannot name an entry", "usage");
  }
  return AclDirectory() + "/" + name + (name.ends_with(".acl") ? "" : ".acl");
}

Ref<AclEntry> MakeEntry(EntryText text) {
  RequirePlainBounds(text.tag.get());
  return BuildEntry(std::move(text));
}

std::string FreeEntryName(AclEntry& entry, const std::string& name) {
  const std::string bytes = Canonical(entry);
  const auto isFree = [&](const std::string& each) {
    const std::string path = PathOf(each);
    std::error_code error;
    return !std::filesystem::exists(std::filesystem::symlink_status(path, error)) ||
           IsAlready(path, bytes);
  };
  std::string result = name;
  for (int number = 2; !isFree(result); ++number) result = name + "-" + std::to_string(number);
  return result;
}

std::string GrantEntry(AclEntry& entry, const EntryPlace& place) {
  const std::string path = PathOf(place.name);
  const std::string bytes = Canonical(entry);
  if (IsAlready(path, bytes)) {
    Note(Escape(path) + " says so already");
  } else {
    RefuseTaken(entry, place);
    WriteFile(path, bytes, {.flags = place.flags, .check = ReadBack, .inStore = true});
  }
  return std::filesystem::path(path).filename().string();
}

void RefuseTaken(AclEntry& entry, const EntryPlace& place) {
  const std::string path = PathOf(place.name);
  std::error_code error;
  const bool taken = std::filesystem::exists(std::filesystem::symlink_status(path, error));
  if (!taken || IsAlready(path, Canonical(entry))) return;
  if (place.flags.force) return RefuseExisting(path, true);
  // The entry that is there is trusted, and somebody meant it: the way out must not destroy it.
  throw FileTrouble(path,
                    "another entry has this name; beside it, --name " +
                        ShellWord(FreeEntryName(entry, NameWithout(place.name))),
                    "exists");
}

}  // namespace vesk2_command
