#ifndef TOOLS_CLI_ASYNCRESULT_H
#define TOOLS_CLI_ASYNCRESULT_H

// The outcome of one asynchronous operation of the library, awaited with a time limit.

#include <boost/function.hpp>
#include <chrono>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>

#include "ExitCodes.h"
#include "tamber/Exception.h"

namespace Cli {

template <class Value>
class AsyncResult {
 public:
  AsyncResult() : _state(std::make_shared<State>()) {}

  // The completion to hand to the library. It shares the state, so that a completion that
  // comes after Wait gave up touches nothing freed.
  boost::function<void(const Value&, const Tamber::Exception*)> Callback() const {
    std::shared_ptr<State> state = _state;
    return [state](const Value& value, const Tamber::Exception* failure) {
      std::lock_guard<std::mutex> lock(state->mutex);
      if (failure != nullptr) {
        state->failure.reset(failure->Clone());
      } else {
        state->value = value;
      }
      state->done = true;
      state->doneChanged.notify_all();
    };
  }

  // The value, or the operation's failure rethrown with its own class; TimeoutError when no
  // outcome arrives within `timeout`.
  Value Wait(std::chrono::milliseconds timeout) const {
    std::unique_lock<std::mutex> lock(_state->mutex);
    if (!_state->doneChanged.wait_for(lock, timeout, [this] { return _state->done; })) {
      throw TimeoutError("expected an answer from the STS within " + std::to_string(timeout.count()) +
                         " ms, found none");
    }
    if (_state->failure) _state->failure->Throw();
    return _state->value;
  }

 private:
  struct State {
    std::mutex mutex;
    std::condition_variable doneChanged;
    bool done = false;
    Value value;
    std::unique_ptr<Tamber::Exception> failure;
  };
  std::shared_ptr<State> _state;
};

}  // namespace Cli

#endif
