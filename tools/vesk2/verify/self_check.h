// SPDX-License-Identifier: Apache-2.0
// self_check.h: what a command that signs or grants says of its own work before it writes it: what
// it makes can be well formed, and be refused by everybody.
#ifndef VESK2_TOOLS_SELF_CHECK_H
#define VESK2_TOOLS_SELF_CHECK_H

#include <string>
#include <vector>

#include "tools/vesk2/keys/issue.h"
#include "tools/vesk2/options/options.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

void AddStrictFlag(OptionList& list, bool& strict);

class SelfCheck {
 public:
  SelfCheck();

  void Add(const std::string& warning) { warnings_.push_back(warning); }
  // An end that has passed, of what `what` names.
  void End(const std::string& what, const TimeStamp* notAfter);

  // The certificates of the file `path` that stand between those who trust the last issuer and
  // what is made now.
  struct Chain {
    std::string path;
    std::vector<SignedCert> certs;
    std::vector<Ref<PublicKey>> signers = {};  // who sign below it; none: nobody does now
    SExpression* tag = nullptr;                // what is to be granted; null for whatever is
    const TimeStamp* at = nullptr;             // when it is used; null for now
    size_t passing = 0;  // how many at its beginning need not let their subjects pass it on
  };
  void CheckChain(const Chain& chain);

  // Tell notes the warnings. With `strict` any is Trouble.
  void Tell(bool strict) const;

 private:
  void CheckPeriod(const std::string& name, const ZvVesk2::Cert& cert, const TimeStamp* at);

  Ref<TimeStamp> now_;
  std::vector<std::string> warnings_;
};

// CheckGrant warns of an entry that grants nothing; `place` is the FILE[:N] that its key was read
// from, the issuer's or the subject's, or empty.
void CheckGrant(ZvVesk2::AclEntry& entry, const std::string& place, bool issuer, bool strict);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SELF_CHECK_H
