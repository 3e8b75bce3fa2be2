// SPDX-License-Identifier: Apache-2.0
// Manifest text for tests, written without the library: bodies from entries or from a directory,
// and whole signed files.
#ifndef VESK2_TESTS_SUPPORT_TEST_MANIFEST_H
#define VESK2_TESTS_SUPPORT_TEST_MANIFEST_H

#include <string>

#include "tests/support/test_key.h"
#include "tests/support/test_text.h"

namespace vesk2test {

// Entries of a body. `entries` is the text of all entries inside.
std::string FileEntry(const std::string& name, const std::string& contents);
std::string DirEntry(const std::string& name, const std::string& entries);
std::string Body(const std::string& entries);
// The body of everything below a directory.
std::string BodyOf(const std::string& directory);

// A certificate with its signature behind it, made by the certificate's issuer.
std::string Signed(const CertText& cert, const TestKey& issuer);

struct ManifestText {
  std::string version = "1", type = "plain";
  std::string signingTime = "2024-05-01_12:00:00";
  const TestKey* key = &TestKey::Rsa(1);  // the signer's
  const char* hash = "sha256";            // names the digest of what is signed
  // The signer certificate; its issuer and subject are filled in unless they are set.
  CertText signer;
  std::string chain;  // further pairs of certificate and signature
  std::string lists;  // revocation lists
  std::string body;
};
std::string ManifestFile(ManifestText parts);

}  // namespace vesk2test

#endif  // VESK2_TESTS_SUPPORT_TEST_MANIFEST_H
