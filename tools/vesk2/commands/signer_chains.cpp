// SPDX-License-Identifier: Apache-2.0
// signer_chains.cpp: the certificates of a key that signs a manifest.
#include "tools/vesk2/commands/signer_chains.h"

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/join.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

bool IsManifest(const std::string& path) { return OpenBuffer(path)->LooksAt("(8:manifest"); }

// What a manifest holds beside what is about its own content.
ChainFile ChainOfManifest(const std::string& path, PublicKey& signer) {
  const SignatureBlock block = ReadSignatureBlock(path);
  RequireCert(block.certs, 2, path);
  ChainFile file{path, {}};
  for (const SignedCert& each : block.certs) {
    if (IsForContent(block, *each.cert)) continue;
    file.parts.push_back({{Ref<ZvVesk2::Cert>::Share(each.cert.get()),
                           Ref<ZvVesk2::Signature>::Share(each.signature.get())}});
  }
  if (!file.parts.empty() && file.parts.front().signedCert.cert->GetSubject()->IsEqual(&signer)) {
    return file;
  }
  throw Trouble(InputName(path) + ": signed by " + Fingerprint(*block.certs[0].cert->GetIssuer()) +
                ", not by the signing key " + Fingerprint(signer));
}

ChainFile ChainOfKey(const std::string& path, PublicKey& signer) {
  if (IsManifest(path)) return ChainOfManifest(path, signer);
  RequireCertFor(ReadCertChain(path), path, signer);
  return ReadChainFile(path);
}

}  // namespace

bool IsForContent(const SignatureBlock& block, const ZvVesk2::Cert& cert) {
  return cert.GetSubject()->IsEqual(block.certs.front().cert->GetSubject());
}

std::vector<SignedCert> ReadSignerChains(const std::vector<std::string>& paths, PublicKey& signer) {
  std::vector<SignedCert> certs;
  if (paths.empty()) return certs;
  std::vector<ChainFile> files;
  for (const std::string& path : paths) files.push_back(ChainOfKey(path, signer));
  for (ChainPart& part : JoinChains(std::move(files))) certs.push_back(std::move(part.signedCert));
  return certs;
}

void CheckSignerChains(SelfCheck& check, const std::vector<std::string>& paths,
                       const Ref<PublicKey>& signer, SExpression* tag, const TimeStamp* at) {
  bool first = true;  // it may pass on to the content what it was granted
  for (const std::string& path : paths) {
    SelfCheck::Chain chain{path, ReadCerts(path)};
    chain.signers.push_back(Ref<PublicKey>::Share(signer.get()));
    chain.tag = tag;
    chain.at = at;
    const size_t own = IsManifest(path) ? 1 : 0;
    chain.passing = own + (first ? 1 : 0);
    first &= own < chain.certs.size() && chain.certs[own].cert->GetPropagate();
    check.CheckChain(chain);
  }
}

}  // namespace vesk2_command
