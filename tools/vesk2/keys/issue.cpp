// SPDX-License-Identifier: Apache-2.0
// issue.cpp: making certificates.
#include "tools/vesk2/keys/issue.h"

#include "tools/vesk2/keys/external_key.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/objects/tag_bounds.h"

namespace vesk2_command {

using ZvVesk2::Cert;

void AddSignerOptions(OptionList& list, SignerOptions& options, SignerCount count) {
  const bool several = count == SignerCount::kSeveral;
  const std::string about =
      "The private key that signs: a PEM file, pkcs11:URI on a token, or "
      "ssh-agent:SHA256:FINGERPRINT";
  Option& key =
      list.Add("--key", options.keys, several ? about + "; several sign one each" : about);
  key.Required();
  if (!several) key.Once();
  list.Add("--algorithm", options.algorithm, "How an RSA key signs, over SHA-256")
      .Choices({"rsa-pss", "rsa-1.5"})
      .Preset("rsa-pss; of an ssh-agent rsa-1.5");
  list.Add("--sign-with", options.program,
           "Run this by /bin/sh to sign, --key being the public key: it reads the digest and "
           "writes the signature, both raw");
  AddPassphraseOptions(list, options.passphrase);
}

std::unique_ptr<SigningKey> OpenSigner(const SignerOptions& options, size_t index) {
  const std::string& path = options.keys[index];
  if (!options.program.empty()) return std::make_unique<ExternalKey>(options.program, path);
  return OpenKey(path, options.passphrase);
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

}  // namespace vesk2_command
