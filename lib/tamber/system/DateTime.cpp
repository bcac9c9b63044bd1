#include "tamber/system/DateTime.h"

#include <atomic>
#include <chrono>
#include <cstdio>

#include "tamber/Exception.h"

namespace Tamber {
namespace System {

namespace {

constexpr int64_t kMicrosPerSecond = 1000000;
constexpr int64_t kSecondsPerDay = 86400;
constexpr int64_t kMicrosPerDay = kSecondsPerDay * kMicrosPerSecond;

// Days since 1970-01-01 of a date of the proleptic Gregorian calendar (H. Hinnant's algorithm),
// independent of TZ and of the C library's time functions.
constexpr int64_t DaysFromCivil(int64_t year, int month, int day) {
  year -= month <= 2 ? 1 : 0;
  const int64_t era = (year >= 0 ? year : year - 399) / 400;
  const int64_t yearOfEra = year - era * 400;
  const int64_t dayOfYear = (153 * (month > 2 ? month - 3 : month + 9) + 2) / 5 + day - 1;
  const int64_t dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
  return era * 146097 + dayOfEra - 719468;
}

struct CivilDate {
  int year;
  int month;
  int day;
};

CivilDate CivilFromDays(int64_t days) {
  days += 719468;
  const int64_t era = (days >= 0 ? days : days - 146096) / 146097;
  const int64_t dayOfEra = days - era * 146097;
  const int64_t yearOfEra = (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
  const int64_t dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
  const int64_t shiftedMonth = (5 * dayOfYear + 2) / 153;
  const int day = static_cast<int>(dayOfYear - (153 * shiftedMonth + 2) / 5 + 1);
  const int month = static_cast<int>(shiftedMonth < 10 ? shiftedMonth + 3 : shiftedMonth - 9);
  return {static_cast<int>(yearOfEra + era * 400 + (month <= 2 ? 1 : 0)), month, day};
}

bool IsLeapYear(int year) { return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0); }

int DaysInMonth(int year, int month) {
  static const int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  return month == 2 && IsLeapYear(year) ? 29 : kDays[month - 1];
}

// The representable instants: 0001-01-01T00:00:00Z to 9999-12-31T23:59:59.999999Z.
constexpr int64_t kMinMicros = DaysFromCivil(1, 1, 1) * kMicrosPerDay;
constexpr int64_t kMaxMicros = DaysFromCivil(10000, 1, 1) * kMicrosPerDay - 1;

bool InRange(int64_t micros) { return micros >= kMinMicros && micros <= kMaxMicros; }

// Instants before the epoch belong to the day that starts before them, hence floor division.
int64_t DayNumber(int64_t micros) {
  const int64_t quotient = micros / kMicrosPerDay;
  return micros % kMicrosPerDay < 0 ? quotient - 1 : quotient;
}

int64_t MicrosOfDay(int64_t micros) { return micros - DayNumber(micros) * kMicrosPerDay; }

// Reads the fixed-width fields of an xs:dateTime front to back.
class Cursor {
 public:
  explicit Cursor(const std::string& text) : _text(text) {}

  bool AtEnd() const { return _position == _text.size(); }
  bool IsDigit() const { return !AtEnd() && _text[_position] >= '0' && _text[_position] <= '9'; }

  bool Skip(char c) {
    if (AtEnd() || _text[_position] != c) return false;
    ++_position;
    return true;
  }

  // Exactly `width` decimal digits.
  bool Number(int width, int& value) {
    value = 0;
    for (int i = 0; i < width; ++i) {
      if (!IsDigit()) return false;
      value = value * 10 + (_text[_position++] - '0');
    }
    return true;
  }

  // One or more digits after the decimal point, as microseconds; digits beyond the sixth are
  // truncated.
  bool Fraction(int64_t& micros) {
    if (!IsDigit()) return false;
    micros = 0;
    int64_t scale = 100000;
    for (; IsDigit(); ++_position) {
      micros += (_text[_position] - '0') * scale;
      scale /= 10;
    }
    return true;
  }

