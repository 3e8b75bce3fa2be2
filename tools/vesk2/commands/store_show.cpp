// SPDX-License-Identifier: Apache-2.0
// store_show.cpp: vesk2 store show.
#include <sys/stat.h>

#include <filesystem>
#include <functional>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/stores/crl_store.h"

namespace vesk2_command {
namespace {

// Reads a file of its kind and says what it holds; Trouble when it cannot be used.
using Reader = std::function<std::string(const std::string& path)>;

std::string Entry(const std::string& path) {
  const Ref<ZvVesk2::AclEntry> entry = ReadEntry(path);
  CheckEntry(*entry, path);
  return TagText(entry->GetTag());
}

std::string Chain(const std::string& path) {
  const CertChain chain = ReadCertChain(path);
  return TagText(ChainLinks(chain, path)[0].cert->GetTag());
}

// What a list says; Trouble for one that verifications ask for and pass over.
std::string List(const std::string& path, const Sources& sources) {
  const Ref<CrlSequence> list = ReadCrl(path);
  const Ref<SExpression> acls = sources.AclsFor(list->GetCert()->GetTag());
  if (acls->Count() < 2) return CrlText(*list) + "; no entry names this source";
  const std::string why = WhyListUnusable(*list, path, acls.get());
  if (!why.empty()) throw FileTrouble(path, "does not count: " + why, "unusable");
  return CrlText(*list);
}

void AddRoot(Sheet& sheet, const std::string& name, const StoreRoot& root) {
  sheet.AddRow(name, root.path.empty() ? "none" : Escape(root.path) + " (" + root.from + ")");
  sheet.AddMember(name + "_root", {{"path", Escape(root.path)}, {"from", root.from}});
}

// The files of one kind. Returns how many of them cannot be used.
size_t AddKind(Sheet& sheet, const std::string& directory, const char* kind, const char* extension,
               const Reader& read) {
  const std::vector<std::string> files = StoreFilesOf(directory, extension);
  sheet.AddRow(kind, std::to_string(files.size()));
  Json said = Json::array();
  size_t odd = 0;
  for (const std::string& path : files) {
    Json each = {{"file", Escape(path)}};
    try {
      const std::string says = read(path);
      each["says"] = says;
      sheet.AddLine("  " + Escape(std::filesystem::path(path).stem().string()) + ": " + says);
    } catch (const Trouble& trouble) {  // the others are still of interest
      Note(trouble.what());
      each["unreadable"] = trouble.reason;
      ++odd;
    }
    said.push_back(std::move(each));
  }
  sheet.AddMember(kind, std::move(said));
  return odd;
}

// Who else can write the entries decides what is trusted.
void WarnOfWriters() {
  struct stat status = {};
  if (stat(AclDirectory().c_str(), &status) != 0 || (status.st_mode & 022) == 0) return;
  Note("note: " + Escape(AclDirectory()) +
       " can be written by others than its owner: they decide what this machine trusts");
}

ExitCode Run() {
  const StoreRoot home = HomeRoot(GetStoreOptions());
  const StoreRoot global = GlobalRoot(GetStoreOptions());
  Sheet sheet("stores");
  AddRoot(sheet, "global", global);
  size_t odd = AddKind(sheet, AclDirectory(), "entries", ".acl", Entry);
  Ref<SExpression> acls;
  const int code = ZvVesk2::AclEntry::Import(acls.Out(), nullptr, nullptr);
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  const Sources sources(acls.get());  // none, if one of them was told as unreadable
  const auto list = [&sources](const std::string& path) { return List(path, sources); };
  odd += AddKind(sheet, ListDirectory(), "lists", ".crl", list);
  AddRoot(sheet, "home", home);
  if (!home.path.empty()) odd += AddKind(sheet, home.path + "/cert", "chains", ".cert", Chain);
  Present(sheet);
  WarnOfWriters();
  if (odd == 0) return kYes;
  throw Trouble("files in the stores that cannot be used: " + std::to_string(odd), "malformed");
}

}  // namespace

Action DefineStoreShow(OptionList&) { return Run; }

}  // namespace vesk2_command
