// issue.h: making certificates: what `cert issue`, `cert request`, `crl issue` and `manifest sign`
// share.
#ifndef VESK2_TOOLS_ISSUE_H
#define VESK2_TOOLS_ISSUE_H

#include <CLI/CLI.hpp>
#include <memory>
#include <string>
#include <vector>

#include "tools/vesk2/files.h"
#include "tools/vesk2/keys.h"
#include "tools/vesk2/times.h"

#include <vesk2/cert.h>
#include <vesk2/cert_sequence.h>

namespace vesk2_command {

// The keys that sign, and how.
struct SignerOptions {
  std::vector<std::string> keys;
  std::string algorithm = "rsa-pss";
  std::string program;  // that has the private keys; `keys` are then the public ones
  PassphraseOptions passphrase;
};
enum class SignerCount { kOne, kSeveral };
void AddSignerOptions(CLI::App& app, SignerOptions& options, SignerCount count = SignerCount::kOne);
// OpenSigner returns the signer of one of the keys, by default the only one.
std::unique_ptr<SigningKey> OpenSigner(const SignerOptions& options, size_t index = 0);

// What a certificate says, beside its issuer. Only the subject is required; without a tag it passes
// on all that the issuer was granted.
struct Grant {
  ZvVesk2::Subject* subject = nullptr;
  bool propagate = false;
  SExpression* tag = nullptr;
  Period period = {};
  ByteString* comment = nullptr;
  SExpression* revocation = nullptr;  // where lists tell whether the certificate is revoked
};

// What a certificate that replaces another says differently; what is not set stays as it was.
struct Renewal {
  Ref<SExpression> tag = {};
  bool propagate = false;  // lets the subject pass it on
  bool newPeriod = false;  // the whole period is replaced
  Period period = {};
  Ref<ByteString> comment = {};
};
Grant Renewed(const ZvVesk2::Cert& old, const Renewal& renewal);

struct SignedCert {
  Ref<ZvVesk2::Cert> cert;
  Ref<ZvVesk2::Signature> signature;
};
SignedCert IssueCert(const SigningKey& key, const Grant& grant, const std::string& algorithm);

// A certificate sequence file, in the order of the file: the end-entity certificate first.
using CertChain = Ref<ZvVesk2::CertSequence>;
CertChain ReadCertChain(const std::string& path);

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

#endif  // VESK2_TOOLS_ISSUE_H
