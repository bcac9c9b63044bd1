#ifndef TAMBER_HTTP_HTTPREQUEST_H
#define TAMBER_HTTP_HTTPREQUEST_H

#include <cstddef>
#include <string>

#include "tamber/Ref.h"

namespace Tamber {
namespace Http {

// The request methods the layer speaks.
enum HttpMethod {
  HTTP_GET = 1,
  HTTP_HEAD = 2,
  HTTP_POST = 3,
  HTTP_PUT = 4,
  HTTP_DELETE = 5,
};

// One request: a method, a target path, header lines in the order added, and a body. It may be
// changed until it is handed to a user agent; from then on it is read-only and any change
// raises InvalidStateException.
class TAMBER_API HttpRequest : public Object {
 public:
  virtual HttpMethod GetMethod() const = 0;
  // The target as given at creation, query included.
  virtual const std::string& GetPath() const = 0;

  // Adds the header line "name: value". The name must be an HTTP token and the value must not
  // hold CR, LF or NUL (so that nothing can be smuggled into the request); anything else raises
  // InvalidArgumentException.
  virtual void AddHeader(const std::string& name, const std::string& value) = 0;
  // Appends bytes to the body.
  virtual void WriteBody(const char* data, size_t size) = 0;
  void WriteBody(const std::string& data) { WriteBody(data.data(), data.size()); }
};

// A new request. `path` is the target: it starts with "/" and holds only characters allowed in
// a URL path and query (no spaces, controls or "#"); anything else, or an unknown method, raises
// InvalidArgumentException.
TAMBER_API void CreateHttpRequest(HttpMethod method, const std::string& path, Ref<HttpRequest>& request);

}  // namespace Http
}  // namespace Tamber

#endif
