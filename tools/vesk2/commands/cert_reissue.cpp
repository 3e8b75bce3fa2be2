// SPDX-License-Identifier: Apache-2.0
// cert_reissue.cpp: vesk2 cert renew and vesk2 cert cosign: a certificate of a chain or manifest is
// issued again, in its own place or beside it where several keys must agree.
#include <algorithm>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/splice.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;

struct Options {
  std::string place;
  SignerOptions signer;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string output;
  WriteFlags flags;
};

// The file, the certificate that is meant, and who signs.
struct Work {
  Place place;
  std::vector<SignedCert> certs;
  std::unique_ptr<SigningKey> key;

  Cert& old() const { return *certs[place.number - 1].cert; }
};

Work Open(const Options& options) {
  Work work{ParsePlace(options.place), {}, {}};
  if (work.place.number == 0) work.place.number = 1;
  RefuseExisting(options.output, options.flags.force);
  work.certs = ReadCerts(work.place.path);
  RequireCert(work.certs, work.place.number, work.place.path);
  return work;
}

// The file's text with `made` in the place of the certificate and its signature, or before them.
std::string Splice(const Work& work, const SignedCert& made, bool beside) {
  const Buffer buffer = OpenBuffer(work.place.path);
  std::string text(reinterpret_cast<const char*>(buffer->Data()), buffer->Remaining());
  const auto [at, length] = FindPair(text, work.certs, work.place.number, work.place.path);
  if (!beside) return text.replace(at, length, PairText(made));
  const bool triple = !buffer->LooksAt("(8:manifest");
  return text.insert(at, PairText(made) + (triple ? Canonical(*ListOf({}, "comment")) : ""));
}

ExitCode Write(const Options& options, const Work& work, const Renewal& renewal, bool beside) {
  const SignedCert made =
      IssueCert(*work.key, Renewed(work.old(), renewal), options.signer.algorithm);
  const size_t number = work.place.number;
  const auto readBack = [&](const std::string& temporary) {
    const std::vector<SignedCert> again = ReadCerts(temporary);
    RequireCert(again, beside ? number + 1 : number, temporary);
    const SignedCert& written = again[number - 1];
    Check(written.signature->Verify(written.cert.get()), "checking the new certificate");
  };
  Result()["certificate"] = number;
  WriteFile(options.output, Splice(work, made, beside), {options.flags, readBack});
  return kYes;
}

ExitCode Renew(const Options& options) {
  Work work = Open(options);
  Renewal renewal;
  if (!options.tag.empty()) renewal.tag = ParseIssuedTag(options.tag);
  renewal.propagate = options.propagate;
  renewal.period = ParsePeriod(options.period);
  renewal.newPeriod = renewal.period.notBefore || renewal.period.notAfter;
  renewal.comment = MakeText(options.comment);
  work.key = OpenSigner(options.signer);
  const Ref<PublicKey> issuer = work.key->Public();
  if (!work.old().GetIssuer()->IsEqual(issuer.get())) {
    throw Trouble(Escape(options.place) + ": issued by " + Fingerprint(*work.old().GetIssuer()) +
                  ", not by the signing key " + Fingerprint(*issuer));
  }
  return Write(options, work, renewal, false);
}

ExitCode Cosign(const Options& options) {
  Work work = Open(options);
  ZvVesk2::Subject* const subject = work.old().GetSubject();
  if (subject->IsHash()) {
    throw Trouble(Escape(options.place) +
                  ": certifies a digest; vesk2 manifest approve adds another key's word for it");
  }
  work.key = OpenSigner(options.signer);
  const Ref<PublicKey> issuer = work.key->Public();
  const bool same = std::any_of(work.certs.begin(), work.certs.end(), [&](const SignedCert& each) {
    return each.cert->GetIssuer()->IsEqual(issuer.get()) &&
           each.cert->GetSubject()->IsEqual(subject);
  });
  if (same) {
    throw Trouble(Escape(options.place) + ": " + Fingerprint(*issuer) +
                  " certifies that subject already");
  }
  return Write(options, work, {}, true);
}

void AddPlace(OptionList& list, Options& options) {
  list.Add("place", options.place,
           "FILE or FILE:N: the certificate of a chain or manifest [the first]")
      .Required();
  AddSignerOptions(list, options.signer);
}

void AddOutput(OptionList& list, Options& options) {
  list.Add("-o,--output", options.output, "The new file, its other certificates as they are")
      .Required();
  AddWriteFlags(list, options.flags);
}

}  // namespace

Action DefineCertRenew(OptionList& list) {
  auto options = std::make_shared<Options>();
  AddPlace(list, *options);
  list.Add("--tag", options->tag, "Another tag [the old one]");
  list.Add("--propagate", options->propagate, "The subject may pass it on from now on");
  AddPeriodOptions(list, options->period);
  list.Add("--comment", options->comment, "Another text for people");
  AddOutput(list, *options);
  list.Footer(
      "--not-before and --not-after replace the old period whole. What else is not given is "
      "as it was.");
  return [options] { return Renew(*options); };
}

Action DefineCertCosign(OptionList& list) {
  auto options = std::make_shared<Options>();
  AddPlace(list, *options);
  AddOutput(list, *options);
  list.Footer(
      "The new certificate says the same, by the signing key, and stands before the other.");
  return [options] { return Cosign(*options); };
}

}  // namespace vesk2_command
