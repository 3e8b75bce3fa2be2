// SPDX-License-Identifier: Apache-2.0
// cert_request.cpp: vesk2 cert request: a key asks to be certified. The request is a certificate
// that the key issues to itself, which shows that whoever asks has the key.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/keys/issue.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  SignerOptions signer;
  std::string tag;
  std::string comment;
  std::string owner;
  std::string output;
  WriteFlags flags;
};

ExitCode Run(const Options& options) {
  const Ref<SExpression> tag = ParseIssuedTag(options.tag);
  const Ref<ByteString> comment = MakeText(options.comment);
  const auto signer = OpenSigner(options.signer);
  const Ref<PublicKey> subject = signer->Public();
  const SignedCert issued = IssueCert(*signer, {subject.get(), false, tag.get(), {}, comment.get()},
                                      options.signer.algorithm);
  const CertChain request = NewSequence();
  Append(*request, issued, options.owner);
  WriteSequence(*request, options.output, options.flags);
  Result()["subject"] = Fingerprint(*subject);
  Result()["tag"] = TagText(tag.get());
  return kYes;
}

}  // namespace

Action DefineCertRequest(OptionList& list) {
  auto options = std::make_shared<Options>();
  AddSignerOptions(list, options->signer);
  list.Add("--tag", options->tag, "What the key asks for: \"(install (app calc))\"").Required();
  list.Add("--comment", options->comment, "A text for the issuer, signed");
  list.Add("--owner", options->owner, "Whose key this is; goes into the certificate file");
  list.Add("-o,--output", options->output, "The request file, .req").Required();
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
