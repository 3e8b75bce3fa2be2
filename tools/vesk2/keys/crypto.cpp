// SPDX-License-Identifier: Apache-2.0
// crypto.cpp: libcrypto's keys.
#include "tools/vesk2/keys/crypto.h"

#include <openssl/core_names.h>
#include <openssl/dsa.h>
#include <openssl/err.h>
#include <openssl/rsa.h>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// The numbers of a canonical public key. The order of DSA's is the format's.
struct Field {
  const char* name;
  const char* parameter;
};
const std::vector<Field>& Fields(bool rsa) {
  static const std::vector<Field> kRsa = {{"e", OSSL_PKEY_PARAM_RSA_E},
                                          {"n", OSSL_PKEY_PARAM_RSA_N}};
  static const std::vector<Field> kDsa = {{"p", OSSL_PKEY_PARAM_FFC_P},
                                          {"g", OSSL_PKEY_PARAM_FFC_G},
                                          {"q", OSSL_PKEY_PARAM_FFC_Q},
                                          {"y", OSSL_PKEY_PARAM_PUB_KEY}};
  return rsa ? kRsa : kDsa;
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

void SetPadding(EVP_PKEY_CTX* context, bool pss) {
  const int padding = pss ? RSA_PKCS1_PSS_PADDING : RSA_PKCS1_PADDING;
  Require(EVP_PKEY_CTX_set_rsa_padding(context, padding) == 1 &&
              EVP_PKEY_CTX_set_signature_md(context, EVP_sha256()) == 1 &&
              (!pss || EVP_PKEY_CTX_set_rsa_pss_saltlen(context, RSA_PSS_SALTLEN_DIGEST) == 1),
          "signing");
}

}  // namespace

Bio ReadOnly(const Secret& text) {
  Bio bio(BIO_new_mem_buf(text.text().data(), static_cast<int>(text.text().size())), &BIO_free_all);
  if (!bio) throw std::bad_alloc();
  return bio;
}

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

void RequireOpened(bool opened, const Asking& asking, const std::string& what) {
  if (asking.problem) std::rethrow_exception(asking.problem);
  if (asking.failed) {
    throw FileTrouble(asking.path,
                      "encrypted, and no passphrase was given (--passphrase-file, --passphrase-fd)",
                      "passphrase");
  }
  if (opened) return;
  throw FileTrouble(
      asking.path,
      (asking.asked ? "wrong passphrase, or no " : "no ") + what + ": " + CryptoReason(),
      asking.asked ? "wrong-passphrase" : "malformed");
}

void RefuseKind(const std::string& kind, const std::string& source) {
  throw FileTrouble(source,
                    "a key of the kind " + Escape(kind) + "; this system knows RSA and DSA keys",
                    "key-kind");
}

Ref<PublicKey> MakePublicKey(const EVP_PKEY* key, const std::string& source) {
  const bool rsa = EVP_PKEY_is_a(key, "RSA") == 1;
  if (!rsa && EVP_PKEY_is_a(key, "DSA") != 1) {
    const char* kind = EVP_PKEY_get0_type_name(key);
    RefuseKind(kind != nullptr ? kind : "unknown", source);
  }
  std::vector<std::string> numbers;
  for (const Field& field : Fields(rsa)) numbers.push_back(Number(key, field.parameter));
  return MakePublicKey(rsa, numbers, source);
}

Ref<PublicKey> MakePublicKey(bool rsa, const std::vector<std::string>& numbers,
                             const std::string& source) {
  std::string text = rsa ? "(10:public-key(3:rsa" : "(10:public-key(3:dsa";
  for (size_t i = 0; i < numbers.size(); ++i) {
    text += "(" + Atom(Fields(rsa)[i].name) + Atom(numbers[i]) + ")";
  }
  const Buffer buffer = WrapBytes(text + "))");
  Ref<PublicKey> result(new PublicKey(nullptr));
  Check(result->Import(buffer.get()), InputName(source));
  return result;
}

bool HasPrivateHalf(const EVP_PKEY* key) {
  const bool rsa = EVP_PKEY_is_a(key, "RSA") == 1;
  BIGNUM* number = nullptr;
  const int got =
      EVP_PKEY_get_bn_param(key, rsa ? OSSL_PKEY_PARAM_RSA_D : OSSL_PKEY_PARAM_PRIV_KEY, &number);
  BN_clear_free(number);
  return got == 1;
}

std::string SignDigest(EVP_PKEY* key, std::string_view digest, const std::string& algorithm) {
  const std::unique_ptr<EVP_PKEY_CTX, decltype(&EVP_PKEY_CTX_free)> context(
      EVP_PKEY_CTX_new(key, nullptr), &EVP_PKEY_CTX_free);
  Require(context != nullptr && EVP_PKEY_sign_init(context.get()) == 1, "signing");
  const bool dsa = algorithm == "dsa-sha1";
  if (!dsa) SetPadding(context.get(), algorithm == "rsa-pss");
  const auto* data = reinterpret_cast<const unsigned char*>(digest.data());
  size_t size = 0;
  Require(EVP_PKEY_sign(context.get(), nullptr, &size, data, digest.size()) == 1, "signing");
  std::string value(size, '\0');
  Require(EVP_PKEY_sign(context.get(), reinterpret_cast<unsigned char*>(value.data()), &size, data,
                        digest.size()) == 1,
          "signing");
  value.resize(size);
  return dsa ? RawDsa(value, Number(key, OSSL_PKEY_PARAM_FFC_Q).size()) : value;
}

std::string Base64(std::string_view bytes) {
  std::string out(4 * ((bytes.size() + 2) / 3) + 1, '\0');
  const int length = EVP_EncodeBlock(reinterpret_cast<unsigned char*>(out.data()),
                                     reinterpret_cast<const unsigned char*>(bytes.data()),
                                     static_cast<int>(bytes.size()));
  out.resize(static_cast<size_t>(length));
  return out;
}

std::string FromBase64(std::string_view text, const std::string& source) {
  const std::unique_ptr<EVP_ENCODE_CTX, decltype(&EVP_ENCODE_CTX_free)> context(
      EVP_ENCODE_CTX_new(), &EVP_ENCODE_CTX_free);
  if (!context) throw std::bad_alloc();
  std::string bytes(text.size() + 3, '\0');
  auto* out = reinterpret_cast<unsigned char*>(bytes.data());
  int size = 0;
  int rest = 0;
  EVP_DecodeInit(context.get());
  const bool good = EVP_DecodeUpdate(context.get(), out, &size,
                                     reinterpret_cast<const unsigned char*>(text.data()),
                                     static_cast<int>(text.size())) >= 0 &&
                    EVP_DecodeFinal(context.get(), out + size, &rest) == 1;
  if (!good) throw FileTrouble(source, "not in base64", "malformed");
  bytes.resize(static_cast<size_t>(size + rest));
  return bytes;
}

}  // namespace vesk2_command
