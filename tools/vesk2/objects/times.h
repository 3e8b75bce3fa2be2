// SPDX-License-Identifier: Apache-2.0
// times.h: moments and periods from the command line.
#ifndef VESK2_TOOLS_TIMES_H
#define VESK2_TOOLS_TIMES_H

#include <string>

#include "tools/vesk2/options/options.h"

#include <vesk2/ref.h>
#include <vesk2/time_stamp.h>

namespace vesk2_command {

using ZvVesk2::Ref;
using ZvVesk2::TimeStamp;

// ParseTime reads "now" or a stamp that may stop after any whole field (2026, 2026-11, ...,
// 2026-11-22_18:30:00, 2026-11-22T18:30:00Z, UTC): the first second of what it names, or with
// `endOfPeriod` the last.
Ref<TimeStamp> ParseTime(const std::string& text, bool endOfPeriod);

struct PeriodOptions {
  std::string notBefore;
  std::string notAfter;
};
void AddPeriodOptions(OptionList& list, PeriodOptions& options);
// The same of a question, with --at for one moment, which `about` describes.
void AddMomentOptions(OptionList& list, PeriodOptions& options, std::string& at,
                      std::string_view about);

// Null where nothing was given.
struct Period {
  Ref<TimeStamp> notBefore;
  Ref<TimeStamp> notAfter;
};
Period ParsePeriod(const PeriodOptions& options);
// One moment twice; the period where `at` is empty.
Period ParseMoment(const PeriodOptions& options, const std::string& at);

// A stamp's text, escaped: stamps in files hold whatever their writer put there.
std::string StampText(const TimeStamp& stamp);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_TIMES_H
