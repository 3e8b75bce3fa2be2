// SPDX-License-Identifier: Apache-2.0
// keys.cpp: key files and signing over libcrypto's EVP interfaces.
#include "tools/vesk2/keys/keys.h"

#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/dsa.h>
#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/rsa.h>

#include <vector>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Hash;
using ZvVesk2::Signature;

constexpr size_t kMaxPem = 1 << 20;

using Bio = std::unique_ptr<BIO, decltype(&BIO_free_all)>;

// libcrypto's last reason, for people; empties its error queue.
std::string CryptoReason() {
  char text[256] = "unknown failure";
  if (const unsigned long error = ERR_get_error(); error != 0) {
    const char* reason = ERR_reason_error_string(error);
    if (reason != nullptr) std::snprintf(text, sizeof text, "%s", reason);
  }
  ERR_clear_error();
  return text;
}

void Require(bool good, const std::string& what) {
  if (!good) throw Trouble(what + ": " + CryptoReason());
}

std::string Number(const EVP_PKEY* key, const char* name) {
  BIGNUM* number = nullptr;
  Require(EVP_PKEY_get_bn_param(key, name, &number) == 1, "reading a key");
  const std::unique_ptr<BIGNUM, decltype(&BN_free)> owner(number, &BN_free);
  std::string bytes(static_cast<size_t>(BN_num_bytes(number)), '\0');
  BN_bn2bin(number, reinterpret_cast<unsigned char*>(bytes.data()));
  return bytes;
}

std::string Atom(const std::string& bytes) { return std::to_string(bytes.size()) + ":" + bytes; }

// The canonical public key, without display hints. The order of DSA's numbers is the format's.
std::string CanonicalKey(const EVP_PKEY* key) {
  struct Field {
    const char* name;
    const char* parameter;
  };
  static const std::vector<Field> kRsa = {{"e", OSSL_PKEY_PARAM_RSA_E},
                                          {"n", OSSL_PKEY_PARAM_RSA_N}};
  static const std::vector<Field> kDsa = {{"p", OSSL_PKEY_PARAM_FFC_P},
                                          {"g", OSSL_PKEY_PARAM_FFC_G},
                                          {"q", OSSL_PKEY_PARAM_FFC_Q},
                                          {"y", OSSL_PKEY_PARAM_PUB_KEY}};
  const bool rsa = EVP_PKEY_is_a(key, "RSA") == 1;
  if (!rsa && EVP_PKEY_is_a(key, "DSA") != 1) throw Trouble("a key that is neither RSA nor DSA");
  std::string text = std::string("(10:public-key(3:") + (rsa ? "rsa" : "dsa");
  for (const Field& field : rsa ? kRsa : kDsa) {
    text += "(" + Atom(field.name) + Atom(Number(key, field.parameter)) + ")";
  }
  return text + "))";
}

Ref<PublicKey> MakePublicKey(const EVP_PKEY* key) {
  const Buffer buffer = WrapBytes(CanonicalKey(key));
  Ref<PublicKey> result(new PublicKey(nullptr));
  Check(result->Import(buffer.get()), "building a public key");
  return result;
}

// DSA signatures travel as r and s in two halves of q's length, not as DER.
std::string RawDsa(const std::string& der, size_t half) {
  const auto* data = reinterpret_cast<const unsigned char*>(der.data());
  const std::unique_ptr<DSA_SIG, decltype(&DSA_SIG_free)> signature(
      d2i_DSA_SIG(nullptr, &data, static_cast<long>(der.size())), &DSA_SIG_free);
  Require(signature != nullptr, "signing");
  std::string raw(2 * half, '\0');
  auto* out = reinterpret_cast<unsigned char*>(raw.data());
  const BIGNUM* r = nullptr;
  const BIGNUM* s = nullptr;
  DSA_SIG_get0(signature.get(), &r, &s);
  const int width = static_cast<int>(half);
  Require(BN_bn2binpad(r, out, width) == width && BN_bn2binpad(s, out + half, width) == width,
          "signing");
  return raw;
}

Bio ReadOnly(const Secret& text) {
  Bio bio(BIO_new_mem_buf(text.text().data(), static_cast<int>(text.text().size())), &BIO_free_all);
  if (!bio) throw std::bad_alloc();
  return bio;
}

Ref<PublicKey> PublicFromPem(const Secret& pem, const std::string& path) {
  const Bio bio = ReadOnly(pem);
  const std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)> key(
      PEM_read_bio_PUBKEY(bio.get(), nullptr, nullptr, nullptr), &EVP_PKEY_free);
  Require(key != nullptr, Escape(path) + ": no public key");
  return MakePublicKey(key.get());
}

Ref<PublicKey> PublicFromText(const Secret& text, const std::string& path) {
  const Buffer buffer = WrapBytes(text.text());
  if (buffer->LooksAt("-----BEGIN ")) return PublicFromPem(text, path);
  Ref<PublicKey> key(new PublicKey(nullptr));
  int code = key->Import(buffer.get());
  if (code == 0 && buffer->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
  if (code != 0) Malformed(path, buffer->Position(), "public key", code);
  return key;
}

bool HoldsPrivateKey(const Secret& pem) {
  return pem.text().find("PRIVATE KEY-----") != std::string::npos;
}

}  // namespace

