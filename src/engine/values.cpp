// SPDX-License-Identifier: Apache-2.0
// Values of the five orderings: which texts are numbers, times and dates, and how they order.
//
//   time = hh [ ":" mm [ ":" ss ] ]
//   date = YYYY [ "-" MM [ "-" DD [ "_" hh [ ":" mm [ ":" ss ] ] ] ] ]
//   numeric = [ "+" / "-" ] digits, without leading zeros
//
//   alpha   any string, byte by byte
//   binary  any string, as a big-endian number: leading zero bytes do not count
//
// Dates and times are written so that they order as strings. 2009 is a date, and comes before
// 2009-01: a shorter one stands for its own beginning.
#include <algorithm>
#include <string_view>

#include "src/engine/budget.h"
#include "src/engine/tag_forms.h"
#include "src/platform/text.h"

namespace ZvVesk2::Engine {
namespace {

constexpr std::string_view kTimeTemplate = "##:##:##";
constexpr std::string_view kDateTemplate = "####-##-##_##:##:##";

std::string_view Text(const spki_atom* atom) {
  return {reinterpret_cast<const char*>(atom->data), atom->length};
}

bool IsDigit(char c) { return c >= '0' && c <= '9'; }

// Whether the value begins the template ("#" a digit) and ends where one of its fields does: 12:30
// is a time, 12:3 and "12:" are none.
bool Matches(const spki_atom* value, std::string_view shape) {
  const std::string_view text = Text(value);
  if (value->hint_length > 0 || text.size() > shape.size()) return false;
  if (text.size() < shape.size() && shape[text.size()] == '#') return false;
  return std::equal(text.begin(), text.end(), shape.begin(),
                    [](char c, char s) { return s == '#' ? IsDigit(c) : c == s; });
}

[[nodiscard]] int MonthLength(int year, int month) {
  switch (month) {
    case 1:
    case 5:
    case 7:
    case 8:
    case 10:
    case 12:
      return 31;
    case 4:
    case 6:
    case 9:
    case 11:
      return 30;
    case 2:
      return spki_is_leap_year(year) ? 29 : 28;
    default:
      // March has no days either: issued ranges avoid it, and verdicts on stored ones must not
      // change.
      return 0;
  }
}

// A sign and the digits behind it, of which there may be none.
struct Number {
  bool negative;
  std::string_view digits;
};

Number ReadNumber(const spki_atom* value) {
  std::string_view text = Text(value);
  const bool negative = text.starts_with('-');
  if (negative || text.starts_with('+')) text.remove_prefix(1);
  return {negative, text};
}

[[nodiscard]] int ComparePadded(std::string_view a, std::string_view b, unsigned char pad) {
  return spki_cmp_padded(reinterpret_cast<const unsigned char*>(a.data()), a.size(),
                         reinterpret_cast<const unsigned char*>(b.data()), b.size(), pad);
}

// By the signs first, so that minus zero is less than zero. Numbers of any length are compared as
// text, without a value that could overflow; of two negative ones the larger text is the lesser.
[[nodiscard]] int CompareNumbers(const spki_atom* a, const spki_atom* b) {
  const Number left = ReadNumber(a);
  const Number right = ReadNumber(b);
  if (left.negative != right.negative) return left.negative ? SPKI_ORDER_LESS : SPKI_ORDER_GREATER;
  return left.negative ? ComparePadded(right.digits, left.digits, '0')
                       : ComparePadded(left.digits, right.digits, '0');
}

}  // namespace

bool spki_is_leap_year(int year) { return (year % 4 == 0 && year % 100 != 0) || year % 400 == 0; }

// A lone sign is a number, as issued ranges have always been read.
bool spki_valid_numeric(const spki_atom* value) {
  if (value->hint_length > 0) return false;
  const std::string_view digits = ReadNumber(value).digits;
  if (digits.size() > 1 && digits.front() == '0') return false;
  // To the end, so that many bytes can be tested at once.
  bool all = true;
  for (const char c : digits) all = all & IsDigit(c);
  return all;
}

bool spki_valid_time(const spki_atom* value) {
  if (!Matches(value, kTimeTemplate)) return false;
  int field[3] = {};
  // There are three: it matches.
  static_cast<void>(ZVsysutil::zv_scan_numbers(value->data, value->length, field, 3));
  return field[0] < 24 && field[1] <= 59 && field[2] <= 59;
}

// A year alone is a date whatever it is; behind it, month and day must be those of a calendar (with
// the one exception in MonthLength).
bool spki_valid_date(const spki_atom* value) {
  if (!Matches(value, kDateTemplate)) return false;
  int field[6] = {};
  const int count = ZVsysutil::zv_scan_numbers(value->data, value->length, field, 6);
  const auto [year, month, day, hour, minute, second] = field;
  if (hour > 23 || minute > 59 || second > 59 || month > 12) return false;
  if (count == 2) return month >= 1;
  return count < 2 || (day >= 1 && day <= MonthLength(year, month));
}

bool spki_known_ordering(int32_t ordering) {
  switch (ordering) {
    case SPKI_KW_ALPHA:
    case SPKI_KW_BINARY:
    case SPKI_KW_DATE:
    case SPKI_KW_NUMERIC:
    case SPKI_KW_TIME:
      return true;
    default:
      return false;
  }
}

bool spki_valid_value(spki_engine* engine, const spki_atom* value, int32_t ordering) {
  if (spki_charge_strings(engine, value) != 0) return false;
  switch (ordering) {
    case SPKI_KW_DATE:
      return spki_valid_date(value);
    case SPKI_KW_NUMERIC:
      return spki_valid_numeric(value);
    case SPKI_KW_TIME:
      return spki_valid_time(value);
    default:
      return spki_known_ordering(ordering);
  }
}

// Strings with different hints are not comparable in any ordering: a bound with a hint says nothing
// about a value without one.
int spki_cmp_ordered(spki_engine* engine, const spki_atom* a, const spki_atom* b,
                     int32_t ordering) {
  if (a == nullptr || b == nullptr) return SPKI_ORDER_NONE;
  if (spki_charge_strings(engine, a, b) != 0) return SPKI_ORDER_NONE;
  if (!std::equal(a->hint, a->hint + a->hint_length, b->hint, b->hint + b->hint_length)) {
    return SPKI_ORDER_NONE;
  }
  switch (ordering) {
    case SPKI_KW_ALPHA:
    case SPKI_KW_DATE:
    case SPKI_KW_TIME:
      return spki_cmp_bytes(a->data, a->length, b->data, b->length);
    case SPKI_KW_BINARY:
      return spki_cmp_padded(a->data, a->length, b->data, b->length, 0);
    case SPKI_KW_NUMERIC:
      return CompareNumbers(a, b);
    default:
      return SPKI_ORDER_NONE;
  }
}

}  // namespace ZvVesk2::Engine
