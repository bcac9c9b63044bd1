#include "support/HttpsTestServer.h"

// Debian's cpp-httplib is a compiled library: its pkg-config flags carry the options it was
// built with (OpenSSL, zlib, brotli), which its classes must be seen with.
#include <httplib.h>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <map>
#include <mutex>
#include <stdexcept>
#include <thread>

#include <boost/algorithm/string/predicate.hpp>

#include "tamber/crypto/TestKeys.h"

namespace TestSupport {

std::string RecordedRequest::Header(const std::string& name) const {
  for (const auto& header : headers) {
    if (boost::algorithm::iequals(header.first, name)) return header.second;
  }
  return "";
}

bool RecordedRequest::HasHeader(const std::string& name) const {
  return std::any_of(headers.begin(), headers.end(),
                     [&](const std::pair<std::string, std::string>& h) { return boost::algorithm::iequals(h.first, name); });
}

class HttpsTestServer::Impl {
 public:
  explicit Impl(const Options& options) : _secure(!options.plainHttp), _address(options.address) {
    if (options.plainHttp) {
      _server.reset(new httplib::Server());
    } else {
      const std::string certificate = TestKeys::DataPath("keys/" + options.certificate + ".pem");
      const std::string key = TestKeys::DataPath("keys/" + options.certificate + ".key");
      const std::string clientCa = TestKeys::DataPath("keys/ca.pem");
      _server.reset(new httplib::SSLServer(certificate.c_str(), key.c_str(),
                                           options.requireClientCertificate ? clientCa.c_str() : nullptr));
    }
    if (!_server->is_valid()) throw std::runtime_error("the test server cannot load its certificate");
    _server->set_keep_alive_timeout(1);
    const auto handle = [this](const httplib::Request& request, httplib::Response& response) {
      Handle(request, response);
    };
    _server->Get(".*", handle);
    _server->Post(".*", handle);
    _server->Put(".*", handle);
    _server->Delete(".*", handle);
    _port = _server->bind_to_any_port(_address);
    if (_port <= 0) throw std::runtime_error("the test server cannot bind to " + _address);
    _thread = std::thread([this] { _server->listen_after_bind(); });
    // stop() does nothing before the server runs, so wait for it.
    while (!_server->is_running()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }

  ~Impl() {
    _server->stop();
    _thread.join();
  }

  void SetHandler(const Handler& handler) {
    std::lock_guard<std::mutex> lock(_mutex);
    _handler = handler;
  }

  int GetPort() const { return _port; }

  std::string GetOrigin() const {
    const std::string host = _address.find(':') == std::string::npos ? _address : "[" + _address + "]";
    return std::string(_secure ? "https" : "http") + "://" + host + ":" + std::to_string(_port);
  }

  std::vector<RecordedRequest> GetRequests() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _requests;
  }

 private:
  void Handle(const httplib::Request& request, httplib::Response& response) {
    RecordedRequest recorded{request.method, request.target, request.version, {}, request.body, request.remote_port};
    for (const auto& header : request.headers) recorded.headers.push_back(header);
    Handler handler;
    {
      std::lock_guard<std::mutex> lock(_mutex);
      _requests.push_back(recorded);
      handler = _handler;
    }
    const CannedResponse canned = handler ? handler(recorded) : CannedResponse();
    response.status = canned.status;
    for (const auto& header : canned.headers) response.set_header(header.first.c_str(), header.second);
    if (canned.chunkedBodySize == 0) {
      response.set_content(canned.body, canned.contentType.c_str());
      return;
    }
    const size_t total = canned.chunkedBodySize;
    response.set_chunked_content_provider(canned.contentType.c_str(),
                                          [total](size_t offset, httplib::DataSink& sink) {
                                            const std::string chunk(std::min<size_t>(64 * 1024, total - offset), 'x');
                                            if (!sink.write(chunk.data(), chunk.size())) return false;
                                            if (offset + chunk.size() == total) sink.done();
                                            return true;
                                          });
  }

