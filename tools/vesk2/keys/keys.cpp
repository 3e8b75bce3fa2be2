// SPDX-License-Identifier: Apache-2.0
// keys.cpp: private keys in PEM, and signing.
#include "tools/vesk2/keys/keys.h"

#include <openssl/pem.h>
#include <openssl/rsa.h>

#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>

namespace vesk2_command {

using ZvVesk2::Hash;
using ZvVesk2::Signature;

// ---- Private keys ----

PrivateKey::PrivateKey(CryptoKey key, const std::string& path)
    : SigningKey(path, "signature"), key_(std::move(key)) {}

void PrivateKey::CheckBits(int bits) {
  if (bits < 2048 || bits > ZvVesk2::Limits::kMaxRsaModulusBits) {
    throw Trouble(
        "--bits must lie between 2048 and " + std::to_string(ZvVesk2::Limits::kMaxRsaModulusBits),
        "usage");
  }
}

PrivateKey PrivateKey::Generate(int bits) {
  CheckBits(bits);
  CryptoKey key = OwnKey(EVP_RSA_gen(static_cast<unsigned>(bits)));
  Require(key != nullptr, "making a key");
  return {std::move(key), "the new key"};
}

PrivateKey PrivateKey::Adopt(CryptoKey key, const std::string& path) {
  return {std::move(key), path};
}

PrivateKey PrivateKey::FromPem(const Secret& pem, const std::string& path,
                               const PassphraseOptions& options) {
  const Bio bio = ReadOnly(pem);
  Asking asking{options, path};
  CryptoKey key = OwnKey(PEM_read_bio_PrivateKey(bio.get(), nullptr, &GivePassphrase, &asking));
  RequireOpened(key != nullptr, asking, "private key");
  return {std::move(key), path};
}

std::unique_ptr<Secret> PrivateKey::Pem(const Secret* passphrase) const {
  const Bio bio(BIO_new(BIO_s_secmem()), &BIO_free_all);
  if (!bio) throw std::bad_alloc();
  const EVP_CIPHER* cipher = passphrase != nullptr ? EVP_aes_256_cbc() : nullptr;
  const char* words = passphrase != nullptr ? passphrase->text().data() : nullptr;
  const int length = passphrase != nullptr ? static_cast<int>(passphrase->text().size()) : 0;
  Require(PEM_write_bio_PKCS8PrivateKey(bio.get(), key_.get(), cipher, words, length, nullptr,
                                        nullptr) == 1,
          "writing a private key");
  char* data = nullptr;
  const long size = BIO_get_mem_data(bio.get(), &data);
  return std::make_unique<Secret>(std::string(data, static_cast<size_t>(size)));
}

Ref<PublicKey> PrivateKey::Public() const { return MakePublicKey(key_.get(), source_); }

std::string PrivateKey::SignObject(SExpression& /*object*/, std::string_view digest,
                                   const std::string& algorithm) const {
  return SignDigest(key_.get(), digest, algorithm);
}

// ---- Signing ----

Ref<Signature> SigningKey::Sign(SExpression& object, const std::string& algorithm) const {
  Ref<PublicKey> signer = Public();
  const bool dsa = signer->GetType() != ZVCLM_KEY_RSA;
  const std::string name = dsa ? "dsa-sha1" : algorithm.empty() ? UsualAlgorithm() : algorithm;
  Ref<Hash> hash = HashOf(object, dsa ? ZVCLM_HASH_SHA1 : ZVCLM_HASH_SHA256);
  std::string value = SignObject(object, BytesOf(*hash->GetDigest()), name);

  Ref<Signature> signature;
  Check(Signature::Create(signature.Out(), hash.get(), signer.get(), name.c_str(),
                          reinterpret_cast<unsigned char*>(value.data()),
                          static_cast<unsigned>(value.size()), nullptr),
        "building a signature");
  (void)hash.Release();
  (void)signer.Release();
  // A faulty signature can give the private key away; none leaves unchecked.
  const int code = signature->Verify(&object);
  if (code != 0)
    throw Trouble(Escape(source_) + ": made a wrong signature: " + Reason(code), reason_);
  return signature;
}

}  // namespace vesk2_command
