// keys.h: key files. The library never sees a private key: PEM files (PKCS#8, optionally under a
// passphrase) are read, written and used here, over libcrypto.
#ifndef VESK2_TOOLS_KEYS_H
#define VESK2_TOOLS_KEYS_H

#include <openssl/evp.h>

#include <memory>
#include <string>

#include "tools/vesk2/objects.h"
#include "tools/vesk2/passphrase.h"

#include <vesk2/signature.h>

namespace vesk2_command {

// ReadPublicKey reads a public key file: our canonical form, or PEM.
Ref<PublicKey> ReadPublicKey(const std::string& path);

// Whether a file holds a private key in PEM.
bool IsPrivatePem(const std::string& path);

class PrivateKey {
 public:
  // A new RSA key. Trouble for sizes outside 2048 to 16384 bits.
  static PrivateKey Generate(int bits);
  static PrivateKey Read(const std::string& path, const PassphraseOptions& options);

  // PKCS#8 in PEM, encrypted under `passphrase` unless it is null.
  std::unique_ptr<Secret> Pem(const Secret* passphrase) const;
  Ref<PublicKey> Public() const;

  // Sign makes the signature object over `object` and checks it with the library. `algorithm` is
  // "rsa-pss" or "rsa-1.5" (over SHA-256); a DSA key signs "dsa-sha1" whatever it says.
  Ref<ZvVesk2::Signature> Sign(SExpression& object, const std::string& algorithm) const;

 private:
  using Key = std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)>;
  explicit PrivateKey(EVP_PKEY* key) : key_(key, &EVP_PKEY_free) {}
  std::string SignDigest(std::string_view digest, const std::string& algorithm) const;

  Key key_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEYS_H
