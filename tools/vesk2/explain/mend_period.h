// SPDX-License-Identifier: Apache-2.0
// mend_period.h: the period that a renewed certificate or a replaced entry would need.
#ifndef VESK2_TOOLS_MEND_PERIOD_H
#define VESK2_TOOLS_MEND_PERIOD_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/times.h"

namespace vesk2_command {

// The year after a moment, in whose end a renewed period ends; empty past what can be written.
std::string YearAfter(const TimeStamp& stamp);

// A period on a command line. An option is empty where there is no limit.
struct Limits {
  std::string notBefore;
  std::string notAfter;
  bool changed = false;
  bool writable = true;

  Period Parse() const { return ParsePeriod({notBefore, notAfter}); }
  std::vector<std::string> Options() const;
};

// MendPeriod returns the period of something that is to hold for `first` to `last` (null: open), or
// at some moment of it: what is given and long enough stays.
Limits MendPeriod(const TimeStamp* notBefore, const TimeStamp* notAfter, const TimeStamp* first,
                  const TimeStamp* last, bool whole);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_MEND_PERIOD_H
