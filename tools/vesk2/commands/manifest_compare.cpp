// SPDX-License-Identifier: Apache-2.0
// manifest_compare.cpp: vesk2 manifest compare.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Manifest;

struct Options {
  std::string from;
  std::string to;
};

// One kind of difference, and the names.
struct Difference {
  std::string kind;
  std::vector<std::string> names;
};

ExitCode Answer(const Manifest& manifest, int code) {
  const std::set<std::string> parents = FoundParents(manifest);
  const Difference differences[] = {{"changed", FoundNames(manifest.GetInvalid(), parents)},
                                    {"removed", FoundNames(manifest.GetMissing(), parents)},
                                    {"added", FoundNames(manifest.GetExtra(), parents)}};
  std::string summary;
  for (const auto& [kind, names] : differences) {
    Result()[kind] = Json::array();
    for (const std::string& name : names) Result()[kind].push_back(Escape(name));
    if (names.empty()) continue;
    summary += (summary.empty() ? "" : ", ") + std::to_string(names.size()) + " " + kind;
  }
  const size_t same = CountFiles(manifest.GetValid());
  Result()["same_files"] = same;
  if (code == 0) return Yes("both list the same, " + Plural(same, "file"));
  const ExitCode verdict = No(code, summary);
  for (const auto& [kind, names] : differences) {
    for (const std::string& name : names) Say(kind + ": " + Escape(name));
  }
  return verdict;
}

ExitCode Run(const Options& options) {
  Manifest manifests[] = {Manifest(nullptr), Manifest(nullptr)};
  Buffer bodies[2];
  const std::string* const paths[] = {&options.from, &options.to};
  for (size_t i = 0; i < 2; ++i) {
    const int code = ReadSigned(*paths[i], manifests[i], bodies[i]);
    if (code != 0) return No(code, Escape(*paths[i]) + ": " + CodeWords(code));
  }
  Manifest& manifest = manifests[0];
  const int code = manifest.Compare(bodies[0].get(), bodies[1].get());
  const bool compared = manifest.GetInvalid() != nullptr || manifest.GetMissing() != nullptr ||
                        manifest.GetExtra() != nullptr;
  if (code != 0 && !compared) Check(code, InputName(options.from) + ", " + InputName(options.to));
  return Answer(manifest, code);
}

}  // namespace

Action DefineManifestCompare(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("from", options->from, "A manifest file").Required();
  list.Add("to", options->to, "The manifest that it is compared with").Required();
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
