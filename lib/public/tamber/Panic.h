#ifndef TAMBER_PANIC_H
#define TAMBER_PANIC_H

#include "tamber/Export.h"

namespace Tamber {

// Ends the process after printing the failed expression with its source location to stderr.
[[noreturn]] TAMBER_API void PanicVerify(const char* expression, const char* file, int line);
// Ends the process after printing the source location of a branch that no input may reach.
[[noreturn]] TAMBER_API void PanicNotReached(const char* file, int line);

}  // namespace Tamber

// Checks an internal invariant; a failure ends the process naming the expression and location.
#define TAMBER_VERIFY(expression) \
  ((expression) ? static_cast<void>(0) : ::Tamber::PanicVerify(#expression, __FILE__, __LINE__))
// The same with the expression text given explicitly, for messages that must read a fixed way.
#define TAMBER_VERIFY_TEXT(condition, text) \
  ((condition) ? static_cast<void>(0) : ::Tamber::PanicVerify(text, __FILE__, __LINE__))
// Marks a branch that no input may reach; reaching it ends the process naming the location.
#define TAMBER_NOT_REACHED() ::Tamber::PanicNotReached(__FILE__, __LINE__)

#endif
