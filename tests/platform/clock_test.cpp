// Calendar time against dates that everybody knows, and both directions against each other.
#include "src/platform/clock.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>

namespace ZVsysutil {
namespace {

std::tm Fields(int year, int month, int day, int hour = 0, int minute = 0, int second = 0) {
  std::tm fields{};
  fields.tm_year = year - 1900;
  fields.tm_mon = month - 1;
  fields.tm_mday = day;
  fields.tm_hour = hour;
  fields.tm_min = minute;
  fields.tm_sec = second;
  return fields;
}

TEST(ClockTest, CarriesFieldsOver) {
  setenv("TZ", "America/New_York", 1);  // must not matter
  const struct {
    std::tm fields;
    long seconds;
  } cases[] = {
      {Fields(1970, 1, 1), 0},
      {Fields(2000, 2, 29, 12), 951825600},
      {Fields(2038, 1, 19, 3, 14, 8), 2147483648},
      {Fields(1969, 12, 31, 23, 59, 59), -1},
      {Fields(2024, 13, 1), 1735689600},   // January of the next year
      {Fields(2024, 12, 32), 1735689600},  // the day after the last
      {Fields(2025, 1, 0), 1735603200},    // the day before the first
      {Fields(2025, -11, 1), 1704067200},  // month 1 of the year before
      {Fields(2023, 2, 29), 1677628800},   // March 1st
      {Fields(2025, 1, 1, -1, 60, 0), 1735689600},
      {Fields(82214, 1, 1), 2532256041600},  // untested digits can give such a year
      {Fields(-1, 1, 1), -62198755200},
  };
  for (const auto& row : cases) {
    EXPECT_EQ(zv_mktime(&row.fields), row.seconds)
        << row.fields.tm_year + 1900 << "-" << row.fields.tm_mon + 1 << "-" << row.fields.tm_mday;
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
    ASSERT_EQ(zv_gmtime(&fields, &seconds), 0) << seconds;
    ASSERT_EQ(zv_mktime(&fields), seconds);
    std::tm expected{};
    ASSERT_NE(gmtime_r(&seconds, &expected), nullptr);
    ASSERT_EQ(fields.tm_wday, expected.tm_wday) << seconds;
    ASSERT_EQ(fields.tm_yday, expected.tm_yday) << seconds;
  }
  for (const long outside : {kFirst - 1, kLast + 1, LONG_MIN, LONG_MAX}) {
    EXPECT_EQ(zv_gmtime(&fields, &outside), -1) << outside;
  }
  EXPECT_EQ(zv_gmtime(&fields, &kFirst), 0);
  EXPECT_EQ(zv_gmtime(&fields, &kLast), 0);
}

}  // namespace
}  // namespace ZVsysutil
