// SPDX-License-Identifier: Apache-2.0
// keys.h: what signs. The library never sees a private key: PEM files (PKCS#8, optionally under a
// passphrase) are read, written and used here, over libcrypto.
#ifndef VESK2_TOOLS_KEYS_H
#define VESK2_TOOLS_KEYS_H

#include <memory>
#include <string>

#include "tools/vesk2/keys/crypto.h"
#include "tools/vesk2/keys/passphrase.h"
#include "tools/vesk2/objects/objects.h"

#include <vesk2/signature.h>

namespace vesk2_command {

// What can sign: a private key file, or whatever has the private key in its keeping.
class SigningKey {
 public:
  virtual ~SigningKey() = default;
  virtual Ref<PublicKey> Public() const = 0;

  // Sign makes the signature object over `object` and checks it with the library. `algorithm` is
  // "rsa-pss" or "rsa-1.5" (over SHA-256), or empty for what this key does unless told; a DSA key
  // signs "dsa-sha1" whatever it says.
  Ref<ZvVesk2::Signature> Sign(SExpression& object, const std::string& algorithm) const;

 protected:
  // `source` names the signer in trouble, unescaped, and `reason` is its word for machines.
  SigningKey(std::string source, std::string reason)
      : source_(std::move(source)), reason_(std::move(reason)) {}
  virtual const char* UsualAlgorithm() const { return "rsa-pss"; }
  // The raw signature over `digest`, which is that of the object. A DSA signature is r and s in two
  // equal halves.
  virtual std::string SignObject(SExpression& object, std::string_view digest,
                                 const std::string& algorithm) const = 0;

  std::string source_;
  std::string reason_;
};

class PrivateKey : public SigningKey {
 public:
  // Trouble for sizes outside 2048 to 16384 bits.
  static void CheckBits(int bits);
  static PrivateKey Generate(int bits);  // RSA
  // Adopt takes over a key that came from `path`.
  static PrivateKey Adopt(CryptoKey key, const std::string& path);
  // FromPem reads a private key of `path`, asking for its passphrase if it has one.
  static PrivateKey FromPem(const Secret& pem, const std::string& path,
                            const PassphraseOptions& options);

  // PKCS#8 in PEM, encrypted under `passphrase` unless it is null.
  std::unique_ptr<Secret> Pem(const Secret* passphrase) const;
  Ref<PublicKey> Public() const override;

 private:
  PrivateKey(CryptoKey key, const std::string& path);
  std::string SignObject(SExpression& object, std::string_view digest,
                         const std::string& algorithm) const override;

  CryptoKey key_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEYS_H
