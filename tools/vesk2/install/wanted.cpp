// SPDX-License-Identifier: Apache-2.0
// wanted.cpp: a listing as a set of paths.
#include "tools/vesk2/install/wanted.h"

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/tree/names.h"

namespace vesk2_command {

using ZvVesk2::BodyDirectory;
using ZvVesk2::BodyObject;

Wanted::Wanted(BodyDirectory& listing, const std::string& path) { AddAll(listing, "", path); }

EntryKind Wanted::KindOf(const std::string& path) const {
  const auto found = entries_.find(path);
  return found != entries_.end() ? found->second : EntryKind::kOther;
}

void Wanted::Add(const std::string& path, EntryKind kind, const std::string& manifest) {
  const auto [place, isNew] = entries_.try_emplace(path, kind);
  if (place->second != kind) {
    throw FileTrouble(manifest, "lists " + Escape(path) + " as a file and as a directory",
                      "malformed");
  }
  if (isNew && kind == EntryKind::kFile) ++files_;
}

// The nesting of a listing is bounded by its reader.
void Wanted::AddAll(BodyDirectory& directory, const std::string& relative,
                    const std::string& manifest) {
  auto& files = directory.GetFiles();
  for (uint32_t i = 0; i < files.GetCount(); ++i) {
    Add(Join(relative, static_cast<BodyObject&>(*files.at(i)).GetName()), EntryKind::kFile,
        manifest);
  }
  auto& below = directory.GetSubdirectories();
  for (uint32_t i = 0; i < below.GetCount(); ++i) {
    auto& each = static_cast<BodyDirectory&>(*below.at(i));
    const std::string path = each.GetName();
    const std::string own = Join(relative, path.substr(path.rfind('/') + 1));
    Add(own, EntryKind::kDirectory, manifest);
    AddAll(each, own, manifest);
  }
}

}  // namespace vesk2_command
