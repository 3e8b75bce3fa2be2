// SPDX-License-Identifier: Apache-2.0
// foreign_key.h: keys as other programs write them: X.509 certificates, PKCS#8, PKCS#1, OpenSSH.
#ifndef VESK2_TOOLS_FOREIGN_KEY_H
#define VESK2_TOOLS_FOREIGN_KEY_H

#include <memory>
#include <string>

#include "tools/vesk2/keys/keys.h"

namespace vesk2_command {

struct ForeignKey {
  const char* form;  // what was read, in words
  Ref<PublicKey> publicKey;
  std::unique_ptr<PrivateKey> privateKey = nullptr;    // null for a public key
  std::shared_ptr<const Secret> passphrase = nullptr;  // that it was under
  bool certificate = false;                            // of which only the key was looked at
};

// ReadForeignKey recognises the form by the contents. Trouble for what is none of them, and for
// keys that are neither RSA nor DSA.
ForeignKey ReadForeignKey(const std::string& path, const PassphraseOptions& options);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FOREIGN_KEY_H
