// SPDX-License-Identifier: Apache-2.0
// token_key.h: keys on tokens: smart cards, security modules. libcrypto's engine for PKCS#11 drives
// them; it is loaded when a key of a token is named, and not before.
#ifndef VESK2_TOOLS_TOKEN_KEY_H
#define VESK2_TOOLS_TOKEN_KEY_H

#include <string>

#include "tools/vesk2/keys/keys.h"

namespace vesk2_command {

class TokenEngines;

// A key named by a PKCS#11 URI. Its PIN comes from where the URI says, else as passphrases do.
class TokenKey : public SigningKey {
 public:
  TokenKey(const std::string& uri, const PassphraseOptions& options);
  Ref<PublicKey> Public() const override;

 private:
  std::string SignObject(SExpression& object, std::string_view digest,
                         const std::string& algorithm) const override;

  std::shared_ptr<TokenEngines> engines_;  // before the key, which goes first
  CryptoKey key_;
};

// The public half, for which most tokens want no PIN.
Ref<PublicKey> ReadTokenPublic(const std::string& uri, const PassphraseOptions& options);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TOKEN_KEY_H
