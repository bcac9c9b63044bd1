#include "support/FixedClock.h"

namespace TestSupport {

using Tamber::System::DateTime;
namespace Testing = Tamber::System::Testing;

FixedClock::FixedClock(int64_t utcMicros) { Set(utcMicros); }
FixedClock::FixedClock(const DateTime& date) : FixedClock(date.GetUtcTime()) {}
FixedClock::FixedClock(const std::string& xsDateTime) : FixedClock(DateTime(xsDateTime)) {}
FixedClock::~FixedClock() { Testing::ResetTestClock(); }

void FixedClock::Set(int64_t utcMicros) { Testing::SetTestClock(utcMicros); }

void FixedClock::AdvanceSeconds(int64_t seconds) {
  Set(Tamber::System::GetUtcDateTime().GetUtcTime() + seconds * 1000000);
}

}  // namespace TestSupport
