// SPDX-License-Identifier: Apache-2.0
// signer_chains.h: the certificates that speak for a key that signs or approves a manifest, as
// --cert names them: those of chains whose first certificate is for that key, and of manifests that
// it signed.
#ifndef VESK2_TOOLS_SIGNER_CHAINS_H
#define VESK2_TOOLS_SIGNER_CHAINS_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/verify/self_check.h"

namespace vesk2_command {

// ReadSignerChains returns the certificates of all the files, joined; none for no file. Trouble for
// a file about another key.
std::vector<SignedCert> ReadSignerChains(const std::vector<std::string>& paths, PublicKey& signer);

// CheckSignerChains adds warnings of what nobody will believe: certificates that do not lead to the
// signer, or not to `tag` (null: to what they grant) at the moment `at`.
void CheckSignerChains(SelfCheck& check, const std::vector<std::string>& paths,
                       const Ref<PublicKey>& signer, SExpression* tag, const TimeStamp* at);

// Whether a certificate of a manifest is for its content, as the signer's and those of the keys
// that approved it are.
bool IsForContent(const SignatureBlock& block, const ZvVesk2::Cert& cert);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SIGNER_CHAINS_H
