// cert_issue.cpp: vesk2 cert issue.
#include "tools/vesk2/command.h"
#include "tools/vesk2/crl_file.h"
#include "tools/vesk2/files.h"
#include "tools/vesk2/issue.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::CertSequence;

struct Options {
  SignerOptions signer;
  std::string subject;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string owner;
  std::string chain;
  std::string revocation;
  std::string output;
  bool force = false;
};

void Append(CertSequence& sequence, DExpression* item) {
  Ref<DExpression> shared = Ref<DExpression>::Share(item);
  Check(sequence.Insert(shared.get()), "building a certificate sequence");
  (void)shared.Release();
}

// The third item of a triple: (owner TEXT), which callers of the library show to people, or
// (comment), which says nothing.
Ref<SExpression> OwnerItem(const std::string& owner) {
  Ref<SExpression> item;
  const int code = owner.empty() ? SExpression::Create(item.Out(), "comment", nullptr)
                                 : SExpression::Create(item.Out(), "owner", owner.c_str(), nullptr);
  Check(code, "--owner");
  return item;
}

ExitCode Run(const Options& options) {
  const Ref<PublicKey> subject = ReadPublicKey(options.subject);
  const Ref<SExpression> tag = ParseTag(options.tag);
  const Ref<ByteString> comment = MakeText(options.comment);
  const PrivateKey key = PrivateKey::Read(options.signer.key, options.signer.passphrase);
  Grant grant{subject.get(), options.propagate, tag.get(), ParsePeriod(options.period),
              comment.get()};
  Ref<SExpression> revocation;
  if (!options.revocation.empty()) {
    // Readers know the element by the length of its keyword, 10 to 19 characters.
    revocation = ParseRevocationTag(options.revocation, "revocation-list");
    grant.revocation = revocation.get();
  }
  CertChain chain;
  if (!options.chain.empty()) {
    chain = ReadCertChain(options.chain);
    RequireCertFor(chain, options.chain, *key.Public());
  }

  const SignedCert issued = IssueCert(key, grant, options.signer.algorithm);
  const Ref<CertSequence> sequence(new CertSequence(nullptr));
  Check(sequence->Init(), "building a certificate sequence");
  Append(*sequence, issued.cert.get());
  Append(*sequence, issued.signature.get());
  Append(*sequence, OwnerItem(options.owner).get());
  if (chain) {
    auto item = chain->Begin();
    for (item.Next(); item; item.Next()) Append(*sequence, item.Value());
  }
  const auto readBack = [](const std::string& temporary) { ReadCertChain(temporary); };
  WriteFile(options.output, Canonical(*sequence), {0666, options.force, readBack});
  Note("wrote " + Escape(options.output));
  return kYes;
}

}  // namespace

Action DefineCertIssue(CLI::App& app) {
  auto options = std::make_shared<Options>();
  AddSignerOptions(app, options->signer);
  app.add_option("--subject", options->subject, "The public key that is certified")->required();
  app.add_option("--tag", options->tag, "What for: \"(install (app calc))\"")->required();
  app.add_flag("--propagate", options->propagate,
               "The subject may certify further keys; signing manifests does not need it");
  AddPeriodOptions(app, options->period);
  app.add_option("--comment", options->comment, "A text for people, signed");
  app.add_option("--owner", options->owner, "Whose certificate this is; travels along unsigned");
  app.add_option("--chain", options->chain,
                 "Certificate file of the signing key, whose chain is appended");
  app.add_option(
      "--revocation", options->revocation,
      "Valid only while a current list of this source does not revoke it: \"calc (revoke "
      "all)\"");
  app.add_option("-o,--output", options->output, "The certificate file")->required();
  app.add_flag("-f,--force", options->force, "Replace an existing file");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
