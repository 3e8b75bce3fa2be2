// SPDX-License-Identifier: Apache-2.0
// Keys and signatures for tests. Failures throw: a test without its key has nothing to say.
#include "tests/support/test_key.h"

#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/dsa.h>
#include <openssl/pem.h>
#include <openssl/rsa.h>

#include <map>
#include <stdexcept>
#include <string_view>

#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ContextPtr = std::unique_ptr<EVP_PKEY_CTX, decltype(&EVP_PKEY_CTX_free)>;
using BigNumPtr = std::unique_ptr<BIGNUM, decltype(&BN_free)>;

void Check(bool ok, const char* what) {
  if (!ok) throw std::runtime_error(what);
}

EVP_PKEY* MakeDsa() {
  const ContextPtr made(EVP_PKEY_CTX_new_id(EVP_PKEY_DSA, nullptr), EVP_PKEY_CTX_free);
  EVP_PKEY* parameters = nullptr;
  Check(EVP_PKEY_paramgen_init(made.get()) == 1 &&
            EVP_PKEY_CTX_set_dsa_paramgen_bits(made.get(), 1024) == 1 &&
            EVP_PKEY_CTX_set_dsa_paramgen_q_bits(made.get(), 160) == 1 &&
            EVP_PKEY_paramgen(made.get(), &parameters) == 1,
        "DSA parameters");
  const std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)> owned(parameters, EVP_PKEY_free);
  EVP_PKEY* key = nullptr;
  const ContextPtr context(EVP_PKEY_CTX_new(parameters, nullptr), EVP_PKEY_CTX_free);
  Check(EVP_PKEY_keygen_init(context.get()) == 1 && EVP_PKEY_keygen(context.get(), &key) == 1,
        "DSA key");
  return key;
}

// The pair (name number), the number big-endian without leading zeros.
std::string Number(EVP_PKEY* key, const char* name, const char* parameter) {
  BIGNUM* raw = nullptr;
  Check(EVP_PKEY_get_bn_param(key, parameter, &raw) == 1, parameter);
  const BigNumPtr number(raw, BN_free);
  std::string bytes(static_cast<size_t>(BN_num_bytes(number.get())), '\0');
  BN_bn2bin(number.get(), reinterpret_cast<unsigned char*>(bytes.data()));
  return List({Str(name), Str(bytes)});
}

}  // namespace

const TestKey& TestKey::Made(bool dsa, unsigned index) {
  static std::map<std::pair<bool, unsigned>, TestKey> keys;
  auto found = keys.find({dsa, index});
  if (found == keys.end()) {
    EVP_PKEY* const key = dsa ? MakeDsa() : EVP_RSA_gen(2048);
    Check(key != nullptr, "key");
    found = keys.emplace(std::pair(dsa, index), TestKey(key)).first;
  }
  return found->second;
}

std::string TestKey::Public() const {
  EVP_PKEY* const key = key_.get();
  const std::string numbers =
      IsDsa()
          ? Number(key, "p", OSSL_PKEY_PARAM_FFC_P) + Number(key, "g", OSSL_PKEY_PARAM_FFC_G) +
                Number(key, "q", OSSL_PKEY_PARAM_FFC_Q) + Number(key, "y", OSSL_PKEY_PARAM_PUB_KEY)
          : Number(key, "e", OSSL_PKEY_PARAM_RSA_E) + Number(key, "n", OSSL_PKEY_PARAM_RSA_N);
  return List({Str("public-key"), List({Str(IsDsa() ? "dsa" : "rsa"), numbers})});
}

std::string TestKey::RawDsa(const std::string& der) {
  const auto* in = reinterpret_cast<const unsigned char*>(der.data());
  const std::unique_ptr<DSA_SIG, decltype(&DSA_SIG_free)> signature(
      d2i_DSA_SIG(nullptr, &in, static_cast<long>(der.size())), DSA_SIG_free);
  Check(signature != nullptr, "DSA signature");
  const BIGNUM* r = nullptr;
  const BIGNUM* s = nullptr;
  DSA_SIG_get0(signature.get(), &r, &s);
  std::string raw(40, '\0');
  auto* out = reinterpret_cast<unsigned char*>(raw.data());
  Check(BN_bn2binpad(r, out, 20) == 20 && BN_bn2binpad(s, out + 20, 20) == 20,
        "DSA signature size");
  return raw;
}

std::string TestKey::SignDigest(const std::string& digest, const char* algorithm,
                                const char* hash) const {
  const EVP_MD* md = std::string_view(hash) == "sha256" ? EVP_sha256() : EVP_sha1();
  const ContextPtr context(EVP_PKEY_CTX_new(key_.get(), nullptr), EVP_PKEY_CTX_free);
  Check(EVP_PKEY_sign_init(context.get()) == 1, "sign");
  if (!IsDsa()) {
    const bool pss = std::string_view(algorithm) == "rsa-pss";
    Check(EVP_PKEY_CTX_set_rsa_padding(context.get(),
                                       pss ? RSA_PKCS1_PSS_PADDING : RSA_PKCS1_PADDING) == 1 &&
              EVP_PKEY_CTX_set_signature_md(context.get(), md) == 1,
          "padding");
  }
  std::string value(1024, '\0');
  size_t length = value.size();
  Check(EVP_PKEY_sign(context.get(), reinterpret_cast<unsigned char*>(value.data()), &length,
                      reinterpret_cast<const unsigned char*>(digest.data()), digest.size()) == 1,
        "signature");
  value.resize(length);
  return IsDsa() ? RawDsa(value) : value;
}

std::string TestKey::Sign(const std::string& object) const {
  const char* const algorithm = IsDsa() ? "dsa-sha1" : "rsa-1.5";
  const char* const hash = IsDsa() ? "sha1" : "sha256";
  const std::string value = SignDigest(Digest(object, hash), algorithm, hash);
  return List(
      {Str("signature"), HashOf(object, hash), Public(), List({Str(algorithm), Str(value)})});
}

std::string TestKey::PrivatePem() const {
  const std::unique_ptr<BIO, decltype(&BIO_free)> out(BIO_new(BIO_s_mem()), BIO_free);
  Check(PEM_write_bio_PrivateKey(out.get(), key_.get(), nullptr, nullptr, 0, nullptr, nullptr) == 1,
        "PEM");
  char* text = nullptr;
  const long length = BIO_get_mem_data(out.get(), &text);
  return {text, static_cast<size_t>(length)};
}

}  // namespace vesk2test
