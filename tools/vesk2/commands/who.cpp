// SPDX-License-Identifier: Apache-2.0
// who.cpp: vesk2 who: the keys that may sign for a tag.
#include <algorithm>
#include <set>

#include "tools/vesk2/authority/steps.h"
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/page/page.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// More ways to one key than anybody reads; until when it may sign is asked of all.
constexpr size_t kMostWays = 16;

struct Options {
  std::string tag;
  HoldingsOptions holdings;
  SuppositionOptions supposed;
  PageOptions page;
};

// A way, or somebody's authority, and when it ends.
struct Until {
  std::optional<long> second;  // the first at which it is over
  Cause cause = {};
};

struct Found {
  Signers signers;
  std::vector<Way> ways;
  Until until;
  std::vector<Until> each;  // of the ways
  std::vector<Json> steps;  // of the ways, where machines are told
};

std::string UntilText(const Until& until) {
  if (!until.second) return "without end";
  return "until " + StampText(*StampOf(*until.second - 1)) + ": then " + until.cause.text;
}

void AddUntil(Json& json, const Until& until) {
  json["until"] = until.second ? Json(StampText(*StampOf(*until.second - 1))) : Json();
  json["because"] = until.second ? CauseJson(until.cause) : Json();
}

class Answer {
 public:
  Answer(const Search& search, Ref<TimeStamp> at) : search_(search), at_(std::move(at)) {
    for (Signers& candidate : search.keys().Candidates()) {
      std::vector<Way> ways = search.FindWays(candidate, at_.get(), kMostWays);
      if (ways.empty()) continue;
      if (candidate.IsGroup()) candidate = search.Agreeing(candidate, at_.get());
      found_.push_back({std::move(candidate), std::move(ways), {}, {}, {}});
    }
  }

  // Finds out until when; told is nothing before all is known.
  void Complete() {
    for (Found& each : found_) Complete(each);
  }

  bool IsEmpty() const { return found_.empty(); }

  std::set<std::string> Names() const {
    std::set<std::string> names;
    for (const Found& each : found_) names.insert(NameOf(each.signers));
    return names;
  }

  std::string Summary() const {
    const auto groups = static_cast<size_t>(std::count_if(
        found_.begin(), found_.end(), [](const Found& each) { return each.signers.IsGroup(); }));
    const size_t keys = found_.size() - groups;
    std::string text = keys > 0 ? Plural(keys, "key") : "";
    if (groups > 0) text += (keys > 0 ? " and " : "") + Plural(groups, "group") + " of keys";
    return text + " may sign for ";
  }

  void Tell() const {
    Json& keys = Result()["may_sign"] = Json::array();
    Json& groups = Result()["groups"] = Json::array();
    for (const Found& each : found_) {
      (each.signers.IsGroup() ? groups : keys).push_back(ToJson(each));
      Say(NameOf(each.signers) + " " + UntilText(each.until));
      for (size_t i = 0; i < each.ways.size(); ++i) TellWay(each, i);
    }
  }

 private:
  static std::string NameOf(const Signers& signers) {
    std::string text = signers.IsGroup() ? std::to_string(signers.k) + " of " : "";
    for (size_t i = 0; i < signers.keys.size(); ++i) {
      text += (i > 0 ? ", " : "") + Fingerprint(*signers.keys[i]);
    }
    return text;
  }

  void TellWay(const Found& each, size_t index) const {
    std::string text;
    for (const std::string& step : PathOf(search_, each.ways[index])) {
      text += (text.empty() ? "" : " -> ") + step;
    }
    const bool differs = each.each[index].second != each.until.second;
    Say("    " + text + (differs ? ", " + UntilText(each.each[index]) : ""));
  }

