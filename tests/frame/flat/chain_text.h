// SPDX-License-Identifier: Apache-2.0
// A chain of three certificates for the tests of the flat functions: key 0 to key 1, key 1 to key 2
// and key 2 to key 3, the last first, each for "(install)" from kPast to kFuture.
#ifndef VESK2_TESTS_FRAME_FLAT_CHAIN_TEXT_H
#define VESK2_TESTS_FRAME_FLAT_CHAIN_TEXT_H

#include "tests/support/test_manifest.h"
#include "tests/trust/trust_test.h"

namespace vesk2test {

inline const std::string kNothing = "(7:comment)";  // what travels beside a certificate
inline std::string Sequence(std::initializer_list<std::string> triples) {
  std::string text;
  for (const std::string& triple : triples) text += triple;
  return List({Str("sequence"), text});
}

// Each names a source of revocation lists, or none.
inline std::string Link(unsigned issuer, const std::string& revocation = {}) {
  return Cert({.issuer = KeyText(issuer),
               .subject = KeyText(issuer + 1),
               .tag = Tag("(install)"),
               .propagate = true,
               .notBefore = kPast,
               .notAfter = kFuture,
               .revocation = revocation});
}
inline std::string SignedLink(unsigned issuer, const std::string& revocation = {}) {
  const std::string cert = Link(issuer, revocation);
  return cert + TestKey::Rsa(issuer).Sign(cert) + kNothing;
}
inline std::string Chain(const std::string& middleRevocation = {}) {
  return Sequence({SignedLink(2), SignedLink(1, middleRevocation), SignedLink(0)});
}

}  // namespace vesk2test

#endif  // VESK2_TESTS_FRAME_FLAT_CHAIN_TEXT_H
