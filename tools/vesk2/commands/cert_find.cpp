// SPDX-License-Identifier: Apache-2.0
// cert_find.cpp: vesk2 cert find.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/keys/issue.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::CertSequence;

struct Options {
  std::string tag;
};

ExitCode Run(const Options& options) {
  const Ref<SExpression> tag = ParseTag(options.tag);
  const Text directory(CertSequence::CalcDir(ZvVesk2::StorageHome));
  if (!directory) throw Trouble("there is no home store: --home names one", "no-home-store");
  Ref<SExpression> names;
  Check(CertSequence::Find(names.Out(), tag.get()), Escape(directory.get()));
  Result()["tag"] = TagText(tag.get());
  Json& files = Result()["files"] = Json::array();
  for (auto it = names->Begin(); it; it.Next()) {
    const auto* name = dynamic_cast<ByteString*>(it.Value());
    // A name ends in the 0 byte that it is stored with.
    const std::string path =
        Escape(directory.get() + std::string("/") + reinterpret_cast<const char*>(name->GetData()));
    Say(path);
    files.push_back(path);
  }
  if (!files.empty()) return kYes;
  Note("no certificate in " + Escape(directory.get()) + " carries " + TagText(tag.get()));
  return kNo;
}

}  // namespace

Action DefineCertFind(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("--tag", options->tag, "What the first certificate of a chain must cover").Required();
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
