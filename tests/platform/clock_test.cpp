// SPDX-License-Identifier: Apache-2.0
// Calendar time against the C library's, and both directions against each other.
#include "src/platform/clock.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <random>
#include <string>

namespace ZVsysutil {
namespace {

TEST(ClockTest, FieldsOutOfRangeCarryOver) {
  setenv("TZ", "America/New_York", 1);  // must not matter
  std::mt19937 random(1);
  std::uniform_int_distribution<int> any(-1000, 1000);
  for (int i = 0; i < 20000; ++i) {
    std::tm in{};
    in.tm_year = any(random) * 97;  // untested digits can give such a year
    for (int* field : {&in.tm_mon, &in.tm_mday, &in.tm_hour, &in.tm_min, &in.tm_sec}) {
      *field = any(random);
    }
    std::tm normal = in;
    ASSERT_EQ(zv_mktime(&in), timegm(&normal));
  }
  unsetenv("TZ");
  EXPECT_EQ(zv_timezone(0), 0);
}

TEST(ClockTest, BothDirectionsAreInverse) {
  constexpr long kFirst = -62167219200;  // 0000-01-01
  constexpr long kLast = 253402300799;   // 9999-12-31 23:59:59
  std::tm fields{};
  // A step that is no whole number of days visits all times of day and, over 9999 years, leap days.
  for (long seconds = kFirst; seconds <= kLast; seconds += 86400 * 5 + 12347) {
    std::tm expected{};
    ASSERT_EQ(zv_gmtime(&fields, &seconds), 0) << seconds;
    ASSERT_EQ(std::string(asctime(&fields)), asctime(gmtime_r(&seconds, &expected)));
    ASSERT_EQ(zv_mktime(&fields), seconds);
  }
  for (const long edge : {kFirst - 1, kFirst, kLast, kLast + 1, LONG_MIN, LONG_MAX}) {
    EXPECT_EQ(zv_gmtime(&fields, &edge), edge == kFirst || edge == kLast ? 0 : -1) << edge;
  }
}

}  // namespace
}  // namespace ZVsysutil
