// SPDX-License-Identifier: Apache-2.0
// cert_show.cpp: vesk2 cert show.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"

namespace vesk2_command {
namespace {

ExitCode Run(const std::string& file) {
  const CertChain chain = ReadCertChain(file);
  Present(DescribeChain(ChainLinks(chain, file)));
  return kYes;
}

}  // namespace

Action DefineCertShow(OptionList& list) {
  auto file = std::make_shared<std::string>();
  list.Add("file", *file, "A certificate file").Required();
  return [file] { return Run(*file); };
}

}  // namespace vesk2_command
