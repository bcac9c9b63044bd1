#ifndef TAMBER_SYSTEM_THREADPOOL_H
#define TAMBER_SYSTEM_THREADPOOL_H

#include <cstddef>
#include <memory>

#include "tamber/Export.h"
#include "tamber/Functor.h"

namespace Tamber {
namespace System {

// A fixed set of worker threads that run scheduled work items, each exactly once, taken in the
// order they were scheduled. An exception that leaves a work item is logged (logger "Tamber",
// level 8, with its what() text) and swallowed: it never ends the process or a worker.
class TAMBER_API ThreadPool {
 public:
  // Starts `threadCount` workers; 0 raises InvalidArgumentException.
  explicit ThreadPool(size_t threadCount);
  // Stop().
  ~ThreadPool();
  ThreadPool(const ThreadPool&) = delete;
  ThreadPool& operator=(const ThreadPool&) = delete;

  // Queues `work` to run once on a worker thread and returns at once; it may start before this
  // call returns. The pool keeps its own copy, destroyed on the worker after the work has run.
  // Raises InvalidArgumentException for an empty functor and InvalidStateException once the pool
  // is stopped.
  void Schedule(const Functor<void>& work);

  size_t GetThreadCount() const { return _threadCount; }

  // Discards the work not yet started, waits for the work running on the workers and ends them;
  // from then on Schedule raises InvalidStateException. Called from a work item of this pool, it
  // waits for the other workers only: the caller's own item finishes after Stop returns, and its
  // worker then ends. Later calls return at once.
  void Stop();

 private:
  class Workers;

  std::shared_ptr<Workers> _workers;
  size_t _threadCount;
};

// The process-wide pool: as many workers as cores, at least two. It starts on first use and is
// stopped at process exit by an exit handler (after the static objects created since its start
// have been destroyed, before those created earlier), whichever thread calls exit(); the pool
// object itself is never destroyed, so that late callers meet a stopped pool, not a dead one.
TAMBER_API ThreadPool& GetThreadPool();

}  // namespace System
}  // namespace Tamber

#endif
