// crl_stored.h: the revocation list that the store holds for a source, or why what lies there does
// not count. The library passes over a list that it cannot use: people must hear of it.
#ifndef VESK2_TOOLS_CRL_STORED_H
#define VESK2_TOOLS_CRL_STORED_H

#include <string>
#include <unordered_map>

#include "tools/vesk2/objects/crl_file.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

// The last entry of each revocation tag: it alone decides whose lists count. Where there are as
// many lists as entries, no list may be proved against all of them.
class Sources {
 public:
  explicit Sources(SExpression* acls);  // null for none

  // (acl ENTRY) of the entry for a tag, or (acl).
  Ref<SExpression> AclsFor(SExpression* tag) const;

 private:
  std::unordered_map<std::string, Ref<ZvVesk2::AclEntry>> last_;
};

struct StoredList {
  Ref<CrlSequence> list;  // null: there is none, or none that can be read
  std::string problem;    // why it does not count, with the file's name; empty when it does
  bool unread = false;    // it is there and cannot be opened: what it revokes is not known
};
// FindStored reads the stored list of the source `tag`, and proves it unless `acls` is null.
StoredList FindStored(SExpression* tag, SExpression* acls);

// WhyListUnusable says why verifications pass over a list of the store, whose file is `path`; empty
// when they do not.
std::string WhyListUnusable(CrlSequence& list, const std::string& path, SExpression* acls);

// The file that keeps the list of a source (null: none); empty for a tag that names none.
std::string ListPath(SExpression* tag);
// The directory of the stored lists.
std::string ListDirectory();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRL_STORED_H
