#include "tamber/system/ThreadPool.h"

#include <algorithm>
#include <condition_variable>
#include <cstdlib>
#include <deque>
#include <exception>
#include <mutex>
#include <thread>
#include <utility>
#include <vector>

#include "tamber/Exception.h"
#include "tamber/service/Logging.h"

namespace Tamber {
namespace System {

// The state the workers share with the pool. Each worker holds a reference of its own, so that a
// worker left running by a Stop from inside a work item (exit() called on a worker, a work item
// destroying its pool) still finds the state after the pool object is gone.
class ThreadPool::Workers {
 public:
  Workers() { Service::GetApp()->GetLogManager()->GetLogger("Tamber", Service::LOG_TRACE, _logger); }

  void AddThread(std::thread thread) {
    std::lock_guard<std::mutex> lock(_mutex);
    _threads.push_back(std::move(thread));
  }

  void Enqueue(const Functor<void>& work) {
    {
      std::lock_guard<std::mutex> lock(_mutex);
      if (_stopping) throw InvalidStateException("The thread pool is stopped: no work can be scheduled any more");
      _queue.push_back(work);
    }
    _wake.notify_one();
  }

  void Stop() {
    std::vector<std::thread> threads;
    std::deque<Functor<void>> discarded;
    {
      std::lock_guard<std::mutex> lock(_mutex);
      if (_stopping) return;
      _stopping = true;
      threads.swap(_threads);
      discarded.swap(_queue);
    }
    _wake.notify_all();
    for (std::thread& thread : threads) {
      // A worker cannot wait for itself; it ends on its own once its work item returns.
      if (thread.get_id() == std::this_thread::get_id()) {
        thread.detach();
      } else {
        thread.join();
      }
    }
    // `discarded` goes last, outside the lock: the destructors of work items may schedule work.
  }

  // The loop of one worker.
  void Run() {
    std::unique_lock<std::mutex> lock(_mutex);
    for (;;) {
      _wake.wait(lock, [this] { return _stopping || !_queue.empty(); });
      if (_stopping) return;
      Functor<void> work = std::move(_queue.front());
      _queue.pop_front();
      lock.unlock();
      RunGuarded(work);
      // Destroyed before the lock is taken again: its destructor may schedule work.
      work = nullptr;
      lock.lock();
    }
  }

 private:
  void RunGuarded(const Functor<void>& work) const {
    try {
      work();
    } catch (const std::exception& e) {
      Service::LogInternal(_logger.get(), Service::LOG_WARNING, "Exception left a thread pool work item: %1",
                           e.what());
    } catch (...) {
      Service::LogInternal(_logger.get(), Service::LOG_WARNING,
                           "Exception of an unknown type left a thread pool work item");
    }
  }

  std::mutex _mutex;
  std::condition_variable _wake;
  std::deque<Functor<void>> _queue;
  std::vector<std::thread> _threads;
  bool _stopping = false;
  Ref<Service::Logger> _logger;
};

ThreadPool::ThreadPool(size_t threadCount) : _workers(std::make_shared<Workers>()), _threadCount(threadCount) {
  if (threadCount == 0) throw InvalidArgumentException("A thread pool needs at least one thread");
  try {
    for (size_t i = 0; i < threadCount; ++i) {
      std::shared_ptr<Workers> workers = _workers;
      _workers->AddThread(std::thread([workers] { workers->Run(); }));
    }
  } catch (...) {
    _workers->Stop();
    throw;
  }
}

ThreadPool::~ThreadPool() { Stop(); }

void ThreadPool::Schedule(const Functor<void>& work) {
  if (!work) throw InvalidArgumentException("The work item scheduled on the thread pool is empty");
  // A reference of its own: the work may destroy this pool before Enqueue has returned.
  const std::shared_ptr<Workers> workers = _workers;
  workers->Enqueue(work);
}

void ThreadPool::Stop() { _workers->Stop(); }

namespace {

void StopProcessPool() { GetThreadPool().Stop(); }

ThreadPool* StartProcessPool() {
  const size_t threadCount = std::max<size_t>(2, std::thread::hardware_concurrency());
  ThreadPool* pool = new ThreadPool(threadCount);
  // Registered after the pool has started, so that it runs before the destructors of the static
  // objects that existed by then: work still running at exit finishes while they are alive.
  std::atexit(StopProcessPool);
  return pool;
}

}  // namespace

ThreadPool& GetThreadPool() {
  // Never destroyed (see the header); the exit handler stops its workers.
  static ThreadPool* const pool = StartProcessPool();
  return *pool;
}

}  // namespace System
}  // namespace Tamber
