#include "tamber/system/ThreadPool.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <future>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>

#include "support/LogCapture.h"
#include "tamber/Exception.h"

namespace {

using Tamber::Functor;
using Tamber::System::GetThreadPool;
using Tamber::System::ThreadPool;
using TestSupport::LogCapture;

constexpr std::chrono::seconds kPatience(20);

// A one-shot signal between threads.
class Signal {
 public:
  void Raise() { _promise.set_value(); }
  // True when raised within the patience of the suite.
  bool Await() { return _future.wait_for(kPatience) == std::future_status::ready; }

 private:
  std::promise<void> _promise;
  std::shared_future<void> _future{_promise.get_future().share()};
};

TEST(ThreadPoolTest, ProcessPoolHasOneWorkerPerCoreAndAtLeastTwo) {
  const size_t expected = std::max<size_t>(2, std::thread::hardware_concurrency());
  EXPECT_EQ(GetThreadPool().GetThreadCount(), expected);
  EXPECT_EQ(&GetThreadPool(), &GetThreadPool());
}

TEST(ThreadPoolTest, ScheduleReturnsBeforeTheWorkRunsOnAWorkerThread) {
  Signal scheduled, done;
  std::thread::id worker;
  GetThreadPool().Schedule([&] {
    // Waits for the caller: Schedule must have returned without waiting for this item.
    if (!scheduled.Await()) return;
    worker = std::this_thread::get_id();
    done.Raise();
  });
  scheduled.Raise();
  ASSERT_TRUE(done.Await());
  EXPECT_NE(worker, std::this_thread::get_id());
}

TEST(ThreadPoolTest, EveryItemRunsExactlyOnce) {
  ThreadPool pool(3);
  constexpr int kItems = 1000;
  std::atomic<int> runs[kItems] = {};
  std::atomic<int> remaining(kItems);
  Signal done;
  for (int i = 0; i < kItems; ++i) {
    pool.Schedule([&, i] {
      ++runs[i];
      if (--remaining == 0) done.Raise();
    });
  }
  ASSERT_TRUE(done.Await());
  pool.Stop();
  for (int i = 0; i < kItems; ++i) EXPECT_EQ(runs[i].load(), 1) << "item " << i;
}

TEST(ThreadPoolTest, WorkScheduledFromWorkRuns) {
  Signal done;
  GetThreadPool().Schedule([&] { GetThreadPool().Schedule([&] { done.Raise(); }); });
  EXPECT_TRUE(done.Await());
}

TEST(ThreadPoolTest, AWorkItemIsDestroyedOnTheWorkerAfterItRan) {
  ThreadPool pool(1);
  auto owned = std::make_shared<int>(0);
  std::weak_ptr<int> watch = owned;
  Signal ran, destroyedBeforeNext;
  pool.Schedule([owned, &ran] { ran.Raise(); });
  owned.reset();
  // The next item runs after the first item's copy is gone.
  pool.Schedule([&] {
    if (watch.expired()) destroyedBeforeNext.Raise();
  });
  ASSERT_TRUE(ran.Await());
  EXPECT_TRUE(destroyedBeforeNext.Await());
}

struct EscapingException {
  const char* name;
  std::function<void()> raise;
  const char* logged;
};

class ThreadPoolEscapeTest : public ::testing::TestWithParam<EscapingException> {};

TEST_P(ThreadPoolEscapeTest, ExceptionIsLoggedAndSwallowed) {
  SCOPED_TRACE(GetParam().name);
  LogCapture capture("Tamber");
  ThreadPool pool(1);
  Signal next;
  pool.Schedule(GetParam().raise);
  // One worker: this item runs after the first has thrown and been logged, on the same worker.
  pool.Schedule([&] { next.Raise(); });
  ASSERT_TRUE(next.Await());
  const auto entries = capture.GetEntries();
  ASSERT_EQ(entries.size(), 1u);
  EXPECT_EQ(entries[0].logger, "Tamber");
  EXPECT_EQ(entries[0].level, 8);
  EXPECT_EQ(entries[0].message, GetParam().logged);
}

INSTANTIATE_TEST_SUITE_P(
    Escapes, ThreadPoolEscapeTest,
    ::testing::Values(
        EscapingException{"std::exception", [] { throw std::runtime_error("disk on fire"); },
                          "Exception left a thread pool work item: disk on fire"},
        EscapingException{"layer exception", [] { throw Tamber::InvalidArgumentException("bad input"); },
                          "Exception left a thread pool work item: Invalid argument : bad input"},
        EscapingException{"empty std::function", [] { std::function<void()>()(); },
                          "Exception left a thread pool work item: bad_function_call"},
        EscapingException{"not an exception class", [] { throw 42; },
                          "Exception of an unknown type left a thread pool work item"}));

TEST(ThreadPoolTest, RefusesEmptyWorkAndZeroThreads) {
  try {
    GetThreadPool().Schedule(Functor<void>());
    FAIL() << "empty work accepted";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : The work item scheduled on the thread pool is empty");
  }
  try {
    ThreadPool pool(0);
    FAIL() << "pool without threads accepted";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : A thread pool needs at least one thread");
  }
}

TEST(ThreadPoolTest, StopWaitsForRunningWorkAndDiscardsQueuedWork) {
  ThreadPool pool(1);
  Signal started, release;
  std::atomic<bool> firstFinished(false), queuedRan(false);
  pool.Schedule([&] {
    started.Raise();
    release.Await();
    firstFinished = true;
  });
  auto owned = std::make_shared<int>(0);
  std::weak_ptr<int> watch = owned;
  pool.Schedule([owned, &queuedRan] { queuedRan = true; });
  owned.reset();
  ASSERT_TRUE(started.Await());

  bool finishedWhenStopReturned = false;
  std::thread stopper([&] {
    pool.Stop();
    finishedWhenStopReturned = firstFinished;
  });
  // Once Schedule refuses, Stop has taken the queue; only then may the running item end.
  for (;;) {
    try {
      pool.Schedule([&queuedRan] { queuedRan = true; });
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    } catch (const Tamber::InvalidStateException&) {
      break;
    }
  }
  release.Raise();
  stopper.join();
  EXPECT_TRUE(finishedWhenStopReturned);
  EXPECT_FALSE(queuedRan);
  EXPECT_TRUE(watch.expired());
}

TEST(ThreadPoolTest, ScheduleAfterStopIsRefused) {
  ThreadPool pool(2);
  pool.Stop();
  pool.Stop();
  try {
    pool.Schedule([] {});
    FAIL() << "work accepted by a stopped pool";
  } catch (const Tamber::InvalidStateException& e) {
    EXPECT_STREQ(e.what(), "The thread pool is stopped: no work can be scheduled any more");
  }
}

TEST(ThreadPoolTest, AWorkItemMayStopOrDestroyItsOwnPool) {
  {
    ThreadPool pool(2);
    Signal stopped;
    pool.Schedule([&] {
      pool.Stop();
      stopped.Raise();
    });
    EXPECT_TRUE(stopped.Await());
  }
  auto* pool = new ThreadPool(2);
  Signal destroyed;
  pool->Schedule([&] {
    delete pool;
    destroyed.Raise();
  });
  EXPECT_TRUE(destroyed.Await());
}

// The process-exit cases run in a child process each, so that they start with a fresh pool.
class ThreadPoolExitTest : public ::testing::Test {
 protected:
  void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

// Says on stderr when it is destroyed, so that the order of exit steps shows in the output.
struct Witness {
  ~Witness() { std::fputs("witness destroyed\n", stderr); }
};

// Exits while a work item runs; the item finishes before the objects that existed when the pool
// started are destroyed.
void ExitWhileWorkRuns() {
  static Witness witness;
  Signal started;
  GetThreadPool().Schedule([&started] {
    started.Raise();
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    std::fputs("work item finished\n", stderr);
  });
  started.Await();
  std::exit(3);
}

TEST_F(ThreadPoolExitTest, ExitWaitsForRunningWork) {
  EXPECT_EXIT(ExitWhileWorkRuns(), ::testing::ExitedWithCode(3), "work item finished\nwitness destroyed\n");
}

// exit() from a work item while another item runs: no self-join, the other item is awaited.
void ExitFromAWorker() {
  Signal otherStarted;
  GetThreadPool().Schedule([&otherStarted] {
    otherStarted.Raise();
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    std::fputs("other item finished\n", stderr);
  });
  GetThreadPool().Schedule([&otherStarted] {
    otherStarted.Await();
    std::exit(5);
  });
  std::this_thread::sleep_for(kPatience);
}

TEST_F(ThreadPoolExitTest, ExitFromAWorkItemEndsTheProcess) {
  EXPECT_EXIT(ExitFromAWorker(), ::testing::ExitedWithCode(5), "other item finished\n");
}

// A work item that schedules more work while the process exits is told so through the log.
void ScheduleDuringExit() {
  Signal started;
  GetThreadPool().Schedule([&started] {
    started.Raise();
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    GetThreadPool().Schedule([] { std::fputs("late item ran\n", stderr); });
  });
  started.Await();
  std::exit(0);
}

TEST_F(ThreadPoolExitTest, WorkScheduledDuringExitIsRefused) {
  EXPECT_EXIT(ScheduleDuringExit(), ::testing::ExitedWithCode(0),
              "^Tamber \\[8\\] Exception left a thread pool work item: The thread pool is stopped: no work can be "
              "scheduled any more\n$");
}

}  // namespace
