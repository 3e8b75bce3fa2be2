// SPDX-License-Identifier: Apache-2.0
// cert_join.cpp: vesk2 cert join.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/objects/join.h"

namespace vesk2_command {
namespace {

struct Options {
  std::vector<std::string> files;
  std::string output;
  WriteFlags flags;
};

ExitCode Run(const Options& options) {
  std::vector<ChainFile> files;
  for (const std::string& path : options.files) files.push_back(ReadChainFile(path));
  const std::vector<ChainPart> parts = JoinChains(std::move(files));

  const CertChain sequence = NewSequence();
  for (const ChainPart& part : parts) {
    Append(*sequence, *part.signedCert.cert);
    Append(*sequence, *part.signedCert.signature);
    Append(*sequence, *part.extra);
    Result()["certificates"].push_back(
        DescribeCert(*part.signedCert.cert, part.signedCert.signature.get()).members());
  }
  WriteSequence(*sequence, options.output, options.flags);
  NoteNotPassedOn(CountNotPassedOn(parts));
  return kYes;
}

}  // namespace

Action DefineCertJoin(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("files", options->files, "Certificate files for the same key").Required();
  list.Add("-o,--output", options->output, "The certificate file with all of them").Required();
  AddWriteFlags(list, options->flags);
  list.Footer(
      "Every signature must hold. What several files have is written once, and the certificates "
      "for\nthe key come first.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