  const bool _secure;
  const std::string _address;
  std::unique_ptr<httplib::Server> _server;
  int _port = 0;
  std::thread _thread;
  mutable std::mutex _mutex;
  Handler _handler;
  std::vector<RecordedRequest> _requests;
};

HttpsTestServer::HttpsTestServer() : HttpsTestServer(Options()) {}
HttpsTestServer::HttpsTestServer(const Options& options) : _impl(new Impl(options)) {}
HttpsTestServer::~HttpsTestServer() = default;

void HttpsTestServer::SetHandler(const Handler& handler) { _impl->SetHandler(handler); }
int HttpsTestServer::GetPort() const { return _impl->GetPort(); }

std::string HttpsTestServer::GetUrl(const std::string& path) const { return _impl->GetOrigin() + path; }

std::vector<RecordedRequest> HttpsTestServer::GetRequests() const { return _impl->GetRequests(); }

namespace {

// A socket bound to 127.0.0.1 at an ephemeral port; `port` receives the port.
int BindLoopback(int& port) {
  const int fd = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (fd < 0) throw std::runtime_error("socket() failed");
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t length = sizeof address;
  if (bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0 ||
      getsockname(fd, reinterpret_cast<sockaddr*>(&address), &length) != 0) {
    close(fd);
    throw std::runtime_error("cannot bind to 127.0.0.1");
  }
  port = ntohs(address.sin_port);
  return fd;
}

// Whether `data` holds a whole request: the header block and as much body as Content-Length
// announces.
bool IsCompleteRequest(const std::string& data) {
  const std::string::size_type headerEnd = data.find("\r\n\r\n");
  if (headerEnd == std::string::npos) return false;
  size_t bodyLength = 0;
  const std::string headers = data.substr(0, headerEnd);
  for (const char* name : {"\r\nContent-Length:", "\r\ncontent-length:"}) {
    const std::string::size_type at = headers.find(name);
    if (at != std::string::npos) bodyLength = std::stoul(headers.substr(at + std::strlen(name)));
  }
  return data.size() >= headerEnd + 4 + bodyLength;
}

}  // namespace

class RawTcpServer::Impl {
 public:
  explicit Impl(const std::string& reply) : _reply(reply) {
    _listener = BindLoopback(_port);
    if (listen(_listener, 16) != 0 || pipe(_wake) != 0) throw std::runtime_error("cannot listen");
    _thread = std::thread([this] { Run(); });
  }

  ~Impl() {
    const char stop = 's';
    if (write(_wake[1], &stop, 1) != 1) std::terminate();
    _thread.join();
    close(_wake[0]);
    close(_wake[1]);
    close(_listener);
  }

  int GetPort() const { return _port; }
  int GetConnectionCount() const { return _connections; }

  std::string GetReceived() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _received;
  }

 private:
  void Run() {
    std::map<int, std::string> clients;  // what each open connection has sent
    for (;;) {
      std::vector<pollfd> fds{{_wake[0], POLLIN, 0}, {_listener, POLLIN, 0}};
      for (const auto& client : clients) fds.push_back({client.first, POLLIN, 0});
      if (poll(fds.data(), fds.size(), -1) < 0) continue;
      if (fds[0].revents != 0) break;
      if (fds[1].revents != 0) {
        const int client = accept4(_listener, nullptr, nullptr, SOCK_CLOEXEC);
        if (client >= 0) {
          clients[client];
          ++_connections;
        }
      }
      for (size_t i = 2; i < fds.size(); ++i) {
        if (fds[i].revents == 0) continue;
        const int client = fds[i].fd;
        char buffer[4096];
        const ssize_t count = recv(client, buffer, sizeof buffer, 0);
        if (count > 0) {
          clients[client].append(buffer, count);
          std::lock_guard<std::mutex> lock(_mutex);
          _received.append(buffer, count);
        }
        const bool answer = !_reply.empty() && IsCompleteRequest(clients[client]);
        if (answer && send(client, _reply.data(), _reply.size(), MSG_NOSIGNAL) < 0) {
          // The client went away; closing below is all there is to do.
        }
        if (count <= 0 || answer) {
          close(client);
          clients.erase(client);
        }
      }
    }
    for (const auto& client : clients) close(client.first);
  }

  const std::string _reply;
  int _listener = -1;
  int _port = 0;
  int _wake[2] = {-1, -1};
  std::atomic<int> _connections{0};
  mutable std::mutex _mutex;
  std::string _received;
  std::thread _thread;
};

RawTcpServer::RawTcpServer(const std::string& reply) : _impl(new Impl(reply)) {}
RawTcpServer::~RawTcpServer() = default;
int RawTcpServer::GetPort() const { return _impl->GetPort(); }
int RawTcpServer::GetConnectionCount() const { return _impl->GetConnectionCount(); }
std::string RawTcpServer::GetReceived() const { return _impl->GetReceived(); }

int UnusedLoopbackPort() {
  int port = 0;
  close(BindLoopback(port));
  return port;
}

}  // namespace TestSupport
