// grant.h: writing entries of this machine's ACL store: what `acl grant` and `manifest sign
// --grant` share.
#ifndef VESK2_TOOLS_GRANT_H
#define VESK2_TOOLS_GRANT_H

#include <string>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/objects/times.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

// MakeEntry builds the entry that trusts `subject` for a tag. Trouble for a tag with a bound that
// is none.
struct EntryText {
  Ref<ZvVesk2::Subject> subject;
  bool propagate = false;
  Ref<SExpression> tag;
  Period period = {};
  std::string comment = {};
};
Ref<ZvVesk2::AclEntry> MakeEntry(EntryText text);

struct EntryPlace {
  std::string name;  // of the entry: NAME.acl
  bool force = false;
  bool dryRun = false;
};
// FreeEntryName returns `name`, or `name`-2 and so on when another entry is there: one that none
// but an equal entry has.
std::string FreeEntryName(ZvVesk2::AclEntry& entry, const std::string& name);

// GrantEntry checks an entry and writes it into the machine's store, which it makes if need be. An
// equal entry of that name stays as it is.
void GrantEntry(ZvVesk2::AclEntry& entry, const EntryPlace& place);
// RefuseTaken is Trouble where GrantEntry would not replace another entry.
void RefuseTaken(ZvVesk2::AclEntry& entry, const EntryPlace& place);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_GRANT_H
