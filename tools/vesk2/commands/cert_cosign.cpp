// cert_cosign.cpp: vesk2 cert cosign.
//
// Where several keys must agree, each certifies the same subject. A certificate that is missing
// beside another can be added later: those of a chain are signed one by one, and those of a
// manifest stand outside what its digest covers.
#include <algorithm>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string place;
  SignerOptions signer;
  std::string output;
  WriteFlags flags;
};

std::string Pair(const SignedCert& each) {
  return Canonical(*each.cert) + Canonical(*each.signature);
}

// The file's text with another certificate before the one of that number.
std::string Insert(const Place& place, const std::vector<SignedCert>& certs,
                   const SignedCert& added, bool manifest) {
  const Buffer buffer = OpenBuffer(place.path);
  std::string text(reinterpret_cast<const char*>(buffer->Data()), buffer->Remaining());
  size_t at = 0;
  for (size_t i = 0; i < place.number; ++i) {
    at = text.find(Pair(certs[i]), at);
    if (at == std::string::npos) {
      throw FileTrouble(place.path, "its certificates are not written canonically", "malformed");
    }
    if (i + 1 < place.number) at += Pair(certs[i]).size();
  }
  return text.insert(at, Pair(added) + (manifest ? "" : "(" + Atom("comment") + ")"));
}

void RefuseSame(const std::vector<SignedCert>& certs, const ZvVesk2::Cert& cert, PublicKey& key,
                const std::string& place) {
  const bool same = std::any_of(certs.begin(), certs.end(), [&](const SignedCert& each) {
    return each.cert->GetIssuer()->IsEqual(&key) &&
           each.cert->GetSubject()->IsEqual(cert.GetSubject());
  });
  if (!same) return;
  throw Trouble(Escape(place) + ": " + Fingerprint(key) + " certifies that subject already");
}

ExitCode Run(const Options& options) {
  Place place = ParsePlace(options.place);
  if (place.number == 0) place.number = 1;
  RefuseExisting(options.output, options.flags.force);
  const std::vector<SignedCert> certs = ReadCerts(place.path);
  RequireCert(certs, place.number, place.path);
  const ZvVesk2::Cert& cert = *certs[place.number - 1].cert;
  const bool manifest = OpenBuffer(place.path)->LooksAt("(8:manifest");
  if (cert.GetSubject()->IsHash()) {
    throw Trouble(Escape(options.place) + ": certifies a digest, which only its signer can");
  }
  const auto key = OpenSigner(options.signer);
  RefuseSame(certs, cert, *key->Public(), options.place);
  const SignedCert added = IssueCert(*key, Renewed(cert, {}), options.signer.algorithm);
  const std::string text = Insert(place, certs, added, manifest);
  const auto readBack = [&](const std::string& temporary) {
    const std::vector<SignedCert> again = ReadCerts(temporary);
    RequireCert(again, place.number + 1, temporary);
    const SignedCert& written = again[place.number - 1];
    Check(written.signature->Verify(written.cert.get()), "checking the new certificate");
  };
  Result()["certificate"] = place.number;
  const WriteOptions how{0666, options.flags.force, readBack, options.flags.dryRun};
  if (WriteFile(options.output, text, how)) Note("wrote " + Escape(options.output));
  return kYes;
}

}  // namespace

Action DefineCertCosign(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("place", options->place,
                 "FILE or FILE:N: the certificate of a chain or manifest [the first]")
      ->required();
  AddSignerOptions(app, options->signer);
  app.add_option("-o,--output", options->output, "The new file, its other certificates as they are")
      ->required();
  AddWriteFlags(app, options->flags);
  app.footer("The new certificate says the same, by the signing key, and stands before the other.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
