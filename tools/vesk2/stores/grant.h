// SPDX-License-Identifier: Apache-2.0
// grant.h: writing entries of this machine's ACL store: what `acl grant` and `manifest sign
// --grant` share.
#ifndef VESK2_TOOLS_GRANT_H
#define VESK2_TOOLS_GRANT_H

#include <string>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/acl_file.h"

namespace vesk2_command {

// MakeEntry is BuildEntry, with Trouble for a tag with a bound that is none.
Ref<ZvVesk2::AclEntry> MakeEntry(EntryText text);

// EntryPath returns the path of the entry NAME.acl. Trouble, which begins with `what`, for what is
// no name.
std::string EntryPath(const std::string& name, const std::string& what);

struct EntryPlace {
  std::string name;  // of the entry: NAME.acl
  WriteFlags flags = {};
};
// FreeEntryName returns `name`, or `name`-2 and so on when another entry is there: one that none
// but an equal entry has.
std::string FreeEntryName(ZvVesk2::AclEntry& entry, const std::string& name);

// GrantEntry checks an entry and writes it into the machine's store, which it makes if need be. An
// equal entry of that name stays as it is. Returns the name of its file.
std::string GrantEntry(ZvVesk2::AclEntry& entry, const EntryPlace& place);
// RefuseTaken is Trouble where GrantEntry would not replace another entry.
void RefuseTaken(ZvVesk2::AclEntry& entry, const EntryPlace& place);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_GRANT_H
