// SPDX-License-Identifier: Apache-2.0
// Verifying chains of certificates.
#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <sys/stat.h>
#include <vesk2.h>

#include "bench/chain.h"
#include "tests/support/test_manifest.h"

namespace bench {
namespace {

using vesk2test::TestKey;

constexpr unsigned kOthers = 16;  // keys of entries that have nothing to do with a chain

std::string Number(const TestKey& key, const char* name) {
  BIGNUM* raw = nullptr;
  EVP_PKEY_get_bn_param(key.Pkey(), name, &raw);
  const floor::Owned<BIGNUM, BN_free> number(raw);
  std::string bytes(static_cast<size_t>(BN_num_bytes(raw)), '\0');
  BN_bn2bin(raw, reinterpret_cast<unsigned char*>(bytes.data()));
  return bytes;
}

Outcome VerifyChain(const Effort& effort, unsigned certificates) {
  constexpr size_t kEntries = 10;
  const Place place("chain");
  FillStore(place, kEntries);
  std::vector<floor::Signed> signatures;
  const std::string chain = WriteChain(place, certificates, &signatures);
  const std::string store = place.Path() + "/acl";
  const size_t times = effort.Of(400, 100);
  return Ratio(
      effort,
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) {
          right = right && Vesk2CertVerifyFile(chain.c_str(), "(install)", 0, 0) == 0;
        }
        return right;
      },
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) {
          for (const floor::Signed& one : signatures) right = right && floor::CheckSignature(one);
          for (int scan = 0; scan < 2; ++scan) {
            right = right && floor::ScanStore(store.c_str()) == kEntries;
          }
        }
        return right;
      });
}

}  // namespace

void FillStore(const Place& place, size_t entries) {
  mkdir((place.Path() + "/acl").c_str(), 0700);
  for (size_t i = 0; i < entries; ++i) {
    // From the other end of the numbers that chains count up from.
    const unsigned other = 8 + static_cast<unsigned>(i % kOthers);
    const TestKey& key = TestKey::Rsa(i + 1 < entries ? other : 0);
    std::string name = std::to_string(i);
    name.insert(0, 6 - name.size(), '0');
    place.Write("acl/entry" + name + ".acl",
                vesk2test::AclEntryText(key.Public(), vesk2test::Tag("(install)")));
  }
  Vesk2GlobalDirectory(place.Path().c_str());
}

std::string WriteChain(const Place& place, unsigned certificates,
                       std::vector<floor::Signed>* made) {
  std::string text;
  for (unsigned i = certificates; i-- > 0;) {
    const TestKey& issuer = TestKey::Rsa(i);
    const std::string cert = vesk2test::Cert({.issuer = issuer.Public(),
                                              .subject = TestKey::Rsa(i + 1).Public(),
                                              .tag = vesk2test::Tag("(install)"),
                                              .propagate = true});
    text += cert + issuer.Sign(cert) + "(7:comment)";
    const std::string digest = vesk2test::Digest(cert);
    if (made == nullptr) continue;
    made->push_back({Number(issuer, OSSL_PKEY_PARAM_RSA_N), Number(issuer, OSSL_PKEY_PARAM_RSA_E),
                     digest, issuer.SignDigest(digest, "rsa-1.5", "sha256")});
  }
  return place.Write("chain.cert", vesk2test::List({vesk2test::Str("sequence"), text}));
}

Figures ChainFigures() {
  return {
      {"C1a", "chain of 2 verified, 10 entries", "key builds, EVP verifies, two bare scans", 1.45,
       [](const Effort& effort) { return VerifyChain(effort, 2); }},
      {"C1b", "of 3", "the same", 1.35,
       [](const Effort& effort) { return VerifyChain(effort, 3); }},
      {"C1c", "of 5", "the same", 1.30,
       [](const Effort& effort) { return VerifyChain(effort, 5); }},
  };
}

}  // namespace bench
