// SPDX-License-Identifier: Apache-2.0
// Calendar time in UTC, never the process's time zone.
#ifndef VESK2_SRC_PLATFORM_CLOCK_H
#define VESK2_SRC_PLATFORM_CLOCK_H

#include <ctime>

namespace ZVsysutil {

// In place of the current time when the clock cannot be read. No clock shows it.
inline constexpr long kNoTime = -1;

// The current time in seconds since the epoch, or kNoTime; also stored in *out when it is not null.
long zv_time(long* out);
// Splits `seconds` into UTC fields. 0, or -1 for a year outside 0 to 9999 (four digits of text).
[[nodiscard]] int zv_gmtime(std::tm* out, const long* seconds);
// The exact inverse: UTC fields to seconds. Fields out of range carry over (month 12 is January of
// the next year).
long zv_mktime(const std::tm* fields);
// Seconds that local time lies behind UTC: 0, since zv_mktime already reads UTC.
long zv_timezone(long seconds);

}  // namespace ZVsysutil

#endif  // VESK2_SRC_PLATFORM_CLOCK_H
