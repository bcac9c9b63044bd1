#include "tamber/http/PendingRequestItemImpl.h"

#include <algorithm>
#include <chrono>

#include "tamber/http/TransferEngine.h"
#include "tamber/http/UserAgentImpl.h"
#include "tamber/service/Logging.h"

namespace Tamber {
namespace Http {

namespace {

// Longer waits are cut here, far beyond any use, so that adding them to the clock cannot
// overflow.
constexpr int64_t kLongestWaitMicros = int64_t{10} * 365 * 24 * 3600 * 1000000;

void ReportDroppedException(const char* what) {
  Ref<Service::Logger> logger;
  Service::GetApp()->GetLogManager()->GetLogger("Tamber.Http", Service::LOG_TRACE, logger);
  Service::LogInternal(logger.get(), Service::LOG_ERROR,
                       "The completion of an HTTP request raised an exception, which was dropped: %1", what);
}

}  // namespace

PendingRequestItemImpl::PendingRequestItemImpl(UserAgentImpl* agent, HttpRequestImpl* request,
                                               const CompletionFunctor& completion)
    : _agent(agent), _request(request), _completion(completion) {}

HttpRequest* PendingRequestItemImpl::GetRequest() const { return _request.get(); }

bool PendingRequestItemImpl::IsDone() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _done;
}

bool PendingRequestItemImpl::Wait(int64_t timeoutMicros) const {
  if (timeoutMicros < 0) {
    throw InvalidArgumentException("The time to wait must not be negative; found " + std::to_string(timeoutMicros));
  }
  std::unique_lock<std::mutex> lock(_mutex);
  return _doneChanged.wait_for(lock, std::chrono::microseconds(std::min(timeoutMicros, kLongestWaitMicros)),
                               [this] { return _done; });
}

void PendingRequestItemImpl::Cancel() { TransferEngine::Get().Cancel(this); }

void PendingRequestItemImpl::Finish(const Exception* error, ClientResponse* response) {
  CompletionFunctor completion;
  completion.swap(_completion);
  if (completion) {
    try {
      completion(error, response, this);
    } catch (const std::exception& e) {
      ReportDroppedException(e.what());
    } catch (...) {
      ReportDroppedException("an exception that is not a std::exception");
    }
  }
  Record(error, response);
}

void PendingRequestItemImpl::Abandon(const Exception& error) {
  _completion.clear();
  Record(&error, nullptr);
}

void PendingRequestItemImpl::Record(const Exception* error, ClientResponse* response) {
  {
    std::lock_guard<std::mutex> lock(_mutex);
    if (_done) return;
    _done = true;
    if (error != nullptr) _error.reset(error->Clone());
    _response = response;
  }
  _doneChanged.notify_all();
}

void PendingRequestItemImpl::TakeOutcome(Ref<ClientResponse>& response) const {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_error) _error->Throw();
  response = _response;
}

}  // namespace Http
}  // namespace Tamber
