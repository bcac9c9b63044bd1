#ifndef SSOCLIENT_ASYNCOPERATIONS_H
#define SSOCLIENT_ASYNCOPERATIONS_H

// Runs a bound synchronous operation of the token service on the core layer's thread pool and
// reports its outcome to a completion callback.

#include <boost/bind/bind.hpp>
#include <boost/shared_ptr.hpp>

#include "ssoClient/SamlToken.h"
#include "tamber/Exception.h"
#include "tamber/Functor.h"
#include "tamber/system/ThreadPool.h"

namespace SsoClient {

// The body of a work item: runs `call` and hands its result to `callback` with a null exception,
// or `failureValue` and the Tamber::Exception that `call` raised. Exceptions of other types
// (from `call`, or from `callback`) are not caught and leave the work item, to the pool, without
// the callback being called (again): the callback runs exactly once when `call` ends normally or
// with a Tamber::Exception, and never otherwise.
template <class SyncFunc, class ResultFunc, class FailureValue>
void SyncCallToResultFunc(const SyncFunc& call, const ResultFunc& callback, const FailureValue& failureValue) {
  typename SyncFunc::result_type result{};
  try {
    result = call();
  } catch (const Tamber::Exception& e) {
    callback(failureValue, &e);
    return;
  }
  // Outside the try block: a callback that throws is not called a second time with its own error.
  callback(result, static_cast<const Tamber::Exception*>(nullptr));
}

// Schedules SyncCallToResultFunc with copies of its arguments on the pool and returns at once.
template <class SyncFunc, class ResultFunc, class FailureValue>
void SyncToAsyncCall(const SyncFunc& call, const ResultFunc& callback, const FailureValue& failureValue) {
  const Tamber::Functor<void> work =
      boost::bind(&SyncCallToResultFunc<SyncFunc, ResultFunc, FailureValue>, call, callback, failureValue);
  Tamber::System::GetThreadPool().Schedule(work);
}

// The same for a token-returning call, whose failure value is a null token.
template <class SyncFunc, class ResultFunc>
void SyncToAsyncCall(const SyncFunc& call, const ResultFunc& callback) {
  SyncToAsyncCall(call, callback, boost::shared_ptr<const SamlToken>());
}

}  // namespace SsoClient

#endif
