#include "tamber/http/HttpRequestImpl.h"

#include <cstring>

#include "tamber/Exception.h"
#include "tamber/http/UrlSyntax.h"

namespace Tamber {
namespace Http {

namespace {

// RFC 9110 token characters.
bool IsTokenCharacter(char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
         (c != '\0' && std::strchr("!#$%&'*+-.^_`|~", c) != nullptr);
}

bool IsToken(const std::string& text) {
  if (text.empty()) return false;
  for (char c : text) {
    if (!IsTokenCharacter(c)) return false;
  }
  return true;
}

}  // namespace

void HttpRequestImpl::CheckNotFrozen() const {
  if (_frozen) throw InvalidStateException("The HTTP request has been sent and can no longer be changed");
}

void HttpRequestImpl::AddHeader(const std::string& name, const std::string& value) {
  CheckNotFrozen();
  if (!IsToken(name)) throw InvalidArgumentException("Bad HTTP header name \"" + name + "\"");
  const std::string::size_type bad = value.find_first_of(std::string("\r\n\0", 3));
  if (bad != std::string::npos) {
    throw InvalidArgumentException("The value of the HTTP header " + name + " holds the character " +
                                   DescribeCharacter(value[bad]));
  }
  // libcurl reads "Name:" without a value as "do not send Name"; "Name;" sends it empty.
  _headerLines.push_back(value.empty() ? name + ";" : name + ": " + value);
}

void HttpRequestImpl::WriteBody(const char* data, size_t size) {
  CheckNotFrozen();
  _body.append(data, size);
}

void CreateHttpRequest(HttpMethod method, const std::string& path, Ref<HttpRequest>& request) {
  if (method < HTTP_GET || method > HTTP_DELETE) {
    throw InvalidArgumentException("Unknown HTTP method " + std::to_string(static_cast<int>(method)));
  }
  const std::string::size_type bad = FindInvalidTargetCharacter(path);
  if (path.empty() || path[0] != '/' || bad != std::string::npos) {
    throw InvalidArgumentException("Bad HTTP request path \"" + path +
                                   "\" (expected \"/\" followed by URL path and query characters)");
  }
  request = new HttpRequestImpl(method, path);
}

}  // namespace Http
}  // namespace Tamber
