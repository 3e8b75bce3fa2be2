// SPDX-License-Identifier: Apache-2.0
// acl_file.h: ACL entries, and the files that hold them.
#ifndef VESK2_TOOLS_ACL_FILE_H
#define VESK2_TOOLS_ACL_FILE_H

#include <string>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

// What an entry that trusts `subject` for a tag says.
struct EntryText {
  Ref<ZvVesk2::Subject> subject;
  bool propagate = false;
  Ref<SExpression> tag;
  Period period = {};
  std::string comment = {};
};
Ref<ZvVesk2::AclEntry> BuildEntry(EntryText text);

// ReadEntry reads an entry as the store's reader does, which does not look past its end. Trouble
// names the byte.
Ref<ZvVesk2::AclEntry> ReadEntry(const std::string& path);
// CheckEntry is Trouble for an entry that would stop every verification if it lay in the store:
// some that can be read are nothing that a reduction can work on.
void CheckEntry(ZvVesk2::AclEntry& entry, const std::string& path);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_ACL_FILE_H
