// SPDX-License-Identifier: Apache-2.0
// Calendar arithmetic on the proleptic Gregorian calendar, by <chrono>: the process's time zone and
// the C library's global state never enter a date that decides a verdict. Dates come from
// strangers' texts: every function is defined for every value that it can be given.
#include "src/platform/clock.h"

#include <chrono>
#include <cstdint>

namespace ZVsysutil {
namespace {

using namespace std::chrono;

// Four digits is what a stamp has room for.
constexpr int64_t kFirstYear = 0;
constexpr int64_t kLastYear = 9999;
constexpr int64_t kCycleYears = 400;  // after which the calendar repeats
constexpr int64_t kCycleDays = 146097;
constexpr int64_t kDaySeconds = 86400;

constexpr int64_t FirstSecond(int64_t year) {
  return sys_seconds{sys_days{std::chrono::year{static_cast<int>(year)} / January / 1}}
      .time_since_epoch()
      .count();
}

// Division that rounds down also below zero, as months before January do.
constexpr int64_t FloorDivide(int64_t a, int64_t b) {
  return a / b - (a % b != 0 && (a < 0) != (b < 0) ? 1 : 0);
}

}  // namespace

// Whole seconds, rounded down: "now" is never a moment that has not come. Asked of the system
// itself, as the C++ runtime's clock has no way to say that it failed: it gives whatever stood in
// its memory, and an entry that has expired would hold at such a moment.
long zv_time(long* out) {
  timespec clock{};
  const long now = clock_gettime(CLOCK_REALTIME, &clock) == 0 ? clock.tv_sec : kNoTime;
  if (out != nullptr) *out = now;
  return now;
}

// The years are tested before the calendar types see them, which hold 16 bits.
int zv_gmtime(std::tm* out, const long* seconds) {
  if (out == nullptr || seconds == nullptr) return -1;
  if (*seconds < FirstSecond(kFirstYear) || *seconds >= FirstSecond(kLastYear + 1)) return -1;
  const sys_seconds time{std::chrono::seconds{*seconds}};
  const sys_days day = floor<days>(time);
  const year_month_day date{day};
  const hh_mm_ss clock{time - day};
  *out = std::tm{};
  out->tm_year = static_cast<int>(date.year()) - 1900;
  out->tm_mon = static_cast<int>(static_cast<unsigned>(date.month())) - 1;
  out->tm_mday = static_cast<int>(static_cast<unsigned>(date.day()));
  out->tm_hour = static_cast<int>(clock.hours().count());
  out->tm_min = static_cast<int>(clock.minutes().count());
  out->tm_sec = static_cast<int>(clock.seconds().count());
  out->tm_wday = static_cast<int>(weekday{day}.c_encoding());
  out->tm_yday = static_cast<int>((day - sys_days{date.year() / January / 1}).count());
  return 0;
}

// Fields of any size carry over, and no int overflows on the way: all is counted in 64 bits.
long zv_mktime(const std::tm* fields) {
  if (fields == nullptr) return -1;
  // Any int may stand in any field, since callers hand over what untested digits gave; the year is
  // brought into one cycle before the calendar types, which hold 16 bits of it, see it.
  const int64_t carry = FloorDivide(fields->tm_mon, 12);
  const int64_t year = int64_t{1900} + fields->tm_year + carry;
  const int64_t cycle = FloorDivide(year, kCycleYears);
  const std::chrono::year yearOfCycle{static_cast<int>(year - cycle * kCycleYears)};
  const month monthOfYear{static_cast<unsigned>(fields->tm_mon - carry * 12 + 1)};
  const int64_t firstOfMonth = sys_days{yearOfCycle / monthOfYear / 1}.time_since_epoch().count();
  const int64_t day = cycle * kCycleDays + firstOfMonth + fields->tm_mday - 1;
  return static_cast<long>(day * kDaySeconds + int64_t{fields->tm_hour} * 3600 +
                           int64_t{fields->tm_min} * 60 + fields->tm_sec);
}

// Kept as a function of its own, for the arithmetic that asks for it.
long zv_timezone(long /*seconds*/) { return 0; }

}  // namespace ZVsysutil
