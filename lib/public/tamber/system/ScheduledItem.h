#ifndef TAMBER_SYSTEM_SCHEDULEDITEM_H
#define TAMBER_SYSTEM_SCHEDULEDITEM_H

#include <cstdint>

#include "tamber/Ref.h"

namespace Tamber {
namespace System {

// A piece of work that runs on a worker thread of the layer and finishes exactly once, with a
// result or a failure. Holders of a reference may watch, await or cancel it from any thread.
class TAMBER_API ScheduledItem : public Object {
 public:
  // True once the work has finished and its completion has returned.
  virtual bool IsDone() const = 0;
  // Waits until the work is done, at most `timeoutMicros` microseconds (0 only looks); true when
  // it is done. A negative timeout raises InvalidArgumentException.
  virtual bool Wait(int64_t timeoutMicros) const = 0;
  // Asks the work to stop. Work not yet finished then finishes as failed, saying it was
  // cancelled; work already done is left as it is. Returns at once.
  virtual void Cancel() = 0;
};

}  // namespace System
}  // namespace Tamber

#endif
