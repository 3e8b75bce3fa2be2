// SPDX-License-Identifier: Apache-2.0
// mend_period.cpp: periods that reach what was asked.
#include "tools/vesk2/explain/mend_period.h"

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// A stamp as a command line takes it; empty for what is no time.
std::string Typed(const TimeStamp& stamp) {
  const std::string text = std::string(BytesOf(stamp));
  try {
    return BytesOf(*ParseTime(text, false)) == text ? text : "";
  } catch (const Trouble&) {
    return "";
  }
}

}  // namespace

std::string YearAfter(const TimeStamp& stamp) {
  const std::string text = Typed(stamp);
  if (text.empty()) return "";
  const int year = std::stoi(text.substr(0, 4)) + 1;
  return year > 3900 ? "" : std::to_string(year);
}

std::vector<std::string> Limits::Options() const {
  std::vector<std::string> words;
  if (!notBefore.empty()) words.insert(words.end(), {"--not-before", notBefore});
  if (!notAfter.empty()) words.insert(words.end(), {"--not-after", notAfter});
  return words;
}

Limits MendPeriod(const TimeStamp* notBefore, const TimeStamp* notAfter, const TimeStamp* first,
                  const TimeStamp* last, bool whole) {
  Limits limits;
  const TimeStamp* reached = whole || last == nullptr ? last : first;
  const bool ended = notAfter != nullptr && (whole ? last == nullptr || notAfter->IsBefore(last)
                                                   : notAfter->IsBefore(first));
  const bool late = notBefore != nullptr && (whole ? first == nullptr || notBefore->IsAfter(first)
                                                   : notBefore->IsAfter(last));
  limits.changed = ended || late;
  if (!ended && notAfter != nullptr) {
    limits.notAfter = Typed(*notAfter);
    limits.writable = !limits.notAfter.empty();
  } else if (ended) {
    reached = last != nullptr ? last : whole ? nullptr : first;
    limits.notAfter = reached != nullptr ? YearAfter(*reached) : "";
    limits.writable = reached == nullptr || !limits.notAfter.empty();
  }
  if (!late && notBefore != nullptr) {
    limits.notBefore = Typed(*notBefore);
    limits.writable &= !limits.notBefore.empty();
  } else if (late) {
    const TimeStamp* begin = first != nullptr ? first : whole ? nullptr : last;
    limits.notBefore = begin != nullptr ? Typed(*begin) : "";
    limits.writable &= begin == nullptr || !limits.notBefore.empty();
  }
  // A period without limits cannot be asked for.
  if (limits.changed && limits.Options().empty()) {
    if (first != nullptr) limits.notBefore = Typed(*first);
    if (last != nullptr) limits.notAfter = YearAfter(*last);
    limits.writable &= !limits.Options().empty();
  }
  // What was never valid is not mended by one end.
  limits.writable &= limits.notBefore.empty() || limits.notAfter.empty() ||
                     limits.notBefore.substr(0, 4) <= limits.notAfter.substr(0, 4);
  return limits;
}

}  // namespace vesk2_command
