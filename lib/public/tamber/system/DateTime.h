#ifndef TAMBER_SYSTEM_DATETIME_H
#define TAMBER_SYSTEM_DATETIME_H

#include <cstdint>
#include <string>

#include "tamber/Export.h"

namespace Tamber {
namespace System {

// An instant in UTC with microsecond precision, held as microseconds since the Unix epoch.
// Years 0001 to 9999 are representable.
class TAMBER_API DateTime {
 public:
  // The Unix epoch.
  DateTime() = default;
  // Parses an xs:dateTime strictly: "YYYY-MM-DDThh:mm:ss", optional fractional seconds of any
  // length (digits beyond microseconds are truncated), then "Z", "+hh:mm" or "-hh:mm" (converted
  // to UTC) or nothing (read as UTC). Fields out of range (month 13, 30 February, hour 24 with
  // minutes, ...), missing or extra characters and surrounding whitespace raise
  // DateTimeFormatException naming the text.
  explicit DateTime(const std::string& text);

  // Microseconds since the Unix epoch, UTC.
  int64_t GetUtcTime() const { return _utcMicros; }

  // ISO 8601 in UTC: "2009-03-05T07:08:09.004Z", with six fractional digits when the instant is
  // not a whole millisecond.
  std::string ToString() const;
  // The short time-zone designator of the instant: "Z", as every DateTime is UTC.
  std::string ToShortStringBias() const;

  // Calendar fields in UTC.
  int GetCentury() const;        // 20 for 2009
  int GetYearOfCentury() const;  // 9 for 2009
  int GetYear() const;
  int GetMonth() const;  // 1..12
  int GetDay() const;    // 1..31
  int GetHour() const;
  int GetMinute() const;
  int GetSecond() const;
  int GetMillisecond() const;
  int GetMicrosecond() const;  // 0..999999, the whole sub-second part

  // Instants compare by their microseconds since the epoch.
  bool operator==(const DateTime& other) const { return _utcMicros == other._utcMicros; }
  bool operator!=(const DateTime& other) const { return _utcMicros != other._utcMicros; }
  bool operator<(const DateTime& other) const { return _utcMicros < other._utcMicros; }

 private:
  friend TAMBER_API DateTime DateTimeFromUtc(int64_t utcMicros, bool localTime);
  int64_t _utcMicros = 0;
};

// The current time (or the time fixed by the test clock).
TAMBER_API DateTime GetUtcDateTime();
// The instant `utcMicros` microseconds after the epoch. Every DateTime is kept in UTC, so
// `localTime` must be false; true raises InvalidArgumentException. Instants outside the years
// 0001 to 9999 raise InvalidArgumentException.
TAMBER_API DateTime DateTimeFromUtc(int64_t utcMicros, bool localTime);

// Test seam: fixes the clock that GetUtcDateTime reads, process-wide, until ResetTestClock.
namespace Testing {
TAMBER_API void SetTestClock(int64_t utcMicros);
TAMBER_API void ResetTestClock();
}  // namespace Testing

}  // namespace System
}  // namespace Tamber

#endif
