// SPDX-License-Identifier: Apache-2.0
// Inputs that ask for much work.
#include "tests/support/test_load.h"

#include "tests/support/test_manifest.h"

namespace vesk2test {
namespace {

const TestKey& Issuer() { return TestKey::Rsa(0); }
const TestKey& Stranger() { return TestKey::Rsa(1); }

const std::string kSource = Tag("load (revoke all)");

CertText StrangersCert(size_t number) {
  return {.issuer = Stranger().Public(),
          .subject = Stranger().Public(),
          .tag = Tag("load"),
          .comment = std::to_string(number),
          .revocation = "(10:revocation4:load(6:revoke3:all))"};
}

}  // namespace

std::string LoadRoot() { return AclEntryText(Issuer().Public(), kSource); }

std::string LoadCert(size_t number) { return Cert(StrangersCert(number)); }

std::string LoadList(const RevocationLoad& load, size_t number) {
  std::string items;
  for (size_t i = 0; i < load.items; ++i) {
    const std::string named = std::to_string(number) + "/" + std::to_string(i);
    items += List({Str("item"), HashOf(named), Str("2011-01-01_00:00:00")});
  }
  const std::string crl =
      List({Str("crl"), "(7:version1:1)", List({Str("list1"), load.keys ? "" : items}),
            List({Str("list2"), load.keys ? items : ""})});
  const std::string cert = Cert({.issuer = Issuer().Public(),
                                 .subject = HashOf(crl),
                                 .tag = kSource,
                                 .notAfter = "3001-01-01_00:00:00"});
  // A signature over other bytes: all but the arithmetic of the check succeeds.
  std::string signature = Issuer().Sign(cert);
  if (!load.genuine) signature[signature.size() - 5] ^= 1;
  return List({Str("sequence"), crl, cert, signature});
}

std::string LoadManifest(const RevocationLoad& load) {
  ManifestText parts;
  parts.key = &Stranger();
  parts.signer = StrangersCert(load.certificates);
  parts.signer.subject.clear();
  parts.body = Body("");
  for (size_t i = 0; i < load.certificates; ++i) {
    parts.chain += Signed(StrangersCert(i), Stranger());
  }
  for (size_t i = 0; i < load.lists; ++i) parts.lists += LoadList(load, i);
  return ManifestFile(parts);
}

}  // namespace vesk2test
