// SPDX-License-Identifier: Apache-2.0
// acl_store.cpp: loading the ACL store.
#include "tools/vesk2/stores/acl_store.h"

#include <filesystem>

#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

using ZvVesk2::AclEntry;

namespace {

bool HoldsNoEntry(const std::string& directory, bool mayBeAbsent) {
  std::error_code error;
  std::filesystem::directory_iterator file(directory, error);
  if (error) return mayBeAbsent && error == std::errc::no_such_file_or_directory;
  for (; !error && file != std::filesystem::directory_iterator(); file.increment(error)) {
    if (file->path().string().ends_with(".acl")) return false;
  }
  return !error;
}

}  // namespace

Ref<SExpression> LoadAcls() {
  Ref<SExpression> acls;
  const int code = AclEntry::Import(acls.Out(), nullptr, nullptr);
  if (code == 0) return acls;
  ThrowNoStore(code);
}

std::vector<std::string> ExplainStore() {
  std::vector<std::string> reasons;
  std::error_code error;
  std::filesystem::directory_iterator files(AclDirectory(), error);
  if (error) return {Escape(AclDirectory()) + ": " + error.message()};
  bool any = false;
  for (const auto& file : files) {
    const std::string path = file.path().string();
    if (!path.ends_with(".acl")) continue;
    any = true;
    const Ref<AclEntry> entry(new AclEntry(nullptr));
    const int code = entry->Import(path.c_str());
    if (code != 0) reasons.push_back(Escape(path) + ": " + Reason(code));
  }
  if (!any) reasons.push_back(Escape(AclDirectory()) + ": holds no entry (*.acl)");
  return reasons;
}

bool HasNoStore(const std::string& extraDirectory) {
  return HoldsNoEntry(AclDirectory(), true) &&
         (extraDirectory.empty() || HoldsNoEntry(extraDirectory, false));
}

void ThrowNoStore(int code) {
  for (const std::string& reason : ExplainStore()) Note(reason);
  if (HasNoStore("")) TellHowToTrust();
  Trouble trouble("the ACL store cannot be loaded; nothing is trusted (" + CodeName(code) + ")",
                  "no-acl-store");
  trouble.code = code;
  throw trouble;
}

void TellHowToTrust() {
  Note(
      "vesk2 acl grant and acl install make entries; --global and VESK2_GLOBAL name another store");
}

Ref<SExpression> NoEntries(const std::string& extraDirectory, int code) {
  if (!HasNoStore(extraDirectory)) ThrowNoStore(code);
  TellHowToTrust();
  return ListOf({}, "acl");
}

}  // namespace vesk2_command
