// cert_verify.cpp: vesk2 cert verify.
#include "tools/vesk2/command.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/stores.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;

struct Options {
  std::string file;
  std::string tag;
  std::string at;
  PeriodOptions period;
};

Period AskedPeriod(const Options& options) {
  if (!options.period.notBefore.empty() || !options.period.notAfter.empty()) {
    return ParsePeriod(options.period);
  }
  const std::string at = options.at.empty() ? "now" : options.at;
  return {ParseTime(at, false), ParseTime(at, false)};
}

// What the library's verification left in a certificate, and what its signature is worth.
void ExplainLink(const ChainLink& link, const std::string& name) {
  const Cert& cert = *link.cert;
  const int code = link.signature->Verify(link.cert);
  if (code != 0) Note(name + ": " + Reason(code));
  switch (cert.GetRevocationStatus()) {
    case Cert::RevokedByCrl:
      return Note(name + " is revoked");
    case Cert::KeyRevoked:
      return Note(name + " is for a revoked key, " + SubjectText(*cert.GetSubject()));
    case Cert::Undetermined: {
      SExpression* source = cert.GetRevocationElement();
      return Note(name + ": no current revocation list tells whether it is revoked" +
                  (source != nullptr ? "; its source is " + SourceText(*source) : ""));
    }
    default:
      return;
  }
}

// The stamp of (not-before STAMP) or (not-after STAMP); null without one.
const ByteString* StampOf(const Ref<SExpression>& limit) {
  return limit ? dynamic_cast<ByteString*>(limit->Last()) : nullptr;
}

// What the chain does grant, beside what was asked for.
void ExplainGrant(const CertChain& chain, const std::vector<ChainLink>& links, SExpression* asked,
                  const Period& period) {
  Ref<SExpression> tag;
  Ref<SExpression> notBefore;
  Ref<SExpression> notAfter;
  if (chain->Verify2(tag.Out(), notBefore.Out(), notAfter.Out()) != 0) return;
  if (tag) {
    std::string limits;
    for (const auto* limit : {&notBefore, &notAfter}) {
      const ByteString* stamp = StampOf(*limit);
      if (stamp == nullptr) continue;
      limits += limit == &notBefore ? " from " : " until ";
      limits += Escape({reinterpret_cast<const char*>(stamp->GetData()), stamp->GetLength()});
    }
    return Note("the chain grants " + TagText(tag.get()) + limits + ", asked was " +
                TagText(asked) + " " + PeriodText(period.notBefore.get(), period.notAfter.get()));
  }
  for (size_t i = 1; i < links.size(); ++i) {
    if (links[i].cert->GetPropagate()) continue;
    Note("certificate " + std::to_string(i + 1) + " does not let its subject pass the grant on");
  }
  Note("the chain grants nothing: no ACL entry in " + Escape(AclDirectory()) +
       " leads along it to " + SubjectText(*links[0].cert->GetSubject()));
}

ExitCode Run(const Options& options) {
  const Ref<SExpression> tag = ParseTag(options.tag);
  const Period period = AskedPeriod(options);
  const CertChain chain = ReadCertChain(options.file);
  const std::vector<ChainLink> links = ChainLinks(chain, options.file);
  (void)LoadAcls();  // says why there is nothing to go by

  const int code = chain->Verify(nullptr, tag.get(), period.notBefore.get(), period.notAfter.get());
  if (code == 0) {
    return Yes(SubjectText(*links[0].cert->GetSubject()) + " is granted " + TagText(tag.get()));
  }
  if (code < 0 || code == VESK2_ERR_MEM_ALLOC) Check(code, Escape(options.file));
  const ExitCode verdict = No(code, CodeWords(code));
  for (size_t i = 0; i < links.size(); ++i) {
    ExplainLink(links[i], "certificate " + std::to_string(i + 1) + " (issuer " +
                              SubjectText(*links[i].cert->GetIssuer()) + ")");
  }
  if (code == VESK2_ERR_NOT_AUTHORIZED || code == VESK2_ERR_PACKAGE_NOT_GRANTED) {
    ExplainGrant(chain, links, tag.get(), period);
  }
  return verdict;
}

}  // namespace

Action DefineCertVerify(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("file", options->file, "The certificate file: a chain")->required();
  app.add_option("--tag", options->tag, "What its first subject must be authorized for")
      ->required();
  AddPeriodOptions(app, options->period);
  app.add_option("--at", options->at, "Authorized at this moment [now]")
      ->excludes("--not-before")
      ->excludes("--not-after");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
