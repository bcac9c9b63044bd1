#ifndef TAMBER_HTTP_TRANSFER_H
#define TAMBER_HTTP_TRANSFER_H

#include <cstddef>
#include <memory>
#include <string>

#include <curl/curl.h>

#include "tamber/http/Curl.h"
#include "tamber/http/PendingRequestItemImpl.h"
#include "tamber/ssl/PeerVerifier.h"

namespace Tamber {
namespace Http {

// One request on its way, on the worker thread: it points the agent's easy handle at the
// request, collects the answer, and turns libcurl's result into the item's outcome.
class Transfer {
 public:
  // Answers larger than this are refused while they arrive.
  static constexpr size_t kMaxBodySize = size_t{16} * 1024 * 1024;

  // Sets the request's options on the agent's easy handle. Raises when libcurl refuses one.
  explicit Transfer(const Ref<PendingRequestItemImpl>& item);
  // Takes the request's pointers off the easy handle again.
  ~Transfer();
  Transfer(const Transfer&) = delete;
  Transfer& operator=(const Transfer&) = delete;

  CURL* GetEasy() const { return _easy; }
  PendingRequestItemImpl& GetItem() const { return *_item; }

  // Finishes the item from libcurl's result.
  void Complete(CURLcode result);
  // Finishes the item as cancelled.
  void CompleteCancelled();

  // CURLOPT_SSL_CTX_FUNCTION: hands each new TLS context to the transfer's peer verifier.
  static CURLcode OnSslContext(CURL* easy, void* sslContext, void* transfer);

 private:
  static size_t OnBody(char* data, size_t size, size_t count, void* transfer);
  static size_t OnHeader(char* data, size_t size, size_t count, void* transfer);
  void SetMethodAndBody();
  std::string DescribeFailure(CURLcode result) const;
  void Fail(const std::string& reason);

  const Ref<PendingRequestItemImpl> _item;
  CURL* const _easy;
  std::unique_ptr<Ssl::PeerVerifier> _verifier;
  Curl::SlistPtr _headers;
  char _errorBuffer[CURL_ERROR_SIZE];
  std::string _statusLine;
  std::string _body;
  bool _bodyTooLarge = false;
};

}  // namespace Http
}  // namespace Tamber

#endif
