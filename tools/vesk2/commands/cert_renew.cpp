// cert_renew.cpp: vesk2 cert renew.
//
// The certificates of a chain are signed one by one, and those of a manifest stand outside what its
// digest covers: one of them can be issued again without its neighbours.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string place;
  SignerOptions signer;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string output;
  bool force = false;
  bool dryRun = false;
};

Renewal ReadRenewal(const Options& options) {
  Renewal renewal;
  if (!options.tag.empty()) renewal.tag = ParseTag(options.tag);
  renewal.propagate = options.propagate;
  renewal.period = ParsePeriod(options.period);
  renewal.newPeriod = renewal.period.notBefore || renewal.period.notAfter;
  renewal.comment = MakeText(options.comment);
  return renewal;
}

std::string Pair(const SignedCert& each) {
  return Canonical(*each.cert) + Canonical(*each.signature);
}

// The file's text with certificate and signature of that number replaced.
std::string Replace(const Place& place, const std::vector<SignedCert>& certs,
                    const SignedCert& renewed) {
  const Buffer buffer = OpenBuffer(place.path);
  std::string text(reinterpret_cast<const char*>(buffer->Data()), buffer->Remaining());
  size_t at = 0;
  for (size_t i = 0; i < place.number; ++i) {
    const std::string old = Pair(certs[i]);
    at = text.find(old, at);
    if (at == std::string::npos) {
      throw FileTrouble(place.path, "its certificates are not written canonically", "malformed");
    }
    if (i + 1 == place.number) return text.replace(at, old.size(), Pair(renewed));
    at += old.size();
  }
  return text;
}

ExitCode Run(const Options& options) {
  Place place = ParsePlace(options.place);
  if (place.number == 0) place.number = 1;
  RefuseExisting(options.output, options.force);
  const std::vector<SignedCert> certs = ReadCerts(place.path);
  RequireCert(certs, place.number, place.path);
  ZvVesk2::Cert& old = *certs[place.number - 1].cert;
  const Renewal renewal = ReadRenewal(options);
  const auto key = OpenSigner(options.signer);
  const Ref<PublicKey> issuer = key->Public();
  if (!old.GetIssuer()->IsEqual(issuer.get())) {
    throw Trouble(Escape(options.place) + ": issued by " + Fingerprint(*old.GetIssuer()) +
                  ", not by the signing key " + Fingerprint(*issuer));
  }
  const SignedCert renewed = IssueCert(*key, Renewed(old, renewal), options.signer.algorithm);
  const std::string text = Replace(place, certs, renewed);
  const auto readBack = [&](const std::string& temporary) {
    const std::vector<SignedCert> again = ReadCerts(temporary);
    RequireCert(again, place.number, temporary);
    const SignedCert& written = again[place.number - 1];
    Check(written.signature->Verify(written.cert.get()), "checking the new certificate");
  };
  Result()["certificate"] = place.number;
  const WriteOptions how{0666, options.force, readBack, options.dryRun};
  if (WriteFile(options.output, text, how)) Note("wrote " + Escape(options.output));
  return kYes;
}

}  // namespace

Action DefineCertRenew(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("place", options->place,
                 "FILE or FILE:N: the certificate of a chain or manifest [the first]")
      ->required();
  AddSignerOptions(app, options->signer);
  app.add_option("--tag", options->tag, "Another tag [the old one]");
  app.add_flag("--propagate", options->propagate, "The subject may pass it on from now on");
  AddPeriodOptions(app, options->period);
  app.add_option("--comment", options->comment, "Another text for people");
  app.add_option("-o,--output", options->output, "The new file, its other certificates as they are")
      ->required();
  app.add_flag("-f,--force", options->force, "Replace an existing file");
  app.add_flag("-n,--dry-run", options->dryRun, "Write nothing");
  app.footer(
      "--not-before and --not-after replace the old period whole. What else is not given is "
      "as it was.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
