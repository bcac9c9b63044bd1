#ifndef TAMBER_HTTP_PENDINGREQUESTITEMIMPL_H
#define TAMBER_HTTP_PENDINGREQUESTITEMIMPL_H

#include <condition_variable>
#include <memory>
#include <mutex>

#include "tamber/http/HttpRequestImpl.h"
#include "tamber/http/UserAgent.h"

namespace Tamber {
namespace Http {

class UserAgentImpl;

// A request between its hand-over to the worker and its outcome. The worker decides the outcome
// exactly once (Finish or Abandon); any thread may wait for it.
class PendingRequestItemImpl : public PendingRequestItem {
 public:
  PendingRequestItemImpl(UserAgentImpl* agent, HttpRequestImpl* request, const CompletionFunctor& completion);

  HttpRequest* GetRequest() const override;
  bool IsDone() const override;
  bool Wait(int64_t timeoutMicros) const override;
  void Cancel() override;

  UserAgentImpl& GetAgent() const { return *_agent; }
  const HttpRequestImpl& GetRequestImpl() const { return *_request; }

  // Worker only: runs the completion with exactly one of `error` and `response`, then records
  // the outcome and wakes the waiters. Later calls do nothing.
  void Finish(const Exception* error, ClientResponse* response);
  // Worker only, at process exit: records `error` and wakes the waiters without running the
  // completion.
  void Abandon(const Exception& error);

  // Once done: hands back the response, or throws the failure with its own class.
  void TakeOutcome(Ref<ClientResponse>& response) const;

 private:
  void Record(const Exception* error, ClientResponse* response);

  const Ref<UserAgentImpl> _agent;
  const Ref<HttpRequestImpl> _request;
  CompletionFunctor _completion;  // worker only; emptied when used

  mutable std::mutex _mutex;
  mutable std::condition_variable _doneChanged;
  bool _done = false;
  std::unique_ptr<Exception> _error;
  Ref<ClientResponse> _response;
};

}  // namespace Http
}  // namespace Tamber

#endif
