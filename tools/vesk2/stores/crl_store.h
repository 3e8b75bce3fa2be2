// crl_store.h: revocation lists and this machine's store: who is believed, and what is kept.
#ifndef VESK2_TOOLS_CRL_STORE_H
#define VESK2_TOOLS_CRL_STORE_H

#include <string>

#include "tools/vesk2/objects/crl_file.h"

namespace vesk2_command {

// Whether the text of a source's tag is short enough to name its list's file in the store.
bool NamesFile(SExpression* tag);

// WhyRefused says why the store must not take a list; empty when it is to decide by age.
std::string WhyRefused(CrlSequence& list, SExpression* acls);
// StoreCrl offers a list to the store: why it is not there now, or empty. `path` names it in
// trouble.
std::string StoreCrl(CrlSequence& list, SExpression* acls, const std::string& path);

// TrustSource makes this machine believe the issuer's lists of the source `tag`: it writes the ACL
// entry that is missing. Trouble when another key is believed for that source, since one decides.
void TrustSource(PublicKey& issuer, SExpression* tag, const std::string& keyPath, bool dryRun);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRL_STORE_H
