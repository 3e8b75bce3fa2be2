// SPDX-License-Identifier: Apache-2.0
// cert_chain.h: certificate sequence files.
#ifndef VESK2_TOOLS_CERT_CHAIN_H
#define VESK2_TOOLS_CERT_CHAIN_H

#include <string>
#include <vector>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/objects.h"

#include <vesk2/cert.h>
#include <vesk2/cert_sequence.h>

namespace vesk2_command {

struct SignedCert {
  Ref<ZvVesk2::Cert> cert;
  Ref<ZvVesk2::Signature> signature;
};
// A certificate sequence file, in the order of the file: the end-entity certificate first.
using CertChain = Ref<ZvVesk2::CertSequence>;
CertChain ReadCertChain(const std::string& path);

// One triple of a certificate sequence, borrowed from it.
struct ChainLink {
  ZvVesk2::Cert* cert;
  ZvVesk2::Signature* signature;
  SExpression* extra;
};
// The links of a chain read from `path`; Trouble when there are none.
std::vector<ChainLink> ChainLinks(const CertChain& chain, const std::string& path);

// NewSequence makes an empty one, for the triples of Append. The third item of a triple is (owner
// TEXT), which callers of the library show to people, or (comment), which says nothing.
CertChain NewSequence();
void Append(ZvVesk2::CertSequence& sequence, const SignedCert& issued, const std::string& owner);
// AppendChain adds the triples of another sequence, shared.
void AppendChain(ZvVesk2::CertSequence& sequence, const ZvVesk2::CertSequence& chain);
// WriteSequence writes a sequence file once it can be read back.
void WriteSequence(ZvVesk2::CertSequence& sequence, const std::string& path,
                   const WriteFlags& flags);
// Trouble unless the first certificate of a chain is for `key`, which is about to sign below it.
void RequireCertFor(const CertChain& chain, const std::string& path, PublicKey& key);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_CERT_CHAIN_H
