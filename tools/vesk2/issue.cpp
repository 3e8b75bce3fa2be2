// issue.cpp: making certificates.
#include "tools/vesk2/issue.h"

#include "tools/vesk2/report.h"

namespace vesk2_command {

using ZvVesk2::Cert;
using ZvVesk2::CertSequence;

void AddSignerOptions(CLI::App& app, SignerOptions& options) {
  app.add_option("--key", options.key, "The private key (PEM) that signs")->required();
  app.add_option("--algorithm", options.algorithm, "How an RSA key signs, over SHA-256")
      ->check(CLI::IsMember({"rsa-pss", "rsa-1.5"}))
      ->capture_default_str();
  AddPassphraseOptions(app, options.passphrase);
}

Grant Renewed(const Cert& old, const Renewal& renewal) {
  Grant grant{old.GetSubject(), old.GetPropagate() || renewal.propagate};
  grant.tag = renewal.tag ? renewal.tag.get() : old.GetTag();
  const bool fresh = renewal.newPeriod;
  grant.period.notBefore =
      Ref<TimeStamp>::Share(fresh ? renewal.period.notBefore.get() : old.GetNotBefore());
  grant.period.notAfter =
      Ref<TimeStamp>::Share(fresh ? renewal.period.notAfter.get() : old.GetNotAfter());
  grant.comment = renewal.comment ? renewal.comment.get() : old.GetComment();
  grant.revocation = old.GetRevocationElement();
  return grant;
}

SignedCert IssueCert(const PrivateKey& key, const Grant& grant, const std::string& algorithm) {
  const Ref<PublicKey> issuer = key.Public();
  SignedCert result{Ref<Cert>(new Cert(nullptr)), {}};
  Check(result.cert->Set(issuer.get(), grant.subject, grant.propagate, grant.tag,
                         grant.period.notBefore.get(), grant.period.notAfter.get(), grant.comment,
                         grant.revocation),
        "building a certificate");
  result.signature = key.Sign(*result.cert, algorithm);
  return result;
}

CertChain ReadCertChain(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  CertChain chain;
  int code = CertSequence::Import(chain.Out(), buffer.get(), nullptr);
  if (code == 0 && buffer->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
  if (code != 0) Malformed(path, buffer->Position(), "certificate sequence", code);
  return chain;
}

void RequireCertFor(const CertChain& chain, const std::string& path, PublicKey& key) {
  auto item = chain->Begin();
  if (item) item.Next();  // the keyword
  auto* cert = item ? dynamic_cast<Cert*>(item.Value()) : nullptr;
  if (cert == nullptr) throw Trouble(Escape(path) + ": holds no certificate");
  if (!cert->GetSubject()->IsEqual(&key)) {
    throw Trouble(Escape(path) + ": its first certificate is for " +
                  Fingerprint(*cert->GetSubject()) + ", not for the signing key " +
                  Fingerprint(key));
  }
}

}  // namespace vesk2_command
