// SPDX-License-Identifier: Apache-2.0
// cert_issue.cpp: vesk2 cert issue.
#include <algorithm>
#include <set>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/join.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/verify/self_check.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;
using Signers = std::vector<std::unique_ptr<SigningKey>>;

struct Options {
  SignerOptions signer;
  std::string subject;
  std::string subjectOf;
  std::string request;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string owner;
  std::vector<std::string> chains;
  std::string revocation;
  std::string output;
  bool strict = false;
  WriteFlags flags;
};

// Whom the certificate is for, and what for.
struct Wish {
  Ref<ZvVesk2::Subject> subject;
  Ref<SExpression> tag;
  std::string owner;
};

std::string OwnerOf(const ChainLink& link) {
  const Text text(link.extra->ExportTag("owner"));
  return text ? text.get() : "";
}

// A request proves that its key asks for just this. What its issuer grants may be less.
Wish ReadRequest(const Options& options) {
  const std::string& path = options.request;
  const CertChain chain = ReadCertChain(path);
  const std::vector<ChainLink> links = ChainLinks(chain, path);
  const Cert& cert = *links[0].cert;
  if (links.size() != 1 || !cert.GetSubject()->IsEqual(cert.GetIssuer())) {
    throw FileTrouble(path, "not a request: one certificate of a key for itself", "malformed");
  }
  const int code = links[0].signature->Verify(links[0].cert);
  if (code != 0) throw FileTrouble(path, "the request: " + Reason(code), ReasonWord(code));
  Note("request of " + SubjectText(*cert.GetSubject()) + " for " + TagText(cert.GetTag()) +
       (cert.GetComment() != nullptr ? ": " + Escape(BytesOf(*cert.GetComment())) : ""));
  Wish wish{Ref<ZvVesk2::Subject>::Share(cert.GetSubject()), Ref<SExpression>::Share(cert.GetTag()),
            OwnerOf(links[0])};
  if (options.tag.empty()) {
    if (!wish.tag) throw FileTrouble(path, "asks for everything: --tag says how much", "usage");
    return wish;
  }
  Ref<SExpression> tag = ParseIssuedTag(options.tag);
  if (wish.tag && !tag->IsSubset(wish.tag.get())) {
    throw Trouble(
        "--tag " + TagText(tag.get()) + " is more than was requested, " + TagText(wish.tag.get()),
        "wider-than-requested");
  }
  wish.tag = std::move(tag);
  return wish;
}

Wish ReadWish(const Options& options) {
  if (!options.request.empty()) return ReadRequest(options);
  if (options.subject.empty() && options.subjectOf.empty()) {
    throw Trouble("nobody to certify: --subject, --subject-of or --request", "usage");
  }
  if (options.tag.empty()) throw Trouble("--tag is required", "usage");
  Ref<PublicKey> key = options.subject.empty() ? ReadKeyOf(options.subjectOf, false)
                                               : ReadPublicKey(options.subject);
  return {Ref<ZvVesk2::Subject>(key.Release()), ParseIssuedTag(options.tag), ""};
}

Signers OpenSigners(const SignerOptions& options) {
  Signers signers;
  std::set<std::string> seen;
  for (size_t i = 0; i < options.keys.size(); ++i) {
    signers.push_back(OpenSigner(options, i));
    if (seen.insert(Fingerprint(*signers[i]->Public())).second) continue;
    throw Trouble(Escape(ShownKey(options.keys[i])) + ": this key signs already", "usage");
  }
  return signers;
}

// The chains of the issuers: each must begin with a certificate for one of them.
std::vector<CertChain> ReadChains(const std::vector<std::string>& paths, const Signers& signers) {
  std::vector<CertChain> chains;
  for (const std::string& path : paths) {
    chains.push_back(ReadCertChain(path));
    ZvVesk2::Subject& subject = *ChainLinks(chains.back(), path)[0].cert->GetSubject();
    const bool fits = std::any_of(signers.begin(), signers.end(), [&](const auto& signer) {
      return subject.IsEqual(signer->Public().get());
    });
    if (!fits) RequireCertFor(chains.back(), path, *signers[0]->Public());
  }
  return chains;
}

// Warns of what the certificate cannot be used for: its chains must reach what it says, while it
// lasts.
void CheckUse(const Options& options, const Grant& grant, const Signers& signers) {
  SelfCheck check;
  check.End("the certificate", grant.period.notAfter.get());
  const Ref<TimeStamp> now = ParseTime("now", false);
  const TimeStamp* const begin = grant.period.notBefore.get();
  for (const std::string& path : options.chains) {
    SelfCheck::Chain chain{path, ReadCerts(path)};
    for (const auto& signer : signers) chain.signers.push_back(signer->Public());
    chain.tag = grant.tag;
    chain.at = begin != nullptr && begin->IsAfter(now.get()) ? begin : now.get();
    check.CheckChain(chain);
  }
  check.Tell(options.strict);
}

ExitCode Run(const Options& options) {
  const Wish wish = ReadWish(options);
  const Ref<ByteString> comment = MakeText(options.comment);
  Grant grant{wish.subject.get(), options.propagate, wish.tag.get(), ParsePeriod(options.period),
              comment.get()};
  Ref<SExpression> revocation;
  if (!options.revocation.empty()) {
    // Readers know the element by the length of its keyword, 10 to 19 characters.
    revocation = ParseRevocationTag(options.revocation, "revocation-list");
    grant.revocation = revocation.get();
  }
  const Signers signers = OpenSigners(options.signer);
  const std::vector<CertChain> chains = ReadChains(options.chains, signers);
  CheckUse(options, grant, signers);

  const CertChain sequence = NewSequence();
  for (const auto& signer : signers) {
    const SignedCert issued = IssueCert(*signer, grant, options.signer.algorithm);
    Append(*sequence, issued, options.owner.empty() ? wish.owner : options.owner);
    Result()["certificates"].push_back(
        DescribeCert(*issued.cert, issued.signature.get()).members());
  }
  for (const CertChain& chain : chains) AppendChain(*sequence, *chain);
  WriteSequence(*sequence, options.output, options.flags);
  NoteNotPassedOn(options.propagate ? 0 : signers.size());
  return kYes;
}

}  // namespace

Action DefineCertIssue(OptionList& list) {
  auto options = std::make_shared<Options>();
  AddSignerOptions(list, options->signer, SignerCount::kSeveral);
  Option& subject = list.Add("--subject", options->subject, "The public key that is certified");
  Option& subjectOf =
      list.Add(
              "--subject-of", options->subjectOf,
              "Or the signer of a manifest, or the subject in a chain: FILE, or FILE:N [the first]")
          .Excludes(subject);
  list.Add("--request", options->request, "Or the key that made this request, for what it asks")
      .Excludes(subject)
      .Excludes(subjectOf);
  list.Add("--tag", options->tag,
           "What for: \"(install (app calc))\"; of a request, less than it asks");
  list.Add("--propagate", options->propagate,
           "The subject may certify further keys; signing manifests needs it only where several "
           "issuers must agree");
  AddPeriodOptions(list, options->period);
  list.Add("--comment", options->comment, "A text for people, signed");
  list.Add("--owner", options->owner, "Whose certificate this is; travels along unsigned");
  list.Add("--chain", options->chains,
           "Certificate file of a signing key, whose chain is appended");
  list.Add("--revocation", options->revocation,
           "Valid only while a current list of this source does not revoke it: \"calc (revoke "
           "all)\"");
  list.Add("-o,--output", options->output, "The certificate file").Required();
  AddStrictFlag(list, options->strict);
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
