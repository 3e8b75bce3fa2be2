// SPDX-License-Identifier: Apache-2.0
// store_maker.cpp: random small stores, written without the library.
#include "tests/tools/store_maker.h"

#include <filesystem>
#include <stdexcept>

#include "tests/support/test_manifest.h"

namespace vesk2test {
namespace {

constexpr const char* kSource = "calc (revoke all)";
constexpr const char* kSigned = "2024-05-01_12:00:00";

// What is asked, and tags that hold it, meet it or miss it.
constexpr struct {
  const char* asked;
  const char* grants[6];
} kTags[] = {
    {"(install (app calc))",
     {"(install)", "(install (app calc))", "(install (app (* prefix ca)))",
      "(install (app (* set calc edit)))", "(install (app calc) (version 2))", "(remove)"}},
    {"(install)",
     {"(install)", "(*)", "(install (app calc))", "(install (app))", "(remove)",
      "(* set (install) (remove))"}},
    {"(read /usr/lib)",
     {"(read)", "(read (* prefix /usr/))", "(read (* set /usr/lib /etc))", "(read /usr/lib)",
      "(read (* prefix /etc))", "(write)"}},
    {"(level 7)",
     {"(level)", "(level (* range numeric (ge 5) (le 9)))", "(level 7)", "(*)",
      "(level (* range numeric (le 3)))", "(level 8)"}},
    {"(* set (read a) (write a))",
     {"(* set (read a) (write a))", "(*)", "(read)", "(read a)", "(* set (read) (write))",
      "(write a)"}},
    {"(read (* prefix /usr/))",
     {"(read)", "(read (* prefix /))", "(read (* prefix /usr/lib))", "(read /usr/lib)",
      "(read (* prefix /usr/))", "(* set (read) (write))"}},
};

}  // namespace

StoreMaker::StoreMaker(const TempDir& directory, unsigned seed)
    : directory_(directory), random_(seed) {
  for (unsigned i = 0; i < kKeys; ++i) {
    directory.Write("key" + std::to_string(i) + ".pem", Key(i).PrivatePem());
    std::string digits;
    for (const char byte : Digest(Key(i).Public())) {
      constexpr char kHex[] = "0123456789abcdef";
      digits += kHex[static_cast<unsigned char>(byte) >> 4];
      digits += kHex[static_cast<unsigned char>(byte) & 15];
    }
    fingerprints_.push_back(digits);
    CertText probe;
    probe.issuer = Key(i).Public();
    probe.subject = Key(kKeys).Public();
    directory.Write("probe" + std::to_string(i) + ".cert",
                    "(8:sequence" + Signed(probe, Key(i)) + "(7:comment))");
  }
  directory.Write("tree/one", "one\n");
  directory.Write("tree/sub/two", "two\n");
}

std::string StoreMaker::KeyFile(std::string_view digits) const {
  for (unsigned i = 0; i < kKeys; ++i) {
    if (fingerprints_[i].starts_with(digits)) return "key" + std::to_string(i) + ".pem";
  }
  throw std::runtime_error("no key " + std::string(digits));
}

std::vector<std::string> StoreMaker::Requests() {
  std::vector<std::string> requests;
  for (const auto& row : kTags) requests.emplace_back(row.asked);
  return requests;
}

std::string StoreMaker::Grant(const std::string& asked) {
  for (const auto& row : kTags) {
    if (asked == row.asked) return Chance(60) ? row.grants[0] : row.grants[Pick(6)];
  }
  throw std::runtime_error("no tag " + asked);
}

void StoreMaker::Period(std::string& notBefore, std::string& notAfter) {
  if (Chance(60)) return;
  constexpr const char* kBegins[] = {"", "2020-01-01_00:00:00", "2024-01-01_00:00:00",
                                     "2025-06-01_00:00:00"};
  constexpr const char* kEnds[] = {"", "2024-12-31_23:59:59", "2025-12-31_23:59:59",
                                   "2030-12-31_23:59:59"};
  notBefore = kBegins[Pick(4)];
  notAfter = kEnds[Pick(4)];
}

std::string StoreMaker::EntrySubject(const std::vector<unsigned>& holders) {
  if (Chance(10)) {
    const unsigned n = 2 + Pick(2);
    std::string members;
    for (unsigned i = 0; i < n; ++i) {
      made_.members.insert((holders.back() + i) % kKeys);
      members += Key((holders.back() + i) % kKeys).Public();
    }
    return "(6:k-of-n1:\x02"
           "1:" +
           std::string(1, static_cast<char>(n)) + members + ")";
  }
  const std::string key = Key(Chance(75) ? holders.back() : Pick(kKeys)).Public();
  return Chance(10) ? HashOf(key, Chance(50) ? "sha1" : "sha256") : key;
}

void StoreMaker::WriteEntries(const std::string& asked, const std::vector<unsigned>& holders) {
  const unsigned count = 1 + Pick(3);
  for (unsigned i = 0; i < count; ++i) {
    std::string notBefore;
    std::string notAfter;
    Period(notBefore, notAfter);
    directory_.Write(
        "global/acl/" + std::string(1, static_cast<char>('a' + Pick(26))) + std::to_string(i) +
            ".acl",
        AclEntryText(EntrySubject(holders), Tag(Grant(asked)), Chance(80), notBefore, notAfter));
  }
}

// The pairs of the chain, from the end to the root.
std::string StoreMaker::WriteChain(const std::string& asked, const std::vector<unsigned>& holders) {
  certs_.clear();
  subjects_.clear();
  revocable_ = false;
  std::string pairs;
  std::string triples;
  for (size_t i = 0; i + 1 < holders.size(); ++i) {
    CertText cert;
    const unsigned issuer = Chance(4) ? Pick(kKeys) : holders[i + 1];
    cert.issuer = Key(issuer).Public();
    subjects_.push_back(Chance(4) && i > 0 ? Pick(kKeys) : holders[i]);
    cert.subject = Key(subjects_.back()).Public();
    cert.propagate = Chance(i == 0 ? 30 : 80);
    cert.tag = Chance(10) ? "" : Tag(Grant(asked));
    Period(cert.notBefore, cert.notAfter);
    cert.version = Chance(80);
    if (Chance(12)) {
      cert.revocation = "(15:revocation-list4:calc(6:revoke3:all))";
      revocable_ = true;
    }
    certs_.push_back(Cert(cert));
    const unsigned signer = Chance(3) ? Pick(kKeys) : issuer;
    const std::string signed_text = Chance(2) ? certs_.back() + " " : certs_.back();
    const std::string pair = certs_.back() + Key(signer).Sign(signed_text);
    pairs += pair;
    triples += pair + "(7:comment)";
  }
  directory_.Write("chain.cert", "(8:sequence" + triples + ")");
  return pairs;
}

std::string StoreMaker::List(const TestKey& signer, const std::string& notAfter,
                             const std::vector<std::string>& certs, const std::string& key) const {
  const auto item = [](const std::string& hash, const char* date) {
    return vesk2test::List({Str("item"), hash, Str(date)});
  };
  std::string list1 =
      item(vesk2test::List({Str("hash"), Str("sha256"), Str(std::string(32, '\0'))}),
           "2024-01-01_00:00:00");
  for (const std::string& cert : certs) list1 += item(HashOf(cert), "2024-01-01_00:00:00");
  const std::string list2 = key.empty() ? "" : item(HashOf(key), "2024-01-01_00:00:00");
  const std::string crl = vesk2test::List({Str("crl"), vesk2test::List({Str("version"), Str("1")}),
                                           vesk2test::List({Str("list1"), list1}),
                                           vesk2test::List({Str("list2"), list2})});
  CertText cert;
  cert.issuer = signer.Public();
  cert.subject = HashOf(crl);
  cert.tag = Tag(kSource);
  cert.notAfter = notAfter;
  return "(8:sequence" + crl + Signed(cert, signer) + ")";
}

void StoreMaker::WriteLists() {
  if (!revocable_) return;
  const unsigned revoker = 5;
  const bool vouched = Chance(85);
  if (vouched) {
    directory_.Write("global/acl/m-revoker.acl", AclEntryText(Key(revoker).Public(), Tag(kSource)));
  }
  if (Chance(30)) return;  // no list
  const unsigned signer = Chance(10) ? Pick(kKeys) : revoker;
  const bool counts = vouched && signer == revoker;
  std::vector<std::string> revoked;
  if (Chance(20)) {
    const unsigned index = Pick(static_cast<unsigned>(certs_.size()));
    revoked.push_back(certs_[index]);
    // The list is asked about certificates that name it.
    if (counts && certs_[index].find("15:revocation-list") != std::string::npos) {
      made_.revoked.insert(subjects_[index]);
    }
  }
  const unsigned key = Chance(10) ? Pick(kKeys) : kKeys;
  if (counts && key < kKeys) made_.revoked.insert(key);
  directory_.Write("global/cert/" + std::string(kSource) + ".crl",
                   List(Key(signer), Chance(30) ? "2023-12-31_23:59:59" : "2031-12-31_23:59:59",
                        revoked, key < kKeys ? Key(key).Public() : ""));
}

void StoreMaker::WriteManifest(const std::vector<unsigned>& holders, const std::string& chain,
                               const std::string& asked) {
  ManifestText parts;
  parts.signingTime = kSigned;
  parts.key = &Key(Chance(4) ? Pick(kKeys) : holders[0]);
  if (Chance(15)) parts.signer.tag = Tag(Grant(asked));
  Period(parts.signer.notBefore, parts.signer.notAfter);
  parts.chain = chain;
  parts.body = BodyOf(directory_.File("tree"));
  if (Chance(3)) parts.signer.subject = HashOf("another listing");
  directory_.Write("tree.manifest", ManifestFile(parts));
}

StoreCase StoreMaker::Make() {
  std::filesystem::remove_all(directory_.File("global"));
  made_ = {};
  made_.manifest = Chance(25);
  made_.tag = kTags[Pick(std::size(kTags))].asked;
  constexpr const char* kMoments[] = {"2024-06-01_00:00:00", "2025-03-01_00:00:00",
                                      "2026-08-01_00:00:00"};
  if (!made_.manifest || Chance(50)) made_.at = kMoments[Pick(3)];
  // The end of the chain first, the root last.
  const unsigned first = Pick(2);
  std::vector<unsigned> holders;
  const unsigned count = 2 + Pick(3);
  for (unsigned i = 0; i < count; ++i) holders.push_back((first + i) % kKeys);
  WriteEntries(made_.tag, holders);
  const std::string chain = WriteChain(made_.tag, holders);
  WriteLists();
  if (made_.manifest) WriteManifest(holders, chain, made_.tag);
  return made_;
}

}  // namespace vesk2test
