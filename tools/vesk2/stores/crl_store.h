// SPDX-License-Identifier: Apache-2.0
// crl_store.h: revocation lists and this machine's store: who is believed, which list it holds for
// a source, or why what lies there does not count, and what is kept. The library passes over a list
// that it cannot use: people must hear of it.
#ifndef VESK2_TOOLS_CRL_STORE_H
#define VESK2_TOOLS_CRL_STORE_H

#include <map>
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

// The lists by the canonical tags of their sources, borrowed; of null none.
std::map<std::string, CrlSequence*> ListsBySource(const SExpression* lists);

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

// ---- Offering lists ----

// Whether the text of a source's tag is short enough to name its list's file in the store.
bool NamesFile(SExpression* tag);

// WhyRefused says why the store must not take a list; empty when it is to decide by age.
std::string WhyRefused(CrlSequence& list, SExpression* acls);
// StoreCrl offers a list to the store: why it is not there now, or empty. `path` names it in
// trouble.
std::string StoreCrl(CrlSequence& list, SExpression* acls, const std::string& path);

// TrustSource makes this machine believe the issuer's lists of the source `tag`: it writes the ACL
// entry that is missing. Trouble when another key is believed for that source, since one decides.
void TrustSource(PublicKey& issuer, SExpression* tag, const std::string& keyName, bool dryRun);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRL_STORE_H
