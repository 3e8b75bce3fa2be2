// store_show.cpp: vesk2 store show.
#include <sys/stat.h>

#include <filesystem>

#include "tools/vesk2/acl_file.h"
#include "tools/vesk2/command.h"
#include "tools/vesk2/describe.h"
#include "tools/vesk2/stores.h"

namespace vesk2_command {
namespace {

// Reads a file of its kind and says what it holds; Trouble when it cannot be used.
using Reader = std::string (*)(const std::string& path);

std::string Entry(const std::string& path) {
  const Ref<ZvVesk2::AclEntry> entry = ReadEntry(path);
  CheckEntry(*entry, path);
  return TagText(entry->GetTag());
}

std::string Chain(const std::string& path) {
  const CertChain chain = ReadCertChain(path);
  return TagText(ChainLinks(chain, path)[0].cert->GetTag());
}

std::string List(const std::string& path) { return CrlText(*ReadCrl(path)); }

void AddRoot(Sheet& sheet, const std::string& name, const StoreRoot& root) {
  sheet.AddRow(name, root.path.empty() ? "none" : Escape(root.path) + " (" + root.from + ")");
  sheet.AddMember(name + "_root", {{"path", Escape(root.path)}, {"from", root.from}});
}

// The files of one kind. Returns how many of them cannot be used.
size_t AddKind(Sheet& sheet, const std::string& directory, const char* kind, const char* extension,
               Reader read) {
  std::error_code error;
  std::vector<std::string> files;
  if (std::filesystem::exists(directory, error)) files = FilesOf(directory, extension);
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
  odd += AddKind(sheet, global.path + "/cert", "lists", ".crl", List);
  AddRoot(sheet, "home", home);
  if (!home.path.empty()) odd += AddKind(sheet, home.path + "/cert", "chains", ".cert", Chain);
  Present(sheet);
  WarnOfWriters();
  if (odd == 0) return kYes;
  throw Trouble("files in the stores that cannot be used: " + std::to_string(odd), "malformed");
}

}  // namespace

Action DefineStoreShow(CLI::App&) { return Run; }

}  // namespace vesk2_command
