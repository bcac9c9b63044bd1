#include "tamber/http/UserAgentImpl.h"

#include "tamber/http/HttpException.h"
#include "tamber/http/PendingRequestItemImpl.h"
#include "tamber/http/Transfer.h"
#include "tamber/http/TransferEngine.h"
#include "tamber/http/UrlSyntax.h"

namespace Tamber {
namespace Http {

namespace {

std::string Origin(const ConnectionSpec& spec) {
  return std::string(spec.IsSecure() ? "https://" : "http://") + Endpoint(spec.GetHost(), spec.GetPort());
}

std::string Description(const ConnectionSpec& spec) {
  std::string text = std::string(spec.IsSecure() ? "HTTPS" : "HTTP") + " request to " +
                     Endpoint(spec.GetHost(), spec.GetPort());
  const TcpConnectionSpec& tcp = GetTcpPart(spec);
  if (tcp.GetHost() != spec.GetHost()) text += " (at " + Endpoint(tcp.GetHost(), tcp.GetPort()) + ")";
  return text;
}

std::string DescribeDuration(int64_t micros) {
  if (micros % 1000 == 0) return std::to_string(micros / 1000) + " ms";
  return std::to_string(micros) + " microseconds";
}

}  // namespace

UserAgentImpl::UserAgentImpl(ConnectionSpec* spec, CookieStoreImpl* store)
    : _spec(spec), _store(store), _origin(Origin(*spec)), _description(Description(*spec)) {
  Curl::GlobalInit();
  _easy.reset(curl_easy_init());
  if (!_easy) throw InvalidStateException("libcurl could not create a transfer handle");
  Configure();
}

const SslConnectionSpec* UserAgentImpl::GetSslSpec() const {
  return _spec->IsSecure() ? DynamicCast<const SslConnectionSpec>(_spec.get()) : nullptr;
}

void UserAgentImpl::Configure() {
  CURL* easy = _easy.get();
  // Cookies and connections stay in the agent's own store.
  TAMBER_CURL_SET(easy, CURLOPT_SHARE, _store->GetShare());
  TAMBER_CURL_SET(easy, CURLOPT_COOKIEFILE, "");
  // Nothing from the environment: an empty proxy turns off http_proxy, https_proxy, ALL_PROXY
  // and NO_PROXY alike.
  TAMBER_CURL_SET(easy, CURLOPT_PROXY, "");
  TAMBER_CURL_SET(easy, CURLOPT_NETRC, static_cast<long>(CURL_NETRC_IGNORED));
  TAMBER_CURL_SET(easy, CURLOPT_NOSIGNAL, 1L);
  TAMBER_CURL_SET(easy, CURLOPT_PROTOCOLS_STR, "http,https");
  TAMBER_CURL_SET(easy, CURLOPT_REDIR_PROTOCOLS_STR, "http,https");
  TAMBER_CURL_SET(easy, CURLOPT_FOLLOWLOCATION, 0L);
  TAMBER_CURL_SET(easy, CURLOPT_HTTP_VERSION, static_cast<long>(CURL_HTTP_VERSION_1_1));
  TAMBER_CURL_SET(easy, CURLOPT_MAXFILESIZE_LARGE, static_cast<curl_off_t>(Transfer::kMaxBodySize));
  TAMBER_CURL_SET(easy, CURLOPT_TCP_KEEPALIVE, GetTcpPart(*_spec).UsesTcpKeepAlive() ? 1L : 0L);

  const SslConnectionSpec* ssl = GetSslSpec();
  if (ssl == nullptr) return;
  TAMBER_CURL_SET(easy, CURLOPT_SSLVERSION, static_cast<long>(CURL_SSLVERSION_TLSv1_2));
  // Resuming a session would skip the certificate check of the new connection.
  TAMBER_CURL_SET(easy, CURLOPT_SSL_SESSIONID_CACHE, 0L);
  // The peer verifier decides inside the handshake; libcurl's own checks after it stay on as a
  // second line, except with a pin, which alone decides.
  const bool pinned = !ssl->GetPin().empty();
  TAMBER_CURL_SET(easy, CURLOPT_SSL_VERIFYPEER, !pinned && ssl->GetSSLContext().VerifiesPeer() ? 1L : 0L);
  TAMBER_CURL_SET(easy, CURLOPT_SSL_VERIFYHOST, !pinned && ssl->GetSSLContext().VerifiesHostName() ? 2L : 0L);
  TAMBER_CURL_SET(easy, CURLOPT_SSL_CTX_FUNCTION, &Transfer::OnSslContext);
  // libcurl loads its CA bundle into the TLS context's store after our callback has put the
  // context's own anchors there, and may hand a store it cached from another connection to the
  // next one: either would trust more than the anchors given. Load nothing, cache nothing.
  TAMBER_CURL_SET(easy, CURLOPT_CA_CACHE_TIMEOUT, 0L);
  if (pinned || !ssl->GetSSLContext().GetTrustedCertificates().empty()) {
    TAMBER_CURL_SET(easy, CURLOPT_CAINFO, static_cast<const char*>(nullptr));
    TAMBER_CURL_SET(easy, CURLOPT_CAPATH, static_cast<const char*>(nullptr));
  }
  const TcpConnectionSpec& tcp = ssl->GetTcp();
  if (tcp.GetHost() != ssl->GetHost()) {
    // The URL names the host to prove; the TCP connection goes where the TCP description says.
    Curl::Append(_connectTo, Endpoint(ssl->GetHost(), tcp.GetPort()) + ":" + Endpoint(tcp.GetHost(), tcp.GetPort()));
    TAMBER_CURL_SET(easy, CURLOPT_CONNECT_TO, _connectTo.get());
  }
}

void UserAgentImpl::SendRequestAsync(HttpRequest* request, const CompletionFunctor& completion,
                                     Ref<PendingRequestItem>& item) {
  HttpRequestImpl* impl = DynamicCast<HttpRequestImpl>(request);
  if (impl == nullptr) throw InvalidArgumentException("The HTTP request to send must not be null");
  if (!impl->Freeze()) throw InvalidStateException("The HTTP request has been sent already");
  Ref<PendingRequestItemImpl> pending(new PendingRequestItemImpl(this, impl, completion));
  TransferEngine::Get().Submit(pending.get());
  item = pending;
}

void UserAgentImpl::GetResponse(PendingRequestItem* item, int64_t timeoutMicros, Ref<ClientResponse>& response) {
  PendingRequestItemImpl* pending = dynamic_cast<PendingRequestItemImpl*>(item);
  if (pending == nullptr || &pending->GetAgent() != this) {
    throw InvalidArgumentException("The pending request does not belong to this user agent");
  }
  if (TransferEngine::IsWorkerThread()) {
    throw InvalidStateException("A completion of an HTTP request cannot wait for a response: the wait would never end");
  }
  if (!pending->Wait(timeoutMicros)) {
    pending->Cancel();
    throw HttpTimeoutException("No response to the " + _description + " within " + DescribeDuration(timeoutMicros));
  }
  pending->TakeOutcome(response);
}

void CreateHttpUserAgent(ConnectionSpec* spec, CookieStore* cookieStore, ConnectionPool* connectionPool,
                         Ref<UserAgent>& agent) {
  if (spec == nullptr) throw InvalidArgumentException("A user agent needs a connection description");
  if (cookieStore == nullptr) throw InvalidArgumentException("A user agent needs a cookie store");
  if (connectionPool != nullptr) {
    throw InvalidArgumentException("Connection pools are not supported: user agents keep their own connections");
  }
  CookieStoreImpl* store = DynamicCast<CookieStoreImpl>(cookieStore);
  if (!store->Bind()) throw InvalidArgumentException("The cookie store is in use by another user agent already");
  agent = new UserAgentImpl(spec, store);
}

}  // namespace Http
}  // namespace Tamber
