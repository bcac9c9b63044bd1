#ifndef TAMBER_HTTP_CLIENTRESPONSEIMPL_H
#define TAMBER_HTTP_CLIENTRESPONSEIMPL_H

#include <string>

#include "tamber/http/ClientResponse.h"

namespace Tamber {
namespace Http {

class ClientResponseImpl : public ClientResponse {
 public:
  // `reasonPhrase` as received; it is made safe for messages here.
  ClientResponseImpl(int statusCode, const std::string& reasonPhrase, std::string body);

  int GetStatusCode() const override { return _statusCode; }
  const std::string& GetReasonPhrase() const override { return _reasonPhrase; }
  size_t Read(char* buffer, size_t size) override;

 private:
  const int _statusCode;
  const std::string _reasonPhrase;
  const std::string _body;
  size_t _position = 0;
};

// The reason phrase of an HTTP/1.x status line ("HTTP/1.1 404 Not Found\r\n" gives "Not
// Found"), or empty when the line has none.
std::string ReasonPhraseOfStatusLine(const std::string& statusLine);

}  // namespace Http
}  // namespace Tamber

#endif
