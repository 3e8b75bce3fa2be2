// inspect.h: what the subcommands that look at certificates and revocation lists share: the parts
// of a chain, their texts, the time that is asked about and the ACL store.
#ifndef VESK2_TOOLS_INSPECT_H
#define VESK2_TOOLS_INSPECT_H

#include <string>
#include <vector>

#include "tools/vesk2/issue.h"

namespace vesk2_command {

// One triple of a certificate sequence, borrowed from it.
struct ChainLink {
  ZvVesk2::Cert* cert;
  ZvVesk2::Signature* signature;
  SExpression* extra;
};
// The links of a chain read from `path`; Trouble when there are none.
std::vector<ChainLink> ChainLinks(const CertChain& chain, const std::string& path);

// "sha256:" and a digest, of a key or of what a hash names; the members of a k-of-n.
std::string SubjectText(ZvVesk2::Subject& subject);
// "from STAMP until STAMP", as far as given; "at STAMP" for one moment.
std::string PeriodText(const TimeStamp* notBefore, const TimeStamp* notAfter);
// What a revocation element says after its keyword: the tag of the lists to ask.
std::string SourceText(SExpression& element);

// LoadAcls returns the entries of the ACL store; Trouble, and the reasons noted, when there are
// none.
Ref<SExpression> LoadAcls();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_INSPECT_H
