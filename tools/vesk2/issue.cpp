// issue.cpp: making certificates.
#include "tools/vesk2/issue.h"

#include "tools/vesk2/external_key.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/tag_bounds.h"

namespace vesk2_command {

using ZvVesk2::Cert;
using ZvVesk2::CertSequence;

void AddSignerOptions(CLI::App& app, SignerOptions& options, SignerCount count) {
  const bool several = count == SignerCount::kSeveral;
  auto* key = app.add_option("--key", options.keys,
                             several ? "The private key (PEM) that signs; several sign one each"
                                     : "The private key (PEM) that signs");
  key->required()->allow_extra_args(false);
  if (!several) key->expected(1);
  app.add_option("--algorithm", options.algorithm, "How an RSA key signs, over SHA-256")
      ->check(CLI::IsMember({"rsa-pss", "rsa-1.5"}))
      ->capture_default_str();
  app.add_option("--sign-with", options.program,
                 "Run this by /bin/sh to sign, --key being the public key: it reads the digest and "
                 "writes the signature, both raw");
  AddPassphraseOptions(app, options.passphrase);
}

std::unique_ptr<SigningKey> OpenSigner(const SignerOptions& options, size_t index) {
  const std::string& path = options.keys[index];
  if (!options.program.empty()) return std::make_unique<ExternalKey>(options.program, path);
  return std::make_unique<PrivateKey>(PrivateKey::Read(path, options.passphrase));
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

SignedCert IssueCert(const SigningKey& key, const Grant& grant, const std::string& algorithm) {
  RequirePlainBounds(grant.tag);
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

namespace {

void AppendItem(CertSequence& sequence, DExpression* item) {
  auto shared = Ref<DExpression>::Share(item);
  Check(sequence.Insert(shared.get()), "building a certificate sequence");
  (void)shared.Release();
}

}  // namespace

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
  AppendItem(sequence, issued.cert.get());
  AppendItem(sequence, issued.signature.get());
  AppendItem(sequence, item.get());
}

void AppendChain(CertSequence& sequence, const CertSequence& chain) {
  auto item = chain.Begin();
  for (item.Next(); item; item.Next()) AppendItem(sequence, item.Value());
}

void WriteSequence(CertSequence& sequence, const std::string& path, const WriteFlags& flags) {
  const auto readBack = [](const std::string& temporary) { ReadCertChain(temporary); };
  const bool wrote =
      WriteFile(path, Canonical(sequence), {0666, flags.force, readBack, flags.dryRun});
  if (wrote && path != kStandard) Note("wrote " + Escape(path));
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
