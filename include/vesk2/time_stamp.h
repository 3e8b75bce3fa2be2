// SPDX-License-Identifier: Apache-2.0
// time_stamp.h: TimeStamp, a moment as the text "YYYY-MM-DD_hh:mm:ss" in UTC, 19 characters. Stamps
// are compared as text, which is the order of time for all that have this form.
//
// What was imported is a byte string that nobody checked: a stamp in a certificate may be of any
// length and hold anything. Comparisons take it as it stands.
#ifndef VESK2_TIME_STAMP_H
#define VESK2_TIME_STAMP_H

#include <vesk2/expression.h>

namespace ZvVesk2 {

// TimeStamp is a byte string with the arithmetic of moments. Times are those of the proleptic
// Gregorian calendar without leap seconds; the time zone of the process plays no part.
//
//   Ref<TimeStamp> end(new TimeStamp(nullptr));
//   const int code = end->Set("2026-06", true);          2026-06-30_23:59:59
class VESK2_API TimeStamp : public ByteString {
 public:
  // A stamp of no moment, for Set or Import.
  explicit TimeStamp(Vesk2ContextStruct* context);

 protected:
  ~TimeStamp() override;

 public:
  // Set writes the text of `seconds` since 1970-01-01 00:00:00 UTC, over what there was. Returns 0,
  // VESK2_ERR_MEM_ALLOC (the stamp is then empty), or -1 (not a library code) for a year outside 0
  // to 9999, the stamp then untouched.
  [[nodiscard]] int Set(long seconds);
  // Set reads a stamp that may stop after any whole field ("2005", "2005-06", "2005-06-30_12",
  // ...), years 1970 to 3900. The missing fields are the period's first second, or with
  // `endOfPeriod` its last: "2005-06" is 2005-06-01_00:00:00 or 2005-06-30_23:59:59.
  //   VESK2_ERR_PARAM_NULL  no text
  //   VESK2_ERR_TIME_STAMP  another form, or a date that there is not; after the 31st of June and
  //                         its like the stamp keeps the normalised text
  //   VESK2_ERR_MEM_ALLOC   memory ran out
  [[nodiscard]] int Set(const char* text, bool endOfPeriod);
  using ByteString::Set;

  // ToTime returns seconds since the epoch. 19 bytes are read by place, without any test; a text of
  // another length gives 0, which is also the epoch.
  long ToTime() const;
  // The first second of the UTC day of `seconds`; 0 on failure (a year outside 0 to 9999).
  static long DayBegin(long seconds);

  // Each is false when `other` is null, the forms that accept equality too: no answer about what is
  // absent may make a period longer. 19 bytes are compared; bytes past a shorter text count as 0.
  bool IsBefore(const TimeStamp* other) const;
  bool IsBeforeOrEqual(const TimeStamp* other) const;
  bool IsAfter(const TimeStamp* other) const;
  bool IsAfterOrEqual(const TimeStamp* other) const;
};

}  // namespace ZvVesk2

#endif  // VESK2_TIME_STAMP_H
