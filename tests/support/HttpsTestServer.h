#ifndef TESTS_SUPPORT_HTTPSTESTSERVER_H
#define TESTS_SUPPORT_HTTPSTESTSERVER_H

// Loopback servers for the HTTP client tests: an HTTPS (or HTTP) server that records every
// request and answers as a test tells it, and a raw TCP server for answers that no HTTP server
// library sends (a 1xx status as the final answer, no answer at all).

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace TestSupport {

struct RecordedRequest {
  std::string method;
  std::string target;   // path and query, as sent
  std::string version;  // "HTTP/1.1"
  std::vector<std::pair<std::string, std::string>> headers;
  std::string body;
  // The client's port: requests that share it came over one connection.
  int remotePort = 0;

  std::string RequestLine() const { return method + " " + target + " " + version; }
  // The value of the first header of that name (any case); empty when there is none.
  std::string Header(const std::string& name) const;
  bool HasHeader(const std::string& name) const;
};

struct CannedResponse {
  int status = 200;
  std::string body = "<ok/>";
  std::string contentType = "text/xml";
  std::vector<std::pair<std::string, std::string>> headers;
  // When not zero, the body is that many bytes sent in chunks, without a Content-Length.
  size_t chunkedBodySize = 0;
};

class HttpsTestServer {
 public:
  struct Options {
    // The server identity: tests/data/keys/<certificate>.pem and .key.
    std::string certificate = "tls-server";
    // Requires a client certificate issued by the test CA.
    bool requireClientCertificate = false;
    bool plainHttp = false;
    // The loopback address to listen on: "127.0.0.1" or "::1".
    std::string address = "127.0.0.1";
  };
  using Handler = std::function<CannedResponse(const RecordedRequest&)>;

  // Listens on loopback at an ephemeral port until destroyed; by default every request is
  // answered with 200 and "<ok/>".
  HttpsTestServer();
  explicit HttpsTestServer(const Options& options);
  ~HttpsTestServer();
  HttpsTestServer(const HttpsTestServer&) = delete;
  HttpsTestServer& operator=(const HttpsTestServer&) = delete;

  void SetHandler(const Handler& handler);
  int GetPort() const;
  // "https://127.0.0.1:<port><path>" ("http://" for a plain server, "[::1]" for IPv6).
  std::string GetUrl(const std::string& path = "/sts") const;
  std::vector<RecordedRequest> GetRequests() const;

 private:
  class Impl;
  std::unique_ptr<Impl> _impl;
};

// Accepts TCP connections on 127.0.0.1 and records what arrives. With a reply, it sends the
// reply once a connection has sent a complete request (headers and Content-Length body) and
// closes it; without one it never answers and keeps every connection open until destroyed.
class RawTcpServer {
 public:
  explicit RawTcpServer(const std::string& reply = "");
  ~RawTcpServer();
  RawTcpServer(const RawTcpServer&) = delete;
  RawTcpServer& operator=(const RawTcpServer&) = delete;

  int GetPort() const;
  int GetConnectionCount() const;
  std::string GetReceived() const;

 private:
  class Impl;
  std::unique_ptr<Impl> _impl;
};

// A loopback port on which nothing listens (bound once, then released).
int UnusedLoopbackPort();

}  // namespace TestSupport

#endif
