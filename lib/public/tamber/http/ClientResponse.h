#ifndef TAMBER_HTTP_CLIENTRESPONSE_H
#define TAMBER_HTTP_CLIENTRESPONSE_H

#include <string>

#include "tamber/Stream.h"

namespace Tamber {
namespace Http {

// A complete response as received. The response itself is the reader over its body: a Ref to
// the reader keeps the whole response alive. Bodies are at most 16 MiB (larger answers fail
// while they are received).
class TAMBER_API ClientResponse : public Reader {
 public:
  // The HTTP status code, e.g. 200 or 500.
  virtual int GetStatusCode() const = 0;
  // The reason phrase of the status line as the server sent it, cut to 256 bytes, with every
  // byte that is not printable ASCII, space or tab replaced by '?', since it is untrusted text
  // that ends up in messages. Empty when the server sent none.
  virtual const std::string& GetReasonPhrase() const = 0;
};

}  // namespace Http
}  // namespace Tamber

#endif
