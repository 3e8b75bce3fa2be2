// SPDX-License-Identifier: Apache-2.0
// key_reference.h: keys as arguments name them, in one place: a file, "pkcs11:..." on a token, or
// "ssh-agent:SHA256:..." in an agent. ./pkcs11:x is a file again.
#ifndef VESK2_TOOLS_KEY_REFERENCE_H
#define VESK2_TOOLS_KEY_REFERENCE_H

#include <memory>
#include <string>

#include "tools/vesk2/keys/keys.h"

namespace vesk2_command {

// ReadPublicKey reads a public key: our canonical form, or PEM, or from where it is kept.
Ref<PublicKey> ReadPublicKey(const std::string& name);

// Whether a file holds a private key in PEM.
bool IsPrivatePem(const std::string& path);

// The public half of any key; of a private key in PEM too.
struct PublicHalf {
  Ref<PublicKey> key;
  bool ofPrivate = false;
};
PublicHalf ReadPublicHalf(const std::string& name, const PassphraseOptions& options);

// OpenKey finds the private key that is to sign.
std::unique_ptr<SigningKey> OpenKey(const std::string& name, const PassphraseOptions& options);

// The name in messages, without a PIN that it may hold.
std::string ShownKey(const std::string& name);
// What a file about this key is called unless somebody says: after the key's file, or its name on
// the token.
std::string KeyNickname(const std::string& name);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEY_REFERENCE_H
