// SPDX-License-Identifier: Apache-2.0
// key_source.h: public keys named by where they stand: the issuer or subject of a certificate in a
// chain, a manifest or a revocation list, so that nobody has to extract a key to trust it.
#ifndef VESK2_TOOLS_KEY_SOURCE_H
#define VESK2_TOOLS_KEY_SOURCE_H

#include <string>
#include <vector>

#include "tools/vesk2/keys/issue.h"

namespace vesk2_command {

// FILE or FILE:N. `number` counts from 1; 0 when none was given.
struct Place {
  std::string path;
  size_t number = 0;
};
Place ParsePlace(const std::string& argument);

// ReadCerts reads the certificates of a chain, a manifest or a revocation list, with their
// signatures, in the order of the file. Trouble when there are none.
std::vector<SignedCert> ReadCerts(const std::string& path);
// RequireCert throws Trouble unless `certs`, of `path`, have a certificate of that number.
void RequireCert(const std::vector<SignedCert>& certs, size_t number, const std::string& path);

// ReadKeyOf reads the issuer or the subject of the N-th certificate of FILE[:N]: by default of the
// last for an issuer, where a chain has its root, and of the first for a subject; the subject of a
// manifest is its signer. Trouble when it is no key.
Ref<PublicKey> ReadKeyOf(const std::string& argument, bool issuer);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEY_SOURCE_H
