// SPDX-License-Identifier: Apache-2.0
// ignored_listing.cpp: looking for what is left out.
#include "tools/vesk2/tree/ignored_listing.h"

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/tree/names.h"

#include <vesk2/limits.h>

namespace vesk2_command {
namespace {

using ZvVesk2::BodyDirectory;
using ZvVesk2::BodyObject;

class Expansion {
 public:
  Expansion(const IgnoreRules& rules, std::string root) : rules_(rules), root_(std::move(root)) {}

  void Visit(BodyDirectory& directory, const std::string& relative) {
    std::set<std::string> listed;
    auto& files = directory.GetFiles();
    for (uint32_t i = 0; i < files.GetCount(); ++i) {
      const std::string name = static_cast<BodyObject&>(*files.at(i)).GetName();
      listed.insert(name);
      files_ += Asks(Join(relative, name), false) ? 1 : 0;
    }
    auto& below = directory.GetSubdirectories();
    for (uint32_t i = 0; i < below.GetCount(); ++i) {
      auto& each = static_cast<BodyDirectory&>(*below.at(i));
      const std::string path = each.GetName();
      listed.insert(path.substr(path.rfind('/') + 1));
      Asks(path, true) ? CountBelow(each) : Visit(each, path);
    }
    VisitDisk(listed, relative);
  }

  std::set<std::string> ignored;
  size_t files() const { return files_; }

 private:
  void CountBelow(BodyDirectory& directory) {
    files_ += directory.GetFiles().GetCount();
    auto& below = directory.GetSubdirectories();
    for (uint32_t i = 0; i < below.GetCount(); ++i) {
      CountBelow(static_cast<BodyDirectory&>(*below.at(i)));
    }
  }

  bool Asks(const std::string& relative, bool isDirectory) {
    const bool ignores = rules_.Ignores(relative, isDirectory);
    if (ignores) ignored.insert(relative);
    return ignores;
  }

  // What is not listed.
  void VisitDisk(const std::set<std::string>& listed, const std::string& relative) {
    std::vector<Name> names;
    (void)ReadNames(relative.empty() ? root_ : Join(root_, relative), names);
    for (const Name& name : names) {
      if (listed.count(name.text) != 0) continue;
      const std::string path = Join(relative, name.text);
      if (IgnoresEntry(rules_, Join(root_, path), path)) ignored.insert(path);
    }
  }

  const IgnoreRules& rules_;
  const std::string root_;
  size_t files_ = 0;  // that are listed and ignored
};

}  // namespace

IgnoredListing::IgnoredListing(const std::string& manifest, const IgnoreRules& rules,
                               const std::string& directory)
    : path_(manifest) {
  if (rules.IsEmpty()) return;
  copy_.Take(MemoryFile(ReadFile(manifest, ZvVesk2::Limits::kMaxFile)));
  path_ = copy_.Path();
  const SignatureBlock block = ReadSignatureBlock(path_);
  if (block.listing == nullptr) return;  // the verification says why
  Expansion expansion(rules, directory);
  expansion.Visit(*block.listing, "");
  ignored_ = std::move(expansion.ignored);
  files_ = expansion.files();
}

}  // namespace vesk2_command
