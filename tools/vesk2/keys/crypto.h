// SPDX-License-Identifier: Apache-2.0
// crypto.h: libcrypto's keys as this room uses them, and the way from one to a principal.
#ifndef VESK2_TOOLS_CRYPTO_H
#define VESK2_TOOLS_CRYPTO_H

#include <openssl/bio.h>
#include <openssl/bn.h>
#include <openssl/evp.h>

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "tools/vesk2/keys/passphrase.h"
#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {

using CryptoKey = std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)>;
inline CryptoKey OwnKey(EVP_PKEY* key) { return {key, &EVP_PKEY_free}; }

using Bio = std::unique_ptr<BIO, decltype(&BIO_free_all)>;
Bio ReadOnly(const Secret& text);

// libcrypto's last reason, for people; empties its error queue.
std::string CryptoReason();
void Require(bool good, const std::string& what);

// RequireOpened throws Trouble unless a key could be read: with the problem met in asking for its
// passphrase, if that was why. `what` is "private key" or the like.
void RequireOpened(bool opened, const Asking& asking, const std::string& what);

// RefuseKind throws the line for a key that is neither RSA nor DSA: `kind` says what it is.
[[noreturn]] void RefuseKind(const std::string& kind, const std::string& source);

// The public half of a key. `source` is what the key came from, for trouble.
Ref<PublicKey> MakePublicKey(const EVP_PKEY* key, const std::string& source);
// The same from big-endian numbers: e and n of an RSA key; p, g, q and y of a DSA key.
Ref<PublicKey> MakePublicKey(bool rsa, const std::vector<std::string>& numbers,
                             const std::string& source);

// Whether there is a private half.
bool HasPrivateHalf(const EVP_PKEY* key);

// The raw signature over a digest; `algorithm` is "rsa-pss", "rsa-1.5" or "dsa-sha1".
std::string SignDigest(EVP_PKEY* key, std::string_view digest, const std::string& algorithm);

// No key file is larger.
inline constexpr size_t kMaxKeyFile = 1 << 20;

// Base64 without line breaks, and what such a text stands for; Trouble if it is none.
std::string Base64(std::string_view bytes);
std::string FromBase64(std::string_view text, const std::string& source);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CRYPTO_H
