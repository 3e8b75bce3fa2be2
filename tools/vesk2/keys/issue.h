// SPDX-License-Identifier: Apache-2.0
// issue.h: making certificates: what `cert issue`, `cert request`, `crl issue` and `manifest sign`
// share.
#ifndef VESK2_TOOLS_ISSUE_H
#define VESK2_TOOLS_ISSUE_H

#include <memory>
#include <string>
#include <vector>

#include "tools/vesk2/keys/keys.h"
#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/grant_terms.h"
#include "tools/vesk2/options/options.h"

#include <vesk2/cert.h>

namespace vesk2_command {

// The keys that sign, and how.
struct SignerOptions {
  std::vector<std::string> keys;
  std::string algorithm;  // empty: what the key does unless told
  std::string program;    // that has the private keys; `keys` are then the public ones
  PassphraseOptions passphrase;
};
enum class SignerCount { kOne, kSeveral };
void AddSignerOptions(OptionList& list, SignerOptions& options,
                      SignerCount count = SignerCount::kOne);
// OpenSigner returns the signer of one of the keys, by default the only one.
std::unique_ptr<SigningKey> OpenSigner(const SignerOptions& options, size_t index = 0);

SignedCert IssueCert(const SigningKey& key, const Grant& grant, const std::string& algorithm);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_ISSUE_H
