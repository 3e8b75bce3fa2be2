// SPDX-License-Identifier: Apache-2.0
// strength.cpp: keys and digests that are weaker than what is made today.
#include <set>

#include "tools/vesk2/audit/checks.h"
#include "tools/vesk2/objects/texts.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::CertSequence;
using ZvVesk2::Hash;
using ZvVesk2::Signature;
using ZvVesk2::ThresholdSubject;

constexpr uint32_t kRsaBits = 2048;

// What a file names, each of it once.
class FileStrength {
 public:
  FileStrength(Findings& findings, const std::string& path) : findings_(findings), path_(path) {}

  void Name(DExpression* subject) {
    if (auto* key = dynamic_cast<PublicKey*>(subject)) return NameKey(*key);
    if (auto* hash = dynamic_cast<Hash*>(subject))
      return NameDigest(*hash, "names a key or content");
    auto* threshold = dynamic_cast<ThresholdSubject*>(subject);
    if (threshold == nullptr) return;
    for (ZvVesk2::Subject* const member : MembersOf(*threshold)) Name(member);
  }
  void NameSignature(const Signature* signature) {
    if (signature != nullptr && signature->GetHash() != nullptr) {
      NameDigest(*signature->GetHash(), "is signed");
    }
  }
  void NameCert(const Cert& cert) {
    Name(cert.GetIssuer());
    Name(cert.GetSubject());
  }

 private:
  void NameKey(PublicKey& key) {
    const bool rsa = key.GetType() == ZVCLM_KEY_RSA;
    if (rsa && key.GetLength() >= kRsaBits) return;
    const std::string kind = rsa ? "an RSA key" : "a DSA key";
    Once("weak-key",
         Fingerprint(key) + " is " + kind + " of " + std::to_string(key.GetLength()) + " bits");
  }
  void NameDigest(const Hash& hash, const std::string& does) {
    if (hash.GetAlgorithm() == ZVCLM_HASH_SHA256) return;
    Once("weak-digest", "it " + does + " by a digest of 160 bits (SHA-1 or RIPEMD)");
  }
  void Once(const std::string& word, const std::string& text) {
    if (!told_.insert(text).second) return;
    if (word == "weak-key") {
      findings_.Add("weak-key", path_, text);
    } else {
      findings_.Add("weak-digest", path_, text);
    }
  }

  Findings& findings_;
  const std::string& path_;
  std::set<std::string> told_;
};

}  // namespace

void CheckStrength(const Stores& stores, Findings& findings) {
  for (const Stored<AclEntry>& each : stores.entries) {
    FileStrength(findings, each.path).Name(each.object->GetSubject());
  }
  for (const Stored<CrlSequence>& each : stores.lists) {
    FileStrength file(findings, each.path);
    file.NameCert(*each.object->GetCert());
    file.NameSignature(each.object->GetSignature());
  }
  for (const Stored<CertSequence>& each : stores.chains) {
    FileStrength file(findings, each.path);
    for (const ChainLink& link : ChainLinks(CertChain::Share(each.object.get()), each.path)) {
      file.NameCert(*link.cert);
      file.NameSignature(link.signature);
    }
  }
}

}  // namespace vesk2_command
