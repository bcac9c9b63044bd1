#include "tamber/http/Transfer.h"

#include "tamber/http/ClientResponseImpl.h"
#include "tamber/http/HttpException.h"
#include "tamber/http/UserAgentImpl.h"
#include "tamber/ssl/SSLContextImpl.h"

namespace Tamber {
namespace Http {

namespace {

const std::string kBodyTooLarge =
    "the response is larger than the limit of " + std::to_string(Transfer::kMaxBodySize) + " bytes";

}  // namespace

Transfer::Transfer(const Ref<PendingRequestItemImpl>& item) : _item(item), _easy(item->GetAgent().GetEasy()) {
  _errorBuffer[0] = '\0';
  const UserAgentImpl& agent = _item->GetAgent();
  const HttpRequestImpl& request = _item->GetRequestImpl();
  if (const SslConnectionSpec* ssl = agent.GetSslSpec()) {
    _verifier.reset(new Ssl::PeerVerifier(*DynamicCast<const Ssl::SSLContextImpl>(&ssl->GetSSLContext()),
                                          ssl->GetHost(), ssl->GetPin()));
    TAMBER_CURL_SET(_easy, CURLOPT_SSL_CTX_DATA, this);
  }

  for (const std::string& line : request.GetHeaderLines()) Curl::Append(_headers, line);
  // Bodies go out at once, without waiting for a "100 Continue".
  Curl::Append(_headers, "Expect:");

  TAMBER_CURL_SET(_easy, CURLOPT_URL, (agent.GetOrigin() + request.GetPath()).c_str());
  TAMBER_CURL_SET(_easy, CURLOPT_HTTPHEADER, _headers.get());
  SetMethodAndBody();
  TAMBER_CURL_SET(_easy, CURLOPT_ERRORBUFFER, _errorBuffer);
  TAMBER_CURL_SET(_easy, CURLOPT_WRITEFUNCTION, &Transfer::OnBody);
  TAMBER_CURL_SET(_easy, CURLOPT_WRITEDATA, this);
  TAMBER_CURL_SET(_easy, CURLOPT_HEADERFUNCTION, &Transfer::OnHeader);
  TAMBER_CURL_SET(_easy, CURLOPT_HEADERDATA, this);
}

Transfer::~Transfer() {
  // Nothing of this transfer may stay reachable from the handle; these calls cannot fail.
  curl_easy_setopt(_easy, CURLOPT_ERRORBUFFER, nullptr);
  curl_easy_setopt(_easy, CURLOPT_HTTPHEADER, nullptr);
  curl_easy_setopt(_easy, CURLOPT_POSTFIELDS, nullptr);
  curl_easy_setopt(_easy, CURLOPT_WRITEDATA, nullptr);
  curl_easy_setopt(_easy, CURLOPT_HEADERDATA, nullptr);
  curl_easy_setopt(_easy, CURLOPT_SSL_CTX_DATA, nullptr);
}

void Transfer::SetMethodAndBody() {
  const HttpRequestImpl& request = _item->GetRequestImpl();
  // Start from a plain GET: the handle may still carry the method of the agent's last request.
  TAMBER_CURL_SET(_easy, CURLOPT_HTTPGET, 1L);
  TAMBER_CURL_SET(_easy, CURLOPT_CUSTOMREQUEST, static_cast<const char*>(nullptr));
  switch (request.GetMethod()) {
    case HTTP_GET:
      return;
    case HTTP_HEAD:
      TAMBER_CURL_SET(_easy, CURLOPT_NOBODY, 1L);
      return;
    case HTTP_PUT:
      TAMBER_CURL_SET(_easy, CURLOPT_CUSTOMREQUEST, "PUT");
      break;
    case HTTP_DELETE:
      TAMBER_CURL_SET(_easy, CURLOPT_CUSTOMREQUEST, "DELETE");
      if (request.GetBody().empty()) return;
      break;
    case HTTP_POST:
      break;
  }
  // The request is read-only and kept alive by the item, so libcurl may read the body in place.
  TAMBER_CURL_SET(_easy, CURLOPT_POST, 1L);
  TAMBER_CURL_SET(_easy, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(request.GetBody().size()));
  TAMBER_CURL_SET(_easy, CURLOPT_POSTFIELDS, request.GetBody().data());
}

size_t Transfer::OnBody(char* data, size_t size, size_t count, void* transfer) {
  Transfer* self = static_cast<Transfer*>(transfer);
  const size_t length = size * count;
  // Counted here because a chunked answer announces no length for CURLOPT_MAXFILESIZE to check.
  if (length > kMaxBodySize - self->_body.size()) {
    self->_bodyTooLarge = true;
    return 0;  // anything but `length` makes libcurl stop with CURLE_WRITE_ERROR
  }
  self->_body.append(data, length);
  return length;
}

size_t Transfer::OnHeader(char* data, size_t size, size_t count, void* transfer) {
  Transfer* self = static_cast<Transfer*>(transfer);
  const size_t length = size * count;
  // Interim (1xx) answers come first, each with a status line of its own; the last one wins.
  if (length >= 5 && std::string(data, 5) == "HTTP/") self->_statusLine.assign(data, length);
  return length;
}

CURLcode Transfer::OnSslContext(CURL*, void* sslContext, void* transfer) {
  Transfer* self = static_cast<Transfer*>(transfer);
  if (self == nullptr || !self->_verifier) return CURLE_SSL_CERTPROBLEM;
  return self->_verifier->Configure(static_cast<SSL_CTX*>(sslContext)) ? CURLE_OK : CURLE_SSL_CERTPROBLEM;
}

std::string Transfer::DescribeFailure(CURLcode result) const {
  // The most specific reason first: our own checks know more than libcurl's summary of them.
  if (_verifier && !_verifier->GetFailure().empty()) return _verifier->GetFailure();
  if (_bodyTooLarge || result == CURLE_FILESIZE_EXCEEDED) return kBodyTooLarge;
  if (_errorBuffer[0] != '\0') return _errorBuffer;
  return curl_easy_strerror(result);
}

void Transfer::Fail(const std::string& reason) {
  const HttpException error(_item->GetAgent().GetDescription() + " " + reason);
  _item->Finish(&error, nullptr);
}

void Transfer::Complete(CURLcode result) {
  if (result != CURLE_OK) return Fail("failed: " + DescribeFailure(result));
  long status = 0;
  curl_easy_getinfo(_easy, CURLINFO_RESPONSE_CODE, &status);
  Ref<ClientResponse> response(
      new ClientResponseImpl(static_cast<int>(status), ReasonPhraseOfStatusLine(_statusLine), std::move(_body)));
  _item->Finish(nullptr, response.get());
}

void Transfer::CompleteCancelled() { Fail("was cancelled"); }

}  // namespace Http
}  // namespace Tamber
