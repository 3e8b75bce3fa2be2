// SPDX-License-Identifier: Apache-2.0
// acl_list.cpp: vesk2 acl list.
#include <filesystem>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

ExitCode Run() {
  Sheet sheet("acl-store");
  sheet.StartList("entries");
  Json unreadable = Json::array();
  for (const std::string& path : FilesOf(AclDirectory(), ".acl")) {
    const std::string name = Escape(std::filesystem::path(path).stem().string());
    try {
      const Ref<ZvVesk2::AclEntry> entry = ReadEntry(path);
      CheckEntry(*entry, path);
      sheet.AddPart("entries", name,
                    DescribeEntry(*entry, std::filesystem::path(path).filename().string()));
    } catch (const Trouble& trouble) {  // the others are still of interest
      Note(trouble.what());
      unreadable.push_back({{"file", Escape(path)}, {"reason", trouble.reason}});
    }
  }
  const size_t odd = unreadable.size();
  if (sheet.rows().empty()) Note(Escape(AclDirectory()) + ": no entry; nothing is trusted");
  sheet.AddMember("unreadable", std::move(unreadable));
  Present(sheet);
  if (odd == 0) return kYes;
  throw Trouble("files in the ACL store that verifications cannot use: " + std::to_string(odd),
                "malformed");
}

}  // namespace

Action DefineAclList(OptionList&) { return Run; }

}  // namespace vesk2_command