 private:
  const std::string& _text;
  size_t _position = 0;
};

bool ParseXsDateTime(const std::string& text, int64_t& result) {
  Cursor cursor(text);
  int year, month, day, hour, minute, second;
  if (!cursor.Number(4, year) || !cursor.Skip('-') || !cursor.Number(2, month) || !cursor.Skip('-') ||
      !cursor.Number(2, day) || !cursor.Skip('T') || !cursor.Number(2, hour) || !cursor.Skip(':') ||
      !cursor.Number(2, minute) || !cursor.Skip(':') || !cursor.Number(2, second)) {
    return false;
  }
  int64_t fraction = 0;
  if (cursor.Skip('.') && !cursor.Fraction(fraction)) return false;

  int offsetMinutes = 0;
  if (!cursor.Skip('Z')) {
    const bool east = cursor.Skip('+');
    if (east || cursor.Skip('-')) {
      int offsetHour, offsetMinute;
      if (!cursor.Number(2, offsetHour) || !cursor.Skip(':') || !cursor.Number(2, offsetMinute)) return false;
      if (offsetMinute > 59 || offsetHour * 60 + offsetMinute > 14 * 60) return false;
      offsetMinutes = (east ? 1 : -1) * (offsetHour * 60 + offsetMinute);
    }
  }
  if (!cursor.AtEnd()) return false;

  if (year < 1 || month < 1 || month > 12 || day < 1 || day > DaysInMonth(year, month)) return false;
  // 24:00:00 is the end of the day, that is the start of the next one.
  const bool endOfDay = hour == 24 && minute == 0 && second == 0 && fraction == 0;
  if ((hour > 23 && !endOfDay) || minute > 59 || second > 59) return false;

  const int64_t seconds = DaysFromCivil(year, month, day) * kSecondsPerDay + hour * 3600 + minute * 60 + second -
                          offsetMinutes * 60;
  result = seconds * kMicrosPerSecond + fraction;
  return InRange(result);
}

// Names the refused text, shortened when it is far longer than any date.
std::string QuoteForMessage(const std::string& text) {
  constexpr size_t kMaxQuoted = 80;
  return text.size() <= kMaxQuoted ? text : text.substr(0, kMaxQuoted) + "...";
}

// Not a representable instant: the test clock is off.
constexpr int64_t kClockNotFixed = INT64_MIN;
std::atomic<int64_t> testClock{kClockNotFixed};

}  // namespace

DateTime::DateTime(const std::string& text) {
  if (!ParseXsDateTime(text, _utcMicros)) {
    throw DateTimeFormatException("Invalid xs:dateTime value `" + QuoteForMessage(text) + "'");
  }
}

std::string DateTime::ToString() const {
  const int micros = GetMicrosecond();
  char text[40];
  const int length = std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02d", GetYear(), GetMonth(),
                                   GetDay(), GetHour(), GetMinute(), GetSecond());
  if (micros % 1000 == 0) {
    std::snprintf(text + length, sizeof text - length, ".%03dZ", micros / 1000);
  } else {
    std::snprintf(text + length, sizeof text - length, ".%06dZ", micros);
  }
  return text;
}

std::string DateTime::ToShortStringBias() const { return "Z"; }

int DateTime::GetCentury() const { return GetYear() / 100; }
int DateTime::GetYearOfCentury() const { return GetYear() % 100; }
int DateTime::GetYear() const { return CivilFromDays(DayNumber(_utcMicros)).year; }
int DateTime::GetMonth() const { return CivilFromDays(DayNumber(_utcMicros)).month; }
int DateTime::GetDay() const { return CivilFromDays(DayNumber(_utcMicros)).day; }
int DateTime::GetHour() const { return static_cast<int>(MicrosOfDay(_utcMicros) / (3600 * kMicrosPerSecond)); }
int DateTime::GetMinute() const { return static_cast<int>(MicrosOfDay(_utcMicros) / (60 * kMicrosPerSecond) % 60); }
int DateTime::GetSecond() const { return static_cast<int>(MicrosOfDay(_utcMicros) / kMicrosPerSecond % 60); }
int DateTime::GetMillisecond() const { return GetMicrosecond() / 1000; }

int DateTime::GetMicrosecond() const { return static_cast<int>(MicrosOfDay(_utcMicros) % kMicrosPerSecond); }

DateTime DateTimeFromUtc(int64_t utcMicros, bool localTime) {
  if (localTime) throw InvalidArgumentException("DateTime is kept in UTC; local time is not supported");
  if (!InRange(utcMicros)) {
    throw InvalidArgumentException("Instant " + std::to_string(utcMicros) +
                                   " microseconds from the epoch is outside the years 0001 to 9999");
  }
  DateTime result;
  result._utcMicros = utcMicros;
  return result;
}

DateTime GetUtcDateTime() {
  const int64_t fixed = testClock.load(std::memory_order_acquire);
  if (fixed != kClockNotFixed) return DateTimeFromUtc(fixed, false);
  const auto now = std::chrono::system_clock::now().time_since_epoch();
  return DateTimeFromUtc(std::chrono::duration_cast<std::chrono::microseconds>(now).count(), false);
}

namespace Testing {

void SetTestClock(int64_t utcMicros) {
  if (!InRange(utcMicros)) {
    throw InvalidArgumentException("Test clock " + std::to_string(utcMicros) +
                                   " microseconds from the epoch is outside the years 0001 to 9999");
  }
  testClock.store(utcMicros, std::memory_order_release);
}

void ResetTestClock() { testClock.store(kClockNotFixed, std::memory_order_release); }

}  // namespace Testing

}  // namespace System
}  // namespace Tamber
