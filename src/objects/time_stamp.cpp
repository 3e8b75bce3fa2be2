// SPDX-License-Identifier: Apache-2.0
// TimeStamp: the fixed-width text of a moment, which sorts as text. Nothing here asks the C library
// for a date: its answers depend on the time zone, on the locale and on another thread.
#include <vesk2/time_stamp.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstring>
#include <ctime>

#include "src/frame/check.h"
#include "src/platform/clock.h"

namespace ZvVesk2 {
namespace {

// "YYYY-MM-DD_hh:mm:ss"
constexpr unsigned int kLength = 19;
constexpr size_t kYearLength = 4;

// A field after the year: its separator stands at `place`, its two digits behind that. A table, so
// that reading, writing and completing a stamp go by one form.
struct Field {
  size_t place;
  char separator;
  int std::tm::*member;
  int low;
  int high;
  int offset;  // what the text has more than the record
  size_t End() const { return place + 3; }
};
constexpr std::array<Field, 5> kFields{{
    {4, '-', &std::tm::tm_mon, 1, 12, 1},
    {7, '-', &std::tm::tm_mday, 1, 31, 0},
    {10, '_', &std::tm::tm_hour, 0, 23, 0},
    {13, ':', &std::tm::tm_min, 0, 59, 0},
    {16, ':', &std::tm::tm_sec, 0, 59, 0},
}};

// The value of `count` characters, taken as digits without a test.
// What is no digit gives a number that is none of a date; who reads a stamp from people compares
// the text that comes back.
template <typename Char>
[[nodiscard]] int Digits(const Char* text, size_t count) {
  int value = 0;
  for (size_t i = 0; i < count; ++i) value = value * 10 + (text[i] - '0');
  return value;
}

// The zone is asked where it would matter and is UTC: clock.h.
long ToSeconds(const std::tm& fields) {
  const long seconds = ZVsysutil::zv_mktime(&fields);
  return seconds - ZVsysutil::zv_timezone(seconds);
}

// Reads the fields that `text` has; the others are those of the period's first second. Years from
// 1970, where seconds begin, to 3900.
[[nodiscard]] int ParseFields(std::tm& fields, const char* text, size_t length) {
  fields = {};
  fields.tm_mday = 1;
  fields.tm_year = Digits(text, kYearLength) - 1900;
  VESK2_REQUIRE(fields.tm_year >= 70 && fields.tm_year <= 2000, VESK2_ERR_TIME_STAMP);
  for (const Field& field : kFields) {
    if (length <= field.place) break;
    VESK2_REQUIRE(length >= field.End() && text[field.place] == field.separator,
                  VESK2_ERR_TIME_STAMP);
    const int value = Digits(text + field.place + 1, 2);
    VESK2_REQUIRE(value >= field.low && value <= field.high, VESK2_ERR_TIME_STAMP);
    fields.*field.member = value - field.offset;
  }
  return 0;
}

// Moves the fields to the first second after the period that a text of `length` names. Fields may
// run over, as "2005-12" goes on to month 13: zv_mktime carries.
void NextPeriod(std::tm& fields, size_t length) {
  if (length == kYearLength) ++fields.tm_year;
  for (const Field& field : kFields) {
    if (length == field.End()) ++(fields.*field.member);
  }
}

// Both texts by their first 19 bytes. Stamps come from text that nobody checked: bytes that one
// does not have count as 0. Nineteen bytes and no more, whatever a text holds behind them: stored
// stamps are compared so, and a tail must not change what is later.
[[nodiscard]] int Compare(const TimeStamp& a, const TimeStamp& b) {
  const auto bytes = [](const TimeStamp& stamp) {
    std::array<unsigned char, kLength> text{};
    const unsigned int count = std::min(stamp.GetLength(), kLength);
    if (count > 0) std::memcpy(text.data(), stamp.GetData(), count);
    return text;
  };
  return std::memcmp(bytes(a).data(), bytes(b).data(), kLength);
}

}  // namespace

TimeStamp::TimeStamp(Vesk2ContextStruct* ctx) : ByteString(ctx) {}

TimeStamp::~TimeStamp() = default;

int TimeStamp::Set(long seconds) {
  std::tm fields{};
  if (ZVsysutil::zv_gmtime(&fields, &seconds) != 0) return -1;
  // Always new storage: an imported or shortened stamp has less than a text and its terminator
  // need.
  Clear();
  VESK2_TRY(Reserve(kLength + 1));
  char text[80];
  std::snprintf(text, sizeof(text), "%04d-%02d-%02d_%02d:%02d:%02d", fields.tm_year + 1900,
                fields.tm_mon + 1, fields.tm_mday, fields.tm_hour, fields.tm_min, fields.tm_sec);
  std::memcpy(data, text, kLength + 1);
  length = kLength;
  return 0;
}

// Parsed, written anew and compared: so an impossible day is found without a table of months. The
// end of a period is the second before the next one begins.
int TimeStamp::Set(const char* text, bool endOfPeriod) {
  VESK2_REQUIRE(text != nullptr, VESK2_ERR_PARAM_NULL);
  const size_t size = std::strlen(text);
  VESK2_REQUIRE(size >= kYearLength && size <= kLength, VESK2_ERR_TIME_STAMP);
  std::tm fields{};
  VESK2_TRY(ParseFields(fields, text, size));
  VESK2_TRY(Set(ToSeconds(fields)));
  // What is no digit, or a day that the month does not have, comes back as another text.
  VESK2_REQUIRE(std::memcmp(data, text, size) == 0, VESK2_ERR_TIME_STAMP);
  if (!endOfPeriod || size == kLength) return 0;
  NextPeriod(fields, size);
  return Set(ToSeconds(fields) - 1);
}

// Programs call it for stamps of records that nobody checked: it answers something for every text
// of 19 bytes.
long TimeStamp::ToTime() const {
  if (length != kLength) return 0;
  std::tm fields{};
  fields.tm_year = Digits(data, kYearLength) - 1900;
  for (const Field& field : kFields) {
    fields.*field.member = Digits(data + field.place + 1, 2) - field.offset;
  }
  return ToSeconds(fields);
}

// For who groups moments by day; in UTC, as all else.
long TimeStamp::DayBegin(long seconds) {
  std::tm fields{};
  if (ZVsysutil::zv_gmtime(&fields, &seconds) != 0) return 0;
  fields.tm_sec = 0;
  fields.tm_min = 0;
  fields.tm_hour = 0;
  return ToSeconds(fields);
}

// A missing stamp answers no to every question, "or equal" included: no answer about what is absent
// may make a period longer.
bool TimeStamp::IsBefore(const TimeStamp* other) const {
  return other != nullptr && Compare(*this, *other) < 0;
}

bool TimeStamp::IsBeforeOrEqual(const TimeStamp* other) const {
  return other != nullptr && Compare(*this, *other) <= 0;
}

bool TimeStamp::IsAfter(const TimeStamp* other) const {
  return other != nullptr && Compare(*this, *other) > 0;
}

// The comparison is written four times and not turned round: with a missing stamp "not before"
// would be "after".
bool TimeStamp::IsAfterOrEqual(const TimeStamp* other) const {
  return other != nullptr && Compare(*this, *other) >= 0;
}

}  // namespace ZvVesk2