  void Complete(Found& found) {
    const Moments moments = search_.MomentsOf(found.signers);
    std::vector<Way> known = found.ways;
    found.until.second = moments.FirstChange(
        at_->ToTime(), [&](TimeStamp* at) { return search_.MaySign(found.signers, at, known); });
    for (const Way& way : found.ways) {
      Until until;
      until.second = moments.FirstChange(
          at_->ToTime(), [&](TimeStamp* at) { return search_.Judge(way, at) == 0; });
      if (until.second) until.cause = CauseOf(way, *until.second);
      found.each.push_back(std::move(until));
      if (CollectsFacts()) found.steps.push_back(StepsOf(search_, way, at_.get()));
    }
    if (found.until.second) found.until.cause = CauseOf(LastOf(found, known), *found.until.second);
  }

  // The way that was good to the end.
  const Way& LastOf(const Found& found, const std::vector<Way>& known) const {
    const Ref<TimeStamp> last = StampOf(*found.until.second - 1);
    const auto way = std::find_if(known.begin(), known.end(), [&](const Way& each) {
      return search_.Judge(each, last.get()) == 0;
    });
    return way != known.end() ? *way : known.front();
  }

  Cause CauseOf(const Way& way, long second) const {
    ZvVesk2::Evidence evidence(nullptr);
    search_.MakeEvidence(way, StampOf(second).get(), evidence);
    return FindCause(evidence, search_.request(), second, search_.Places(way));
  }

  Json ToJson(const Found& found) const {
    Json json;
    if (found.signers.IsGroup()) {
      json["k"] = found.signers.k;
      Json& members = json["members"] = Json::array();
      for (const auto& key : found.signers.keys) members.push_back(Fingerprint(*key));
    } else {
      json["key"] = Fingerprint(*found.signers.keys.front());
    }
    AddUntil(json, found.until);
    Json& ways = json["ways"] = Json::array();
    for (size_t i = 0; i < found.ways.size(); ++i) {
      Json way = {{"path", PathOf(search_, found.ways[i])}};
      if (CollectsFacts()) way["steps"] = found.steps[i];
      AddUntil(way, found.each[i]);
      ways.push_back(std::move(way));
    }
    return json;
  }

  const Search& search_;
  Ref<TimeStamp> at_;
  std::vector<Found> found_;
};

// Who may sign as things are.
std::set<std::string> NamesNow(const Holdings& holdings, const Request& request) {
  const Supposition nothing;
  const Search search(holdings, request, nothing);
  return Answer(search, nothing.Now()).Names();
}

// The names of `from` that are not in `others`.
void TellDifference(const std::set<std::string>& from, const std::set<std::string>& others,
                    const char* member, const std::string& text) {
  Json& list = Result()[member] = Json::array();
  for (const std::string& name : from) {
    if (others.count(name) != 0) continue;
    list.push_back(name);
    Say(text + name);
  }
}

ExitCode Run(const Options& options) {
  Result()["tag"] = Json();
  for (const char* member : {"hypothetical", "may_sign", "groups", "no_longer", "newly"}) {
    Result()[member] = Json();
  }
  StartSearch();
  const Request request = ParseRequest(options.tag);
  const std::string tag = TagText(request.tag.get());
  Result()["tag"] = tag;
  const Supposition supposition(options.supposed);
  const Holdings holdings = LoadHoldings(options.holdings);
  const Search search(holdings, request, supposition);
  Answer answer(search, supposition.Now());
  answer.Complete();
  std::set<std::string> now;
  if (supposition.Any()) now = NamesNow(holdings, request);
  const ExitCode verdict =
      answer.IsEmpty() ? No("nobody", "nobody may sign for " + tag) : Yes(answer.Summary() + tag);
  if (answer.IsEmpty()) NoteMeantRequest(request);
  answer.Tell();
  if (supposition.Any()) {
    TellDifference(now, answer.Names(), "no_longer", "no longer: ");
    TellDifference(answer.Names(), now, "newly", "newly: ");
  }
  return verdict;
}

}  // namespace

Action DefineWho(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("tag", options->tag, "What they may sign for; of a set, every member").Required();
  AddHoldingsOptions(list, options->holdings);
  AddSuppositionOptions(list, options->supposed);
  AddPageOptions(list, options->page);
  return WithPage(options->page, [options] { return Run(*options); });
}

}  // namespace vesk2_command
