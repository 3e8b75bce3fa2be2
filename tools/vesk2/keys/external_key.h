// SPDX-License-Identifier: Apache-2.0
// external_key.h: keys that a program has in its keeping: a hardware token, an agent, another
// machine. It is handed the digest and gives the signature back.
#ifndef VESK2_TOOLS_EXTERNAL_KEY_H
#define VESK2_TOOLS_EXTERNAL_KEY_H

#include <string>

#include "tools/vesk2/keys/keys.h"

namespace vesk2_command {

// The command is run by /bin/sh once a signature. It finds the digest as raw bytes on its standard
// input, and in its environment VESK2_KEY (the public key file), VESK2_DIGEST_ALGORITHM (sha256 or
// sha1) and VESK2_SIGNATURE_ALGORITHM (rsa-pss, rsa-1.5 or dsa-sha1). It writes the raw signature
// to its standard output and exits with 0. Everything else is Trouble, and so is a signature that
// the public key does not bear out.
class ExternalKey : public SigningKey {
 public:
  ExternalKey(const std::string& command, const std::string& publicKey);
  Ref<PublicKey> Public() const override;

 private:
  std::string SignObject(SExpression& object, std::string_view digest,
                         const std::string& algorithm) const override;

  std::string command_;
  std::string path_;
  Ref<PublicKey> key_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EXTERNAL_KEY_H
