// SPDX-License-Identifier: Apache-2.0
// The smallest program that needs what the command needs to start: libcrypto and the C++ runtime.
// With a word it has libcrypto come up with SHA-256, as every verification must.
#include <iostream>

#include <openssl/evp.h>

int main(int count, char**) {
  EVP_MD* const algorithm = count > 1 ? EVP_MD_fetch(nullptr, "SHA256", nullptr) : nullptr;
  const bool missed = count > 1 && algorithm == nullptr;
  EVP_MD_free(algorithm);
  if (missed) std::cerr << "no SHA-256\n";
  return missed ? 1 : 0;
}
