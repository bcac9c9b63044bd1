#ifndef TAMBER_HTTP_HTTPREQUESTIMPL_H
#define TAMBER_HTTP_HTTPREQUESTIMPL_H

#include <atomic>
#include <string>
#include <vector>

#include "tamber/http/HttpRequest.h"

namespace Tamber {
namespace Http {

class HttpRequestImpl : public HttpRequest {
 public:
  HttpRequestImpl(HttpMethod method, const std::string& path) : _method(method), _path(path) {}

  HttpMethod GetMethod() const override { return _method; }
  const std::string& GetPath() const override { return _path; }
  void AddHeader(const std::string& name, const std::string& value) override;
  using HttpRequest::WriteBody;
  void WriteBody(const char* data, size_t size) override;

  // "Name: value" lines in the order added.
  const std::vector<std::string>& GetHeaderLines() const { return _headerLines; }
  const std::string& GetBody() const { return _body; }

  // Makes the request read-only; false when it already was (it was sent before).
  bool Freeze() { return !_frozen.exchange(true); }

 private:
  void CheckNotFrozen() const;

  const HttpMethod _method;
  const std::string _path;
  std::vector<std::string> _headerLines;
  std::string _body;
  std::atomic<bool> _frozen{false};
};

}  // namespace Http
}  // namespace Tamber

#endif
