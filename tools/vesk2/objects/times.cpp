// SPDX-License-Identifier: Apache-2.0
// times.cpp: moments and periods from the command line.
#include "tools/vesk2/objects/times.h"

#include <ctime>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

namespace {

// A moment as most other programs write it: 2027-06-30T12:00:00Z. Without the Z it would be about
// the time of some place, which is not known here.
std::string AsStamp(std::string text) {
  constexpr size_t kDay = 10;
  if (text.size() > kDay && text[kDay] == 'T' && text.ends_with('Z')) {
    text[kDay] = '_';
    text.pop_back();
  }
  return text;
}

// No moment stands in for that of a clock that cannot be read: what has expired held at some.
long Now() {
  const std::time_t now = std::time(nullptr);
  if (now == -1) throw Trouble("the time of this machine cannot be read", "io");
  return static_cast<long>(now);
}

}  // namespace

Ref<TimeStamp> ParseTime(const std::string& text, bool endOfPeriod) {
  Ref<TimeStamp> stamp(new TimeStamp(nullptr));
  const int code =
      text == "now" ? stamp->Set(Now()) : stamp->Set(AsStamp(text).c_str(), endOfPeriod);
  if (code != 0) {
    throw Trouble("time \"" + Escape(text) +
                      "\": not \"now\", a year from 1970 on, or more of YYYY-MM-DD_hh:mm:ss",
                  "usage");
  }
  return stamp;
}

void AddPeriodOptions(OptionList& list, PeriodOptions& options) {
  list.Add("--not-before", options.notBefore, "First moment (UTC): 2026, 2026-11-22_18, now");
  list.Add("--not-after", options.notAfter, "Last moment; 2026 is the end of that year");
}

void AddMomentOptions(OptionList& list, PeriodOptions& options, std::string& at,
                      std::string_view about) {
  AddPeriodOptions(list, options);
  list.Add("--at", at, about).Excludes("--not-before").Excludes("--not-after");
}

Period ParsePeriod(const PeriodOptions& options) {
  Period period;
  if (!options.notBefore.empty()) period.notBefore = ParseTime(options.notBefore, false);
  if (!options.notAfter.empty()) period.notAfter = ParseTime(options.notAfter, true);
  if (period.notBefore && period.notBefore->IsAfter(period.notAfter.get())) {
    throw Trouble("--not-before lies after --not-after", "usage");
  }
  return period;
}

Period ParseMoment(const PeriodOptions& options, const std::string& at) {
  if (at.empty()) return ParsePeriod(options);
  return {ParseTime(at, false), ParseTime(at, false)};
}

std::string StampText(const TimeStamp& stamp) { return Escape(BytesOf(stamp)); }

}  // namespace vesk2_command
