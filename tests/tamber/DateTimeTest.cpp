#include "tamber/system/DateTime.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <random>
#include <thread>
#include <vector>

#include "support/FixedClock.h"
#include "tamber/Exception.h"

namespace {

using Tamber::DateTimeFormatException;
using Tamber::InvalidArgumentException;
using Tamber::System::DateTime;
using Tamber::System::DateTimeFromUtc;
using Tamber::System::GetUtcDateTime;

constexpr int64_t kFirstInstant = -62135596800000000;  // 0001-01-01T00:00:00Z
constexpr int64_t kLastInstant = 253402300799999999;   // 9999-12-31T23:59:59.999999Z

struct ValidCase {
  const char* text;
  int64_t utcMicros;
};

class DateTimeValidTest : public testing::TestWithParam<ValidCase> {};

TEST_P(DateTimeValidTest, ParsesToUtcMicroseconds) {
  EXPECT_EQ(DateTime(GetParam().text).GetUtcTime(), GetParam().utcMicros);
}

INSTANTIATE_TEST_SUITE_P(
    Table, DateTimeValidTest,
    testing::Values(ValidCase{"2009-03-05T07:08:09.004Z", 1236236889004000},
                    ValidCase{"2009-03-05T07:08:09Z", 1236236889000000},
                    ValidCase{"2009-03-05T07:08:09", 1236236889000000},
                    ValidCase{"2009-03-05T07:08:09+01:00", 1236233289000000},
                    ValidCase{"2009-03-05T07:08:09-05:30", 1236256689000000},
                    ValidCase{"2009-03-05T07:08:09+14:00", 1236186489000000},
                    ValidCase{"2009-03-05T07:08:09-14:00", 1236287289000000},
                    ValidCase{"2009-03-05T07:08:09-00:00", 1236236889000000},
                    ValidCase{"2024-02-29T23:59:59.123456Z", 1709251199123456},
                    ValidCase{"2024-02-29T23:59:59.1234569999999999999Z", 1709251199123456},
                    ValidCase{"2024-02-29T23:59:59.1Z", 1709251199100000},
                    ValidCase{"2000-02-29T00:00:00Z", 951782400000000},
                    ValidCase{"1969-12-31T23:59:59.999999Z", -1},
                    ValidCase{"1970-01-01T00:00:00Z", 0},
                    ValidCase{"1900-02-28T12:00:00Z", -2203934400000000},
                    ValidCase{"2009-03-05T24:00:00Z", 1236297600000000},
                    ValidCase{"0001-01-01T00:00:00Z", kFirstInstant},
                    ValidCase{"9999-12-31T23:59:59.999999Z", kLastInstant}));

class DateTimeInvalidTest : public testing::TestWithParam<const char*> {};

TEST_P(DateTimeInvalidTest, RaisesFormatExceptionNamingTheText) {
  const std::string text = GetParam();
  SCOPED_TRACE(text);
  try {
    DateTime date(text);
    ADD_FAILURE() << "accepted as " << date.ToString();
  } catch (const DateTimeFormatException& e) {
    EXPECT_EQ(std::string(e.what()), "Invalid xs:dateTime value `" + text + "'");
  }
}

INSTANTIATE_TEST_SUITE_P(Table, DateTimeInvalidTest,
                         testing::Values("", "2023-02-29T00:00:00Z", "1900-02-29T00:00:00Z", "2009-13-01T00:00:00Z",
                                         "2009-00-01T00:00:00Z", "2009-04-31T00:00:00Z", "2009-01-00T00:00:00Z",
                                         "2009-03-05T07:08Z", "2009-03-05T07:08:09Z ", " 2009-03-05T07:08:09Z",
                                         "2009-03-05t07:08:09Z", "2009-03-05 07:08:09Z", "2009-03-05T07:08:09z",
                                         "2009-03-05T07:08:09+1:00", "2009-03-05T07:08:09+01", "2009-03-05T07:08:09+0100",
                                         "2009-03-05T07:08:09+14:01", "2009-03-05T07:08:09+15:00",
                                         "2009-03-05T07:08:09+01:60", "2009-03-05T07:08:09.Z", "2009-03-05T07:08:09.",
                                         "2009-03-05T07:08:60Z", "2009-03-05T07:60:00Z", "2009-03-05T25:00:00Z",
                                         "2009-03-05T24:00:01Z", "2009-03-05T24:00:00.5Z", "0000-01-01T00:00:00Z",
                                         "-0001-01-01T00:00:00Z", "10000-01-01T00:00:00Z", "209-03-05T07:08:09Z",
                                         "2009-3-05T07:08:09Z", "2009-03-05T07:08:09ZZ", "2009-03-05T07:08:09+01:00Z",
                                         "2009-03-05T07:0a:09Z", "0001-01-01T00:00:00+00:01",
                                         "9999-12-31T23:59:59-00:01", "9999-12-31T24:00:00Z"));

TEST(DateTimeTest, RefusesTextWithNulByte) {
  const std::string text("2009-03-05T07:08:09Z\0", 21);
  EXPECT_THROW(DateTime{text}, DateTimeFormatException);
}

TEST(DateTimeTest, ShortensVeryLongTextInTheMessage) {
  const std::string text(1000, '9');
  try {
    DateTime date(text);
    FAIL() << "accepted";
  } catch (const DateTimeFormatException& e) {
    EXPECT_EQ(std::string(e.what()), "Invalid xs:dateTime value `" + text.substr(0, 80) + "...'");
  }
}

TEST(DateTimeTest, FormatsMillisecondsOrMicroseconds) {
  EXPECT_EQ(DateTime("2009-03-05T07:08:09.004Z").ToString(), "2009-03-05T07:08:09.004Z");
  EXPECT_EQ(DateTime("2009-03-05T07:08:09Z").ToString(), "2009-03-05T07:08:09.000Z");
  EXPECT_EQ(DateTime("2009-03-05T07:08:09.123456Z").ToString(), "2009-03-05T07:08:09.123456Z");
  EXPECT_EQ(DateTime("2009-03-05T07:08:09.000001Z").ToString(), "2009-03-05T07:08:09.000001Z");
  EXPECT_EQ(DateTime("0001-01-01T00:00:00Z").ToString(), "0001-01-01T00:00:00.000Z");
  EXPECT_EQ(DateTime("9999-12-31T23:59:59.999999Z").ToString(), "9999-12-31T23:59:59.999999Z");
  EXPECT_EQ(DateTime("1969-12-31T23:59:59.999Z").ToString(), "1969-12-31T23:59:59.999Z");
  EXPECT_EQ(DateTime().ToString(), "1970-01-01T00:00:00.000Z");
  EXPECT_EQ(DateTime().ToShortStringBias(), "Z");
}

TEST(DateTimeTest, ReportsCalendarFieldsInUtc) {
  const DateTime date("2009-03-05T07:08:09.004321+01:00");
  EXPECT_EQ(date.GetCentury(), 20);
  EXPECT_EQ(date.GetYearOfCentury(), 9);
  EXPECT_EQ(date.GetYear(), 2009);
  EXPECT_EQ(date.GetMonth(), 3);
  EXPECT_EQ(date.GetDay(), 5);
  EXPECT_EQ(date.GetHour(), 6);
  EXPECT_EQ(date.GetMinute(), 8);
  EXPECT_EQ(date.GetSecond(), 9);
  EXPECT_EQ(date.GetMillisecond(), 4);
  EXPECT_EQ(date.GetMicrosecond(), 4321);
}

TEST(DateTimeTest, ReportsFieldsBeforeTheEpoch) {
  const DateTime date("1969-12-31T23:59:59.999999Z");
  EXPECT_EQ(date.GetYear(), 1969);
  EXPECT_EQ(date.GetMonth(), 12);
  EXPECT_EQ(date.GetDay(), 31);
  EXPECT_EQ(date.GetHour(), 23);
  EXPECT_EQ(date.GetMinute(), 59);
  EXPECT_EQ(date.GetSecond(), 59);
  EXPECT_EQ(date.GetMicrosecond(), 999999);
}

// Walks every day of the representable years with a naive calendar and compares.
TEST(DateTimeTest, CalendarAgreesWithNaiveCountForEveryDay) {
  constexpr int64_t kMicrosPerDay = 86400LL * 1000000;
  int year = 1, month = 1, day = 1;
  for (int64_t micros = kFirstInstant; micros <= kLastInstant; micros += kMicrosPerDay) {
    const DateTime date = DateTimeFromUtc(micros + 12LL * 3600 * 1000000, false);
    ASSERT_EQ(date.GetYear(), year) << micros;
    ASSERT_EQ(date.GetMonth(), month) << micros;
    ASSERT_EQ(date.GetDay(), day) << micros;
    const bool leap = year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
    const int lengths[] = {31, leap ? 29 : 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    if (++day > lengths[month - 1]) {
      day = 1;
      if (++month > 12) {
        month = 1;
        ++year;
      }
    }
  }
  EXPECT_EQ(year, 10000);
}

TEST(DateTimeTest, RoundTripsThroughText) {
  std::mt19937_64 random(2009);
  std::uniform_int_distribution<int64_t> instants(kFirstInstant, kLastInstant);
  for (int i = 0; i < 10000; ++i) {
    const DateTime date = DateTimeFromUtc(instants(random), false);
    ASSERT_EQ(DateTime(date.ToString()), date) << date.ToString();
  }
}

TEST(DateTimeTest, DateTimeFromUtcRefusesLocalTimeAndOutOfRange) {
  EXPECT_EQ(DateTimeFromUtc(kLastInstant, false).GetUtcTime(), kLastInstant);
  try {
    DateTimeFromUtc(0, true);
    FAIL() << "local time accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : DateTime is kept in UTC; local time is not supported");
  }
  try {
    DateTimeFromUtc(kLastInstant + 1, false);
    FAIL() << "year 10000 accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(),
                 "Invalid argument : Instant 253402300800000000 microseconds from the epoch is outside the years "
                 "0001 to 9999");
  }
  EXPECT_THROW(DateTimeFromUtc(kFirstInstant - 1, false), InvalidArgumentException);
  EXPECT_THROW(DateTimeFromUtc(INT64_MIN, false), InvalidArgumentException);
}

