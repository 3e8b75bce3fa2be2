// SPDX-License-Identifier: Apache-2.0
// cert_chain.cpp: certificate sequence files.
#include "tools/vesk2/objects/cert_chain.h"

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

using ZvVesk2::Cert;
using ZvVesk2::CertSequence;
using ZvVesk2::Signature;

CertChain ReadCertChain(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  CertChain chain;
  int code = CertSequence::Import(chain.Out(), buffer.get(), nullptr);
  if (code == 0 && buffer->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
  if (code != 0) Malformed(path, buffer->Position(), "certificate sequence", code);
  return chain;
}

std::vector<ChainLink> ChainLinks(const CertChain& chain, const std::string& path) {
  std::vector<ChainLink> links;
  auto item = chain->Begin();
  item.Next();  // the keyword
  // The reader of chains accepts whole triples of these kinds only.
  while (item) {
    ChainLink link = {};
    link.cert = dynamic_cast<Cert*>(item.Value());
    item.Next();
    link.signature = dynamic_cast<Signature*>(item.Value());
    item.Next();
    link.extra = dynamic_cast<SExpression*>(item.Value());
    item.Next();
    links.push_back(link);
  }
  if (links.empty()) throw Trouble(InputName(path) + ": holds no certificate");
  return links;
}

CertChain NewSequence() {
  CertChain sequence(new CertSequence(nullptr));
  Check(sequence->Init(), "building a certificate sequence");
  return sequence;
}

void Append(CertSequence& sequence, const SignedCert& issued, const std::string& owner) {
  Ref<SExpression> item;
  const int code = owner.empty() ? SExpression::Create(item.Out(), "comment", nullptr)
                                 : SExpression::Create(item.Out(), "owner", owner.c_str(), nullptr);
  Check(code, "--owner");
  Append(sequence, *issued.cert);
  Append(sequence, *issued.signature);
  Append(sequence, *item);
}

void AppendChain(CertSequence& sequence, const CertSequence& chain) {
  auto item = chain.Begin();
  for (item.Next(); item; item.Next()) Append(sequence, *item.Value());
}

void WriteSequence(CertSequence& sequence, const std::string& path, const WriteFlags& flags) {
  const auto readBack = [](const std::string& temporary) { ReadCertChain(temporary); };
  WriteFile(path, Canonical(sequence), {flags, readBack});
}

void RequireCertFor(const CertChain& chain, const std::string& path, PublicKey& key) {
  const Cert* const cert = ChainLinks(chain, path)[0].cert;
  if (!cert->GetSubject()->IsEqual(&key)) {
    throw Trouble(InputName(path) + ": its first certificate is for " +
                  Fingerprint(*cert->GetSubject()) + ", not for the signing key " +
                  Fingerprint(key));
  }
}

}  // namespace vesk2_command