Ref<PublicKey> ReadPublicKey(const std::string& path) {
  return PublicFromText(Secret(ReadFile(path, kMaxPem)), path);
}

bool IsPrivatePem(const std::string& path) {
  return HoldsPrivateKey(Secret(ReadFile(path, kMaxPem)));
}

PublicHalf ReadPublicHalf(const std::string& path, const PassphraseOptions& options) {
  const Secret text(ReadFile(path, kMaxPem));  // once: it may be standard input
  const bool ofPrivate = HoldsPrivateKey(text);
  return {
      ofPrivate ? PrivateKey::FromPem(text, path, options).Public() : PublicFromText(text, path),
      ofPrivate};
}

// ---- Private keys ----

PrivateKey::PrivateKey(EVP_PKEY* key, const std::string& path)
    : SigningKey(Escape(path), "signature"), key_(key, &EVP_PKEY_free) {}

void PrivateKey::CheckBits(int bits) {
  if (bits < 2048 || bits > ZvVesk2::Limits::kMaxRsaModulusBits) {
    throw Trouble(
        "--bits must lie between 2048 and " + std::to_string(ZvVesk2::Limits::kMaxRsaModulusBits),
        "usage");
  }
}

PrivateKey PrivateKey::Generate(int bits) {
  CheckBits(bits);
  PrivateKey key(EVP_RSA_gen(static_cast<unsigned>(bits)), "the new key");
  Require(key.key_ != nullptr, "making a key");
  return key;
}

PrivateKey PrivateKey::Read(const std::string& path, const PassphraseOptions& options) {
  return FromPem(Secret(ReadFile(path, kMaxPem)), path, options);
}

PrivateKey PrivateKey::FromPem(const Secret& pem, const std::string& path,
                               const PassphraseOptions& options) {
  const Bio bio = ReadOnly(pem);
  Asking asking{options, path};
  PrivateKey key(PEM_read_bio_PrivateKey(bio.get(), nullptr, &GivePassphrase, &asking), path);
  if (asking.problem) std::rethrow_exception(asking.problem);
  if (asking.failed) {
    throw FileTrouble(path,
                      "encrypted, and no passphrase was given (--passphrase-file, --passphrase-fd)",
                      "passphrase");
  }
  if (key.key_ == nullptr) {
    throw FileTrouble(
        path,
        (asking.asked ? "wrong passphrase, or no private key: " : "no private key: ") +
            CryptoReason(),
        asking.asked ? "wrong-passphrase" : "malformed");
  }
  return key;
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

Ref<PublicKey> PrivateKey::Public() const { return MakePublicKey(key_.get()); }

std::string PrivateKey::SignDigest(std::string_view digest, const std::string& algorithm) const {
  const std::unique_ptr<EVP_PKEY_CTX, decltype(&EVP_PKEY_CTX_free)> context(
      EVP_PKEY_CTX_new(key_.get(), nullptr), &EVP_PKEY_CTX_free);
  Require(context != nullptr && EVP_PKEY_sign_init(context.get()) == 1, "signing");
  if (algorithm != "dsa-sha1") {
    const bool pss = algorithm == "rsa-pss";
    const int padding = pss ? RSA_PKCS1_PSS_PADDING : RSA_PKCS1_PADDING;
    Require(EVP_PKEY_CTX_set_rsa_padding(context.get(), padding) == 1 &&
                EVP_PKEY_CTX_set_signature_md(context.get(), EVP_sha256()) == 1,
            "signing");
    if (pss) {
      Require(EVP_PKEY_CTX_set_rsa_pss_saltlen(context.get(), RSA_PSS_SALTLEN_DIGEST) == 1,
              "signing");
    }
  }
  const auto* data = reinterpret_cast<const unsigned char*>(digest.data());
  size_t size = 0;
  Require(EVP_PKEY_sign(context.get(), nullptr, &size, data, digest.size()) == 1, "signing");
  std::string value(size, '\0');
  Require(EVP_PKEY_sign(context.get(), reinterpret_cast<unsigned char*>(value.data()), &size, data,
                        digest.size()) == 1,
          "signing");
  value.resize(size);
  return algorithm == "dsa-sha1" ? RawDsa(value, Number(key_.get(), OSSL_PKEY_PARAM_FFC_Q).size())
                                 : value;
}

// ---- Signing ----

Ref<Signature> SigningKey::Sign(SExpression& object, const std::string& algorithm) const {
  Ref<PublicKey> signer = Public();
  const bool dsa = signer->GetType() != ZVCLM_KEY_RSA;
  const std::string name = dsa ? "dsa-sha1" : algorithm;
  Ref<Hash> hash = HashOf(object, dsa ? ZVCLM_HASH_SHA1 : ZVCLM_HASH_SHA256);
  std::string value = SignDigest(BytesOf(*hash->GetDigest()), name);

  Ref<Signature> signature;
  Check(Signature::Create(signature.Out(), hash.get(), signer.get(), name.c_str(),
                          reinterpret_cast<unsigned char*>(value.data()),
                          static_cast<unsigned>(value.size()), nullptr),
        "building a signature");
  (void)hash.Release();
  (void)signer.Release();
  // A faulty signature can give the private key away; none leaves unchecked.
  const int code = signature->Verify(&object);
  if (code != 0) throw Trouble(source_ + ": made a wrong signature: " + Reason(code), reason_);
  return signature;
}

}  // namespace vesk2_command
