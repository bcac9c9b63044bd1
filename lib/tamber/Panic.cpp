#include "tamber/Panic.h"

#include <execinfo.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

namespace Tamber {

namespace {

// Prints the message and the raw call stack (no allocation beyond stdio), then aborts so that a
// core dump or debugger catches the state.
[[noreturn]] void Abort() {
  void* frames[64];
  const int count = backtrace(frames, 64);
  std::fflush(stderr);
  backtrace_symbols_fd(frames, count, STDERR_FILENO);
  std::abort();
}

}  // namespace

void PanicVerify(const char* expression, const char* file, int line) {
  std::fprintf(stderr, "Verify failed: %s at %s:%d\n", expression, file, line);
  Abort();
}

void PanicNotReached(const char* file, int line) {
  std::fprintf(stderr, "Unreachable code reached at %s:%d\n", file, line);
  Abort();
}

}  // namespace Tamber
