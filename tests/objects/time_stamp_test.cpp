// SPDX-License-Identifier: Apache-2.0
// TimeStamp: parsing, periods, conversion and comparison, also of stamps that nobody checked.
#include <vesk2/time_stamp.h>

#include <cstdlib>
#include <ctime>
#include <tuple>

#include "tests/support/test_read.h"

namespace vesk2test {
namespace {

using namespace ZvVesk2;

Ref<TimeStamp> NewStamp() { return Ref<TimeStamp>(new TimeStamp(nullptr)); }

TEST(TimeStampTest, ParsesWholeFieldsAndCompletesPeriods) {
  constexpr int kBad = VESK2_ERR_TIME_STAMP;
  const std::tuple<const char*, bool, int, const char*> cases[] = {
      {"2005", false, 0, "2005-01-01_00:00:00"},
      {"2005-12", true, 0, "2005-12-31_23:59:59"},
      {"2004-02", true, 0, "2004-02-29_23:59:59"},
      {"2005-12-31_23:00:07", true, 0, "2005-12-31_23:00:07"},
      {"1970", false, 0, "1970-01-01_00:00:00"},
      {"3900", true, 0, "3900-12-31_23:59:59"},
      {"1969", false, kBad, ""},
      {"3901", false, kBad, ""},
      {"2005-01-01 00", false, kBad, ""},
      {"2005-13", false, kBad, ""},
      // Only the way back tells these; the normalised text stays.
      {"2005-02-30", false, kBad, "2005-03-02_00:00:00"},
      {"2005-0:", true, kBad, "2005-10-01_00:00:00"},
      {nullptr, false, VESK2_ERR_PARAM_NULL, ""},
  };
  for (const auto& [text, end, code, stored] : cases) {
    const Ref<TimeStamp> stamp = NewStamp();
    EXPECT_EQ(stamp->Set(text, end), code) << stored;
    EXPECT_EQ(Bytes(stamp.get()), stored);
  }
  const std::string text = "2005-06-30_12:34:56789";
  for (size_t length = 0; length <= text.size(); ++length) {
    const bool whole = length >= 4 && length <= 19 && (length - 4) % 3 == 0;
    EXPECT_EQ(NewStamp()->Set(text.substr(0, length).c_str(), false), whole ? 0 : kBad) << length;
  }
}

TEST(TimeStampTest, ConvertsBothWaysWhateverTheTimeZone) {
  setenv("TZ", "America/New_York", 1);
  tzset();
  const std::tuple<long, const char*, long> cases[] = {
      {-1, "1969-12-31_23:59:59", -86400},
      {951827696, "2000-02-29_12:34:56", 951782400},
      {1143961200, "2006-04-02_07:00:00", 1143936000},  // clocks were put forward there
      {253402300799, "9999-12-31_23:59:59", 253402214400},
  };
  const Ref<TimeStamp> stamp = NewStamp();
  for (const auto& [seconds, text, dayBegin] : cases) {
    ASSERT_EQ(stamp->Set(seconds), 0);
    EXPECT_EQ(Bytes(stamp.get()), text);
    EXPECT_EQ(stamp->ToTime(), seconds);
    EXPECT_EQ(TimeStamp::DayBegin(seconds), dayBegin);
  }
  EXPECT_EQ(stamp->Set(253402300800), -1);
  EXPECT_EQ(Bytes(stamp.get()), "9999-12-31_23:59:59");
  EXPECT_EQ(TimeStamp::DayBegin(253402300800), 0);
}

// The four answers, in the order before, before or equal, after, after or equal.
std::string Compare(const TimeStamp* a, const TimeStamp* b) {
  std::string answers;
  for (const bool yes :
       {a->IsBefore(b), a->IsBeforeOrEqual(b), a->IsAfter(b), a->IsAfterOrEqual(b)}) {
    answers += yes ? '1' : '0';
  }
  return answers;
}

TEST(TimeStampTest, ComparesNineteenBytesAndBoundsOthers) {
  const Ref<TimeStamp> full = Read<TimeStamp>("19:2005-01-01_00:00:00");
  const std::tuple<const char*, const char*, long> cases[] = {
      {"[bin]19:2005-01-01_00:00:00", "0101", 1104537600},
      {"19:2004-12-31_23:59:59", "1100", 1104537599},
      {"19:2005/01/01T00;00;00", "0011", 1104537600},  // read by place, without any test
      {"20:2005-01-01_00:00:00x", "0101", 0},
      {"18:2005-01-01_00:00:0", "1100", 0},
      {"0:", "1100", 0},
  };
  for (const auto& [text, answers, time] : cases) {
    const Ref<TimeStamp> stamp = Read<TimeStamp>(text);
    EXPECT_EQ(Compare(stamp.get(), full.get()), answers) << text;
    EXPECT_EQ(stamp->ToTime(), time) << text;
    // The array that was read has no room for a text and its end.
    EXPECT_EQ(stamp->Set(1L), 0);
    EXPECT_EQ(Bytes(stamp.get()), "1970-01-01_00:00:01");
    EXPECT_EQ(stamp->ByteString::Set("2005-01-01_00:00:00", ByteString::BsNone), 0);
    EXPECT_EQ(stamp->ByteString::Set("2005", ByteString::BsNone), 0);
    EXPECT_EQ(stamp->Set(1L), 0);
  }
  EXPECT_EQ(Compare(full.get(), nullptr), "0000");
  Read<TimeStamp>("19:\xff\xff\xff\xff-~~-~~_~~:~~:~~")->ToTime();
}

}  // namespace
}  // namespace vesk2test
