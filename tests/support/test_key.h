// SPDX-License-Identifier: Apache-2.0
// Keys and signatures for tests, made by libcrypto alone.
#ifndef VESK2_TESTS_SUPPORT_TEST_KEY_H
#define VESK2_TESTS_SUPPORT_TEST_KEY_H

#include <memory>
#include <string>

#include <openssl/evp.h>

namespace vesk2test {

class TestKey {
 public:
  // RSA-2048 and DSA-1024 (q of 160 bits) keys, made once a process for each index.
  static const TestKey& Rsa(unsigned index) { return Made(false, index); }
  static const TestKey& Dsa(unsigned index) { return Made(true, index); }

  // The canonical public key.
  std::string Public() const;
  // The canonical signature over the bytes of a canonical object: "rsa-1.5" and "sha256", or
  // "dsa-sha1" and "sha1".
  std::string Sign(const std::string& object) const;
  // The raw signature bytes over a digest made by `hash`; r and s (20 bytes each) for DSA.
  std::string SignDigest(const std::string& digest, const char* algorithm, const char* hash) const;
  // A DSA signature from libcrypto's DER form to r and s of 20 bytes each.
  static std::string RawDsa(const std::string& der);
  std::string PrivatePem() const;
  EVP_PKEY* Pkey() const { return key_.get(); }

 private:
  struct Delete {
    void operator()(EVP_PKEY* key) const { EVP_PKEY_free(key); }
  };
  explicit TestKey(EVP_PKEY* key) : key_(key) {}
  static const TestKey& Made(bool dsa, unsigned index);
  bool IsDsa() const { return EVP_PKEY_is_a(key_.get(), "DSA") == 1; }

  std::unique_ptr<EVP_PKEY, Delete> key_;
};

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_TEST_KEY_H
