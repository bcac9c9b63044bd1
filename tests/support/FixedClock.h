#ifndef TESTS_SUPPORT_FIXEDCLOCK_H
#define TESTS_SUPPORT_FIXEDCLOCK_H

#include <cstdint>
#include <string>

#include "tamber/system/DateTime.h"

namespace TestSupport {

// Fixes the clock that Tamber::System::GetUtcDateTime reads while it lives; the real clock
// returns on destruction.
class FixedClock {
 public:
  explicit FixedClock(int64_t utcMicros);
  explicit FixedClock(const Tamber::System::DateTime& date);
  // An xs:dateTime text, e.g. "2024-01-01T12:00:00Z".
  explicit FixedClock(const std::string& xsDateTime);
  ~FixedClock();
  FixedClock(const FixedClock&) = delete;
  FixedClock& operator=(const FixedClock&) = delete;

  void Set(int64_t utcMicros);
  void AdvanceSeconds(int64_t seconds);
};

}  // namespace TestSupport

#endif
