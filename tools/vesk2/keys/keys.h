// SPDX-License-Identifier: Apache-2.0
// keys.h: key files, and what signs. The library never sees a private key: PEM files (PKCS#8,
// optionally under a passphrase) are read, written and used here, over libcrypto.
#ifndef VESK2_TOOLS_KEYS_H
#define VESK2_TOOLS_KEYS_H

#include <openssl/evp.h>

#include <memory>
#include <string>

#include "tools/vesk2/keys/passphrase.h"
#include "tools/vesk2/objects/objects.h"

#include <vesk2/signature.h>

namespace vesk2_command {

// ReadPublicKey reads a public key file: our canonical form, or PEM.
Ref<PublicKey> ReadPublicKey(const std::string& path);

// Whether a file holds a private key in PEM.
bool IsPrivatePem(const std::string& path);

// The public half of any key file; of a private key in PEM too.
struct PublicHalf {
  Ref<PublicKey> key;
  bool ofPrivate = false;
};
PublicHalf ReadPublicHalf(const std::string& path, const PassphraseOptions& options);

// What can sign: a private key file, or a program that has the private key in its keeping.
class SigningKey {
 public:
  virtual ~SigningKey() = default;
  virtual Ref<PublicKey> Public() const = 0;

  // Sign makes the signature object over `object` and checks it with the library. `algorithm` is
  // "rsa-pss" or "rsa-1.5" (over SHA-256); a DSA key signs "dsa-sha1" whatever it says.
  Ref<ZvVesk2::Signature> Sign(SExpression& object, const std::string& algorithm) const;

 protected:
  // `source` names the signer in trouble, and `reason` is its word for machines.
  SigningKey(std::string source, std::string reason)
      : source_(std::move(source)), reason_(std::move(reason)) {}
  // A DSA signature is r and s in two equal halves.
  virtual std::string SignDigest(std::string_view digest, const std::string& algorithm) const = 0;

  std::string source_;
  std::string reason_;
};

class PrivateKey : public SigningKey {
 public:
  // Trouble for sizes outside 2048 to 16384 bits.
  static void CheckBits(int bits);
  static PrivateKey Generate(int bits);  // RSA
  static PrivateKey Read(const std::string& path, const PassphraseOptions& options);

  static PrivateKey FromPem(const Secret& pem, const std::string& path,
                            const PassphraseOptions& options);

  // PKCS#8 in PEM, encrypted under `passphrase` unless it is null.
  std::unique_ptr<Secret> Pem(const Secret* passphrase) const;
  Ref<PublicKey> Public() const override;

 private:
  using Key = std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)>;
  PrivateKey(EVP_PKEY* key, const std::string& path);
  std::string SignDigest(std::string_view digest, const std::string& algorithm) const override;

  Key key_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEYS_H
