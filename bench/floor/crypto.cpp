// SPDX-License-Identifier: Apache-2.0
// Hashes and signatures.
#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <openssl/params.h>
#include <openssl/rsa.h>

#include <algorithm>

#include "bench/floor/floor.h"

namespace bench::floor {

Sha256::Sha256()
    : algorithm_(EVP_MD_fetch(nullptr, "SHA256", nullptr)), context_(EVP_MD_CTX_new()) {
  EVP_DigestInit_ex2(context_.get(), algorithm_.get(), nullptr);
}
void Sha256::Start() { EVP_DigestInit_ex2(context_.get(), nullptr, nullptr); }
void Sha256::Add(const void* bytes, size_t count) {
  EVP_DigestUpdate(context_.get(), bytes, count);
}
Digest Sha256::End() {
  Digest digest;
  EVP_DigestFinal_ex(context_.get(), digest.data(), nullptr);
  return digest;
}

namespace {

// A number as libcrypto's parameters have it: in the order of the machine, which is the reverse.
OSSL_PARAM Number(const char* name, std::string& bytes) {
  std::ranges::reverse(bytes);
  return OSSL_PARAM_construct_BN(name, reinterpret_cast<unsigned char*>(bytes.data()),
                                 bytes.size());
}

}  // namespace

bool CheckSignature(const Signed& by) {
  std::string n = by.n;
  std::string e = by.e;
  OSSL_PARAM numbers[] = {Number(OSSL_PKEY_PARAM_RSA_N, n), Number(OSSL_PKEY_PARAM_RSA_E, e),
                          OSSL_PARAM_construct_end()};
  const Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free> maker(
      EVP_PKEY_CTX_new_from_name(nullptr, "RSA", nullptr));
  EVP_PKEY* made = nullptr;
  EVP_PKEY_fromdata_init(maker.get());
  EVP_PKEY_fromdata(maker.get(), &made, EVP_PKEY_PUBLIC_KEY, numbers);
  const Owned<EVP_PKEY, EVP_PKEY_free> key(made);
  const Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free> check(
      EVP_PKEY_CTX_new_from_pkey(nullptr, key.get(), nullptr));
  const auto bytes = [](const std::string& text) {
    return reinterpret_cast<const unsigned char*>(text.data());
  };
  return EVP_PKEY_verify_init(check.get()) == 1 &&
         EVP_PKEY_CTX_set_rsa_padding(check.get(), RSA_PKCS1_PADDING) == 1 &&
         EVP_PKEY_CTX_set_signature_md(check.get(), EVP_sha256()) == 1 &&
         EVP_PKEY_verify(check.get(), bytes(by.value), by.value.size(), bytes(by.digest),
                         by.digest.size()) == 1;
}

}  // namespace bench::floor
