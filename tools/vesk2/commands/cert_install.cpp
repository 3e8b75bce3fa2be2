// SPDX-License-Identifier: Apache-2.0
// cert_install.cpp: vesk2 cert install.
#include "tools/vesk2/audit/chain_state.h"
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/stores/acl_store.h"
#include "tools/vesk2/stores/cert_store.h"

namespace vesk2_command {
namespace {

struct Options {
  std::vector<std::string> files;
  std::string name;
  WriteFlags flags;
};

// What is refused now is of no use in the store; cert verify explains it.
ExitCode Refuse(const std::string& path, const ChainState& state) {
  if (state.proved().GetEntries() == nullptr) ThrowNoStore(VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  if (state.code() < 0) Check(state.code(), Escape(path));
  for (const std::string& text : state.Revocations()) Note(Escape(path) + ": " + text);
  return No(state.code(), Escape(path) + ": " + CodeWords(state.code()));
}

ExitCode Run(const Options& options) {
  const std::vector<std::string> names = StoreNames(options.files, options.name, ".cert");
  // All are verified, and their names free, before the first is written.
  std::vector<CertChain> chains;
  Result()["chains"] = Json::array();
  for (size_t i = 0; i < names.size(); ++i) {
    chains.push_back(ReadCertChain(options.files[i]));
    const ChainState state(chains[i], options.files[i]);
    if (state.code() != 0) return Refuse(options.files[i], state);
    if (!IsStored(*chains[i], names[i])) RefuseExisting(ChainPath(names[i]), options.flags.force);
  }
  for (size_t i = 0; i < names.size(); ++i) {
    StoreChain(*chains[i], names[i], options.flags);
    Json said = DescribeChain(ChainLinks(chains[i], options.files[i])).members();
    said["file"] = Escape(ChainPath(names[i]));
    Result()["chains"].push_back(std::move(said));
  }
  return kYes;
}

}  // namespace

Action DefineCertInstall(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("files", options->files, "Certificate files: chains").Required();
  list.Add("--name", options->name,
           "Name in the store, where there is one chain [the file's name]");
  AddWriteFlags(list, options->flags);
  list.Footer(
      "A chain is kept when it grants now what its first certificate is for; cert find looks it up "
      "by that.\nExit status 1 when one is refused: then none is kept.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
