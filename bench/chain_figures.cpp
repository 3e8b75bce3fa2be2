// SPDX-License-Identifier: Apache-2.0
// Verifying chains of certificates.
#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <sys/stat.h>
#include <vesk2.h>
#include <vesk2/crl.h>

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

std::string Source(unsigned number) {
  return vesk2test::Tag("source" + std::to_string(number) + " (revoke all)");
}

// A list of that source that names one certificate, vouched for by the root.
void WriteList(const Place& lists, unsigned number) {
  using vesk2test::List;
  const TestKey& root = TestKey::Rsa(0);
  const std::string crl = List(
      {"3:crl", "(7:version1:1)",
       List({"5:list1", List({"4:item", vesk2test::HashOf("another"), "19:2011-01-01_00:00:00"})}),
       "(5:list2)"});
  const std::string cert = vesk2test::Cert({.issuer = root.Public(),
                                            .subject = vesk2test::HashOf(crl),
                                            .tag = Source(number),
                                            .notAfter = "3001-01-01_00:00:00"});
  lists.Write(std::to_string(number) + ".crl", List({"8:sequence", crl, cert, root.Sign(cert)}));
}

// Each certificate has a source of its own, and a list of it.
Outcome VerifyWithLists(const Effort& effort, unsigned certificates) {
  const Place place("chain"), lists("lists"), theirs("x509");
  FillStore(place, 10 - certificates);
  std::vector<EVP_PKEY*> keys = {TestKey::Rsa(0).Pkey()};
  for (unsigned i = 0; i < certificates; ++i) {
    place.Write("acl/source" + std::to_string(i) + ".acl",
                vesk2test::AclEntryText(TestKey::Rsa(0).Public(), Source(i)));
    WriteList(lists, i);
    keys.push_back(TestKey::Rsa(i + 1).Pkey());
  }
  if (ZvVesk2::CrlSequence::ImportDirAndStore(lists.Path().c_str(), nullptr) != 0) {
    return Failed("lists that cannot be stored");
  }
  floor::WriteX509(theirs.Path(), keys);
  const std::string chain = WriteChain(place, certificates, nullptr, Source);
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
          right = right && floor::VerifyX509(theirs.Path(), certificates);
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

std::string WriteChain(const Place& place, unsigned certificates, std::vector<floor::Signed>* made,
                       std::string (*source)(unsigned)) {
  std::string text;
  for (unsigned i = certificates; i-- > 0;) {
    const TestKey& issuer = TestKey::Rsa(i);
    vesk2test::CertText parts{.issuer = issuer.Public(),
                              .subject = TestKey::Rsa(i + 1).Public(),
                              .tag = vesk2test::Tag("(install)"),
                              .propagate = true};
    if (source != nullptr) parts.revocation = source(i).replace(0, 6, "(10:revocation");
    const std::string cert = vesk2test::Cert(parts);
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
      {"C2a", "chain of 2, a revocation list a certificate",
       "X509_verify_cert, equal chain and lists", 0.45,
       [](const Effort& effort) { return VerifyWithLists(effort, 2); }},
      {"C2b", "of 3", "the same", 0.45,
       [](const Effort& effort) { return VerifyWithLists(effort, 3); }},
      {"C2c", "of 5", "the same", 0.45,
       [](const Effort& effort) { return VerifyWithLists(effort, 5); }},
  };
}

}  // namespace bench
