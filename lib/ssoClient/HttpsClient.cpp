#include "ssoClient/HttpsClient.h"

#include <boost/bind/bind.hpp>
#include <boost/make_shared.hpp>

#include "ssoClient/Exceptions.h"
#include "tamber/Panic.h"
#include "tamber/http/Url.h"

namespace SsoClient {

using Tamber::Ref;
namespace Http = Tamber::Http;

HttpsClient::HttpsClient(const std::string& url, Tamber::Ssl::SSLContext* sslContext, std::string sslParameter,
                         long long timeout)
    : _sslContext(sslContext), _timeout(timeout) {
  bool isSecure = false;
  std::string host;
  int port = 0;
  Http::ParseHttpURL(url, isSecure, host, port, _path);
  if (isSecure) {
    if (!_sslContext) {
      throw Tamber::InvalidArgumentException("HTTPS connection requested but no SSLContext provided.");
    }
    Ref<Http::ConnectionSpec> tcpSpec;
    Http::CreateTCPConnectionSpec(host, port, false, tcpSpec);
    Http::CreateSSLConnectionSpec(tcpSpec.get(), _sslContext.get(), host, sslParameter, _spec);
  } else {
    Http::CreateTCPConnectionSpec(host, port, false, _spec);
  }
}

boost::shared_ptr<TransportSession> HttpsClient::CreateSession() const {
  return boost::make_shared<HttpsSession>(_spec.get(), _path, _timeout);
}

HttpsSession::HttpsSession(Http::ConnectionSpec* spec, const std::string& path, long long timeout)
    : _path(path), _timeout(timeout) {
  Ref<Http::CookieStore> store;
  Http::CreateCookieStore("", store);
  Http::CreateHttpUserAgent(spec, store.get(), nullptr, _userAgent);
}

void HttpsSession::SendRequestAsync(const Request& request, const ResponseCompletion& completion,
                                    Ref<Http::PendingRequestItem>& item) {
  using namespace boost::placeholders;
  const Http::CompletionFunctor functor = boost::bind(&AsyncTranslateResponse, completion, _1, _2, _3);
  Ref<Http::HttpRequest> httpRequest;
  Http::CreateHttpRequest(Http::HTTP_POST, _path, httpRequest);
  httpRequest->AddHeader("Content-Type", "text/xml");
  httpRequest->AddHeader("SOAPAction", "\"" + request.soapAction + "\"");
  httpRequest->WriteBody(request.body.data(), request.body.size());
  _userAgent->SendRequestAsync(httpRequest.get(), functor, item);
}

void HttpsSession::SendRequestAsync(const Request& request, const ResponseCompletion& completion,
                                    Ref<Tamber::System::ScheduledItem>& item) {
  Ref<Http::PendingRequestItem> pending;
  SendRequestAsync(request, completion, pending);
  item = pending;
}

void HttpsSession::SendRequest(const Request& request, Ref<Tamber::Reader>& response) {
  Ref<Http::PendingRequestItem> item;
  SendRequestAsync(request, &noop, item);
  boost::shared_ptr<Tamber::Exception> failure;
  Ref<Http::ClientResponse> httpResponse;
  try {
    _userAgent->GetResponse(item.get(), _timeout, httpResponse);
  } catch (const Tamber::Exception& e) {
    TranslateResponse(&e, nullptr, failure, response);
  }
  if (httpResponse) {
    try {
      TranslateResponse(nullptr, httpResponse.get(), failure, response);
    } catch (const Tamber::Exception& e) {
      TranslateResponse(&e, nullptr, failure, response);
    }
  }
  if (failure) failure->Throw();
}

void TranslateResponse(const Tamber::Exception* error, Http::ClientResponse* response,
                       boost::shared_ptr<Tamber::Exception>& failure, Ref<Tamber::Reader>& body) {
  if (error != nullptr) {
    failure = boost::make_shared<CommunicationException>(error->what());
    return;
  }
  if (response == nullptr) TAMBER_NOT_REACHED();
  const int code = response->GetStatusCode();
  if (code / 100 != 2 && code != 500) {
    failure = boost::make_shared<CommunicationException>("Server returned error: " + std::to_string(code) + " " +
                                                         response->GetReasonPhrase());
    return;
  }
  body = response;
}

void AsyncTranslateResponse(const ResponseCompletion& completion, const Tamber::Exception* error,
                            Http::ClientResponse* response, Http::PendingRequestItem*) {
  boost::shared_ptr<Tamber::Exception> failure;
  Ref<Tamber::Reader> body;
  TranslateResponse(error, response, failure, body);
  completion(failure.get(), body.get());
}

void noop(const Tamber::Exception*, Tamber::Reader*) {}

}  // namespace SsoClient
