// SPDX-License-Identifier: Apache-2.0
// cert_find.cpp: vesk2 cert find.
#include "tools/vesk2/audit/chain_state.h"
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/explain/tell_facts.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::CertSequence;

struct Options {
  std::string tag;
};

// What is revoked of a chain, or not known to be good: the chain is found all the same.
Json TellChain(const std::string& path) {
  const CertChain chain = ReadCertChain(path);
  const ChainState state(chain, path);
  for (const std::string& text : state.Revocations()) Say("  " + text);
  Question question;
  question.file = path;
  question.proved = &state.proved();
  const Evidence evidence = GatherEvidence(question);
  Json certificates = Json::array();
  for (size_t i = 0; i < evidence.certs.size(); ++i) {
    certificates.push_back(ToldCert(evidence, i));
  }
  return {{"file", Escape(path)}, {"certificates", std::move(certificates)}};
}

ExitCode Run(const Options& options) {
  const Ref<SExpression> tag = ParseTag(options.tag);
  const Text directory(CertSequence::CalcDir(ZvVesk2::StorageHome));
  if (!directory) throw Trouble("there is no home store: --home names one", "no-home-store");
  Ref<SExpression> names;
  Check(CertSequence::Find(names.Out(), tag.get()), Escape(directory.get()));
  Result()["tag"] = TagText(tag.get());
  Json files = Json::array();
  Json chains = Json::array();
  for (auto it = names->Begin(); it; it.Next()) {
    const auto* name = dynamic_cast<ByteString*>(it.Value());
    // A name ends in the 0 byte that it is stored with.
    const std::string path =
        directory.get() + std::string("/") + reinterpret_cast<const char*>(name->GetData());
    Say(Escape(path));
    files.push_back(Escape(path));
    chains.push_back(TellChain(path));
  }
  const bool found = !files.empty();
  Result()["files"] = std::move(files);
  Result()["chains"] = std::move(chains);
  if (found) return kYes;
  Note("no certificate in " + Escape(directory.get()) + " carries " + TagText(tag.get()));
  return kNo;
}

}  // namespace

Action DefineCertFind(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("--tag", options->tag, "What the first certificate of a chain must cover").Required();
  list.Footer(
      "Below a chain stands what of it is revoked now, and by which list, or is not known to be "
      "good for\nwant of one. cert verify tells whether the chain counts.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
