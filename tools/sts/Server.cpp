#include <chrono>
#include <stdexcept>
#include <thread>

#include <httplib.h>

#include "DevSts.h"
#include "KeyDirectory.h"
#include "TokenService.h"

namespace DevSts {

namespace {

const char SERVICE_PATH[] = "/sts/STSService";
// Requests are a few kilobytes; anything far larger is not one.
const size_t MAX_REQUEST_BYTES = 1 << 20;
const size_t WORKER_THREADS = 16;

}  // namespace

struct Server::Impl {
  explicit Impl(const Config& config)
      : config(config),
        service(config),
        server(KeyPath(config.keyDirectory, TLS_CERTIFICATE_FILE).c_str(),
               KeyPath(config.keyDirectory, TLS_KEY_FILE).c_str()) {
    if (!server.is_valid()) {
      throw std::runtime_error("Cannot serve TLS with " + KeyPath(config.keyDirectory, TLS_CERTIFICATE_FILE) + " and " +
                               KeyPath(config.keyDirectory, TLS_KEY_FILE));
    }
    server.new_task_queue = [] { return new httplib::ThreadPool(WORKER_THREADS); };
    server.set_payload_max_length(MAX_REQUEST_BYTES);
    // Each open connection holds a worker: let idle ones go soon.
    server.set_keep_alive_timeout(1);
    server.Post(SERVICE_PATH, [this](const httplib::Request& request, httplib::Response& response) {
      const TokenService::Answer answer =
          service.Handle(request.get_header_value("SOAPAction"), request.body, request.get_header_value("Cookie"));
      response.status = answer.status;
      if (!answer.setCookie.empty()) response.set_header("Set-Cookie", answer.setCookie);
      response.set_content(answer.body, "text/xml; charset=utf-8");
    });
  }

  Config config;
  TokenService service;
  httplib::SSLServer server;
  std::thread thread;
  int port = 0;
};

Server::Server(const Config& config) : _impl(new Impl(config)) {}

Server::~Server() { Stop(); }

void Server::Start() {
  if (_impl->thread.joinable()) return;
  const Config& config = _impl->config;
  if (config.port == 0) {
    _impl->port = _impl->server.bind_to_any_port(config.address);
  } else {
    _impl->port = _impl->server.bind_to_port(config.address, config.port) ? config.port : -1;
  }
  if (_impl->port <= 0) {
    throw std::runtime_error("Cannot listen on " + config.address + " port " + std::to_string(config.port));
  }
  _impl->thread = std::thread([this] { _impl->server.listen_after_bind(); });
  // The listening socket is bound already; this waits only for the accept loop, which stop() needs.
  while (!_impl->server.is_running()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

void Server::Stop() {
  if (!_impl->thread.joinable()) return;
  _impl->server.stop();
  _impl->thread.join();
}

int Server::GetPort() const { return _impl->port; }

std::string Server::GetUrl() const {
  const std::string& address = _impl->config.address;
  const std::string host = address.find(':') == std::string::npos ? address : "[" + address + "]";
  return "https://" + host + ":" + std::to_string(_impl->port) + SERVICE_PATH;
}

}  // namespace DevSts
