// issue.h: making certificates: what `cert issue` and `manifest sign` share.
#ifndef VESK2_TOOLS_ISSUE_H
#define VESK2_TOOLS_ISSUE_H

#include <CLI/CLI.hpp>
#include <string>

#include "tools/vesk2/keys.h"
#include "tools/vesk2/times.h"

#include <vesk2/cert.h>
#include <vesk2/cert_sequence.h>

namespace vesk2_command {

// The private key that signs, and how.
struct SignerOptions {
  std::string key;
  std::string algorithm = "rsa-pss";
  PassphraseOptions passphrase;
};
void AddSignerOptions(CLI::App& app, SignerOptions& options);

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
SignedCert IssueCert(const PrivateKey& key, const Grant& grant, const std::string& algorithm);

// A certificate sequence file, in the order of the file: the end-entity certificate first.
using CertChain = Ref<ZvVesk2::CertSequence>;
CertChain ReadCertChain(const std::string& path);
// Trouble unless the first certificate of a chain is for `key`, which is about to sign below it.
void RequireCertFor(const CertChain& chain, const std::string& path, PublicKey& key);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_ISSUE_H
