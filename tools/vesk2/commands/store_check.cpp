// SPDX-License-Identifier: Apache-2.0
// store_check.cpp: vesk2 store check.
#include <algorithm>
#include <charconv>

#include "tools/vesk2/audit/checks.h"
#include "tools/vesk2/commands/command.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string within = "30d";
};

// "30d" in seconds.
long ParseDuration(const std::string& text) {
  constexpr long kHour = 3600;
  constexpr long kMost = 100'000;  // of days: more than times can tell
  long count = 0;
  const char* const end = text.data() + text.size();
  const auto [unit, error] = std::from_chars(text.data(), end, count);
  const long seconds = unit + 1 != end ? 0
                       : *unit == 'h'  ? kHour
                       : *unit == 'd'  ? 24 * kHour
                       : *unit == 'w'  ? 7 * 24 * kHour
                                       : 0;
  if (error != std::errc() || seconds == 0 || count < 0 || count > kMost) {
    throw Trouble(
        "--within " + Escape(text) + ": not a number of hours, days or weeks, as 12h, 30d, 4w",
        "usage");
  }
  return count * seconds;
}

Ref<TimeStamp> After(const TimeStamp& now, long seconds) {
  constexpr long kLast = 253'402'300'799;  // of the year 9999
  Ref<TimeStamp> stamp(new TimeStamp(nullptr));
  Check(stamp->Set(std::min(now.ToTime() + seconds, kLast)), "--within");
  return stamp;
}

ExitCode Run(const Options& options) {
  Ref<TimeStamp> now = ParseTime("now", false);
  Ref<TimeStamp> soon = After(*now, ParseDuration(options.within));
  Findings findings(std::move(now), std::move(soon));
  const Stores stores = ReadStores(findings);
  CheckEntries(stores, findings);
  CheckLists(stores, findings);
  CheckChains(stores, findings);
  CheckStrength(stores, findings);
  CheckWriters(findings);
  Result() = {{"within", options.within},
              {"read",
               {{"entries", stores.entries.size()},
                {"lists", stores.lists.size()},
                {"chains", stores.chains.size()}}}};
  findings.Tell();
  const std::string read = Plural(stores.entries.size(), "entry file") + ", " +
                           Plural(stores.lists.size(), "list") + " and " +
                           Plural(stores.chains.size(), "chain");
  if (findings.empty()) return Yes("nothing is wrong with " + read);
  return No("findings", Plural(findings.size(), "finding") + " in " + read);
}

}  // namespace

Action DefineStoreCheck(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("--within", options->within, "Tell also what ends within this time: 12h, 30d, 4w")
      .ShowPreset();
  list.Footer(
      "Exit status: 0 when nothing was found, 1 with findings, 2 when a directory of the stores "
      "could\nnot be read. For cron and monitoring: vesk2 store check --json.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
