#ifndef TAMBER_HTTP_USERAGENT_H
#define TAMBER_HTTP_USERAGENT_H

#include <cstdint>

#include <boost/function.hpp>

#include "tamber/Exception.h"
#include "tamber/Ref.h"
#include "tamber/http/ClientResponse.h"
#include "tamber/http/ConnectionSpec.h"
#include "tamber/http/CookieStore.h"
#include "tamber/http/HttpRequest.h"
#include "tamber/system/ScheduledItem.h"

namespace Tamber {
namespace Http {

// A request handed to a user agent, until its response or failure is known.
class TAMBER_API PendingRequestItem : public System::ScheduledItem {
 public:
  // The request as handed to the agent, now read-only.
  virtual HttpRequest* GetRequest() const = 0;
};

// Called once per request, on the layer's HTTP worker thread, with exactly one of the failure
// and the response set, and the pending request. Both are valid only during the call: take a
// Ref or a Clone() to keep them. Exceptions thrown by a completion are dropped.
using CompletionFunctor =
    boost::function<void(const Exception* error, ClientResponse* response, PendingRequestItem* item)>;

// Reserved for connection sharing between agents, which the layer does not offer: user agents
// keep their own connections. Always pass null.
class ConnectionPool;

// An HTTP client for one server, with its own cookies and connections (one session).
//
// Threads: every transfer of the process runs on one worker thread of the layer, started on
// first use, which drives all user agents through libcurl's multi interface and runs the
// completions. A user agent sends its requests one after the other, in the order given, over
// a connection it keeps open between them. Completions must be short and must not wait for a
// response themselves. At process exit the worker stops: requests still pending fail with
// HttpException for whoever waits on them, and their completions are not called, since what
// they use may already be destroyed.
//
// Safe defaults, not configurable: no redirect is followed (a 3xx status is an ordinary
// response), only http and https are spoken, no proxy and no other setting is read from the
// environment, no compressed answers are asked for, answers over 16 MiB are refused while they
// arrive, TLS 1.2 at least.
class TAMBER_API UserAgent : public Object {
 public:
  // The server this agent talks to; owned by the agent.
  virtual ConnectionSpec* GetConnectionSpec() const = 0;

  // Queues `request` and returns at once; `completion` runs when the outcome is known. `item`
  // receives the pending request, which keeps the request, the agent and the completion alive
  // until it is done. The request becomes read-only. Raises HttpException when the layer has
  // been shut down (process exit).
  virtual void SendRequestAsync(HttpRequest* request, const CompletionFunctor& completion,
                                Ref<PendingRequestItem>& item) = 0;

  // Waits at most `timeoutMicros` microseconds for the outcome of `item`, a request of this
  // agent, then hands back the response or throws the request's failure with its own class.
  // When the time runs out the request is cancelled and HttpTimeoutException is raised. An item
  // of another agent or a negative timeout raises InvalidArgumentException; a call from the
  // HTTP worker thread (a completion) raises InvalidStateException, since it could never end.
  virtual void GetResponse(PendingRequestItem* item, int64_t timeoutMicros, Ref<ClientResponse>& response) = 0;
};

// A user agent for `spec` keeping its cookies and connections in `cookieStore`, which must not
// serve another agent already. A null spec or store, a store already in use and a non-null
// connection pool raise InvalidArgumentException.
TAMBER_API void CreateHttpUserAgent(ConnectionSpec* spec, CookieStore* cookieStore, ConnectionPool* connectionPool,
                                    Ref<UserAgent>& agent);

}  // namespace Http
}  // namespace Tamber

#endif
