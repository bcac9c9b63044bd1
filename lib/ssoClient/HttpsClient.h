#ifndef SSOCLIENT_HTTPSCLIENT_H
#define SSOCLIENT_HTTPSCLIENT_H

// Posting requests to the STS: the transport interfaces and their HTTPS implementation.

#include <string>

#include <boost/function.hpp>
#include <boost/shared_ptr.hpp>

#include "ssoClient/Request.h"
#include "tamber/Exception.h"
#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/http/UserAgent.h"
#include "tamber/ssl/SSLContext.h"
#include "tamber/system/ScheduledItem.h"

namespace SsoClient {

// Receives the outcome of an asynchronous request: exactly one of the failure and the reader
// over the response body is set; both are valid only during the call.
using ResponseCompletion = boost::function<void(const Tamber::Exception* error, Tamber::Reader* response)>;

// One conversation with the STS: requests sent on it share its cookies and its connection.
class TransportSession {
 public:
  // Posts `request` and waits for the answer; on return `response` reads the body of an answer
  // with status 2xx or 500. Raises CommunicationException for transport failures, a wait that
  // times out and every other status.
  virtual void SendRequest(const Request& request, Tamber::Ref<Tamber::Reader>& response) = 0;
  // Posts `request` and returns at once; `completion` runs on the HTTP worker thread with the
  // outcome, translated as SendRequest translates it. `item` is the pending request.
  virtual void SendRequestAsync(const Request& request, const ResponseCompletion& completion,
                                Tamber::Ref<Tamber::System::ScheduledItem>& item) = 0;

 protected:
  // Owned by shared pointers made from the concrete type.
  ~TransportSession() = default;
};

// A factory of sessions with one STS.
class Transport {
 public:
  virtual boost::shared_ptr<TransportSession> CreateSession() const = 0;

 protected:
  ~Transport() = default;
};

class HttpsClient final : public Transport {
 public:
  // `url` is the STS URL (http or https); an https URL needs `sslContext`. `sslParameter` pins
  // the STS certificate (see Tamber::Http::CreateSSLConnectionSpec). `timeout` bounds each
  // synchronous wait for an answer, in microseconds.
  HttpsClient(const std::string& url, Tamber::Ssl::SSLContext* sslContext, std::string sslParameter,
              long long timeout);

  boost::shared_ptr<TransportSession> CreateSession() const override;

 private:
  Tamber::Ref<Tamber::Http::ConnectionSpec> _spec;
  Tamber::Ref<Tamber::Ssl::SSLContext> _sslContext;
  std::string _path;
  long long _timeout;
};

class HttpsSession final : public TransportSession {
 public:
  HttpsSession(Tamber::Http::ConnectionSpec* spec, const std::string& path, long long timeout);

  void SendRequest(const Request& request, Tamber::Ref<Tamber::Reader>& response) override;
  void SendRequestAsync(const Request& request, const ResponseCompletion& completion,
                        Tamber::Ref<Tamber::System::ScheduledItem>& item) override;
  // The same, handing back the pending request itself.
  void SendRequestAsync(const Request& request, const ResponseCompletion& completion,
                        Tamber::Ref<Tamber::Http::PendingRequestItem>& item);

 private:
  Tamber::Ref<Tamber::Http::UserAgent> _userAgent;
  std::string _path;
  long long _timeout;
};

// Turns the outcome of one HTTP exchange into a failure or a reader over the body: `error`
// becomes a CommunicationException with its text; a status other than 2xx and 500 becomes a
// CommunicationException naming the code and the reason; otherwise `body` reads the response.
void TranslateResponse(const Tamber::Exception* error, Tamber::Http::ClientResponse* response,
                       boost::shared_ptr<Tamber::Exception>& failure, Tamber::Ref<Tamber::Reader>& body);

// The completion handed to the HTTP layer: translates, then calls `completion`.
void AsyncTranslateResponse(const ResponseCompletion& completion, const Tamber::Exception* error,
                            Tamber::Http::ClientResponse* response, Tamber::Http::PendingRequestItem* item);

// A completion that ignores its outcome, for requests whose answer is awaited instead.
void noop(const Tamber::Exception* error, Tamber::Reader* response);

}  // namespace SsoClient

#endif
