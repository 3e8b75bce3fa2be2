// SPDX-License-Identifier: Apache-2.0
// tag_check.cpp: vesk2 tag check.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/objects/tag_gap.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string asked;
  std::string granted;
};

Json GapJson(const TagGap& gap) {
  return {{"path", gap.path},       {"place", gap.place},   {"asked", gap.asked},
          {"granted", gap.granted}, {"reason", gap.reason}, {"text", gap.Text()}};
}

ExitCode Run(const Options& options) {
  const Ref<SExpression> asked = ParseTag(options.asked);
  const Ref<SExpression> granted = ParseTag(options.granted);
  const std::string first = TagText(asked.get());
  const std::string second = TagText(granted.get());
  Result() = {{"asked", first}, {"granted", second}};
  if (asked->IsSubset(granted.get())) return Yes(first + " is within " + second);
  const TagGap gap = FindGap(*asked, *granted);
  Result()["gap"] = GapJson(gap);
  return No("not-within", first + " is not within " + second + ": " + gap.Text());
}

}  // namespace

Action DefineTagCheck(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("asked", options->asked, "The tag that must not reach further").Required();
  list.Add("granted", options->granted, "The tag that it must lie within").Required();
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