TEST(DateTimeTest, TestClockFixesAndReleasesTheTime) {
  {
    TestSupport::FixedClock clock("2009-03-05T07:08:09.004Z");
    EXPECT_EQ(GetUtcDateTime().GetUtcTime(), 1236236889004000);
    clock.AdvanceSeconds(600);
    EXPECT_EQ(GetUtcDateTime().ToString(), "2009-03-05T07:18:09.004Z");
  }
  const auto now = std::chrono::duration_cast<std::chrono::microseconds>(
                       std::chrono::system_clock::now().time_since_epoch())
                       .count();
  EXPECT_NEAR(static_cast<double>(GetUtcDateTime().GetUtcTime()), static_cast<double>(now), 5e6);
}

TEST(DateTimeTest, TestClockRefusesInstantsOutOfRange) {
  EXPECT_THROW(Tamber::System::Testing::SetTestClock(INT64_MIN), InvalidArgumentException);
  EXPECT_THROW(Tamber::System::Testing::SetTestClock(kLastInstant + 1), InvalidArgumentException);
}

TEST(DateTimeTest, TestClockIsSafeAcrossThreads) {
  TestSupport::FixedClock clock(int64_t{1000});
  std::atomic<bool> stop{false};
  std::thread writer([&] {
    for (int64_t i = 0; i < 20000; ++i) Tamber::System::Testing::SetTestClock(i % 2 == 0 ? 1000 : 2000);
    stop = true;
  });
  while (!stop) {
    const int64_t now = GetUtcDateTime().GetUtcTime();
    ASSERT_TRUE(now == 1000 || now == 2000) << now;
  }
  writer.join();
}

}  // namespace
