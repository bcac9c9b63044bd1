#include "SoapDumpRelay.h"

#include <httplib.h>

#include <chrono>
#include <mutex>
#include <stdexcept>
#include <thread>

#include "SoapRedaction.h"
#include "tamber/Exception.h"
#include "tamber/http/ConnectionSpec.h"
#include "tamber/http/CookieStore.h"
#include "tamber/http/HttpRequest.h"
#include "tamber/http/Url.h"
#include "tamber/http/UserAgent.h"

namespace Cli {
namespace {

// A 502 answer makes the library report a communication failure; the dump names the cause.
const int BAD_GATEWAY = 502;

std::string ReadAll(Tamber::Reader& reader) {
  std::string text;
  char buffer[16384];
  for (size_t count; (count = reader.Read(buffer, sizeof buffer)) > 0;) text.append(buffer, count);
  return text;
}

}  // namespace

struct SoapDumpRelay::Impl {
  std::string stsUrl;
  std::string path;
  int64_t timeoutMicros;
  std::ostream& dump;
  std::mutex dumpMutex;
  // One agent, hence one cookie store: the legs of a negotiation stay one conversation.
  Tamber::Ref<Tamber::Http::UserAgent> agent;
  httplib::Server server;
  int port = 0;
  std::thread thread;

  Impl(const std::string& url, Tamber::Ssl::SSLContext* sslContext, const std::string& pin, int64_t timeout,
       std::ostream& out)
      : stsUrl(url), timeoutMicros(timeout), dump(out) {
    bool isSecure = false;
    std::string host;
    int stsPort = 0;
    Tamber::Http::ParseHttpURL(url, isSecure, host, stsPort, path);
    Tamber::Ref<Tamber::Http::ConnectionSpec> spec;
    Tamber::Http::CreateTCPConnectionSpec(host, stsPort, false, spec);
    if (isSecure) {
      Tamber::Ref<Tamber::Http::ConnectionSpec> tcpSpec = spec;
      Tamber::Http::CreateSSLConnectionSpec(tcpSpec.get(), sslContext, host, pin, spec);
    }
    Tamber::Ref<Tamber::Http::CookieStore> cookies;
    Tamber::Http::CreateCookieStore("", cookies);
    Tamber::Http::CreateHttpUserAgent(spec.get(), cookies.get(), nullptr, agent);

    server.Post(".*",
                [this](const httplib::Request& request, httplib::Response& response) { Forward(request, response); });
    port = server.bind_to_any_port("127.0.0.1");
    if (port <= 0) throw std::runtime_error("the SOAP dump relay cannot listen on 127.0.0.1");
    // Connections wait in the listen queue until the thread accepts them.
    thread = std::thread([this] { server.listen_after_bind(); });
    // stop() is lost on a server that is not running yet, so the destructor could wait forever.
    while (!server.is_running()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }

  ~Impl() {
    server.stop();
    thread.join();
  }

  void Dump(const std::string& heading, const std::string& body) {
    std::lock_guard<std::mutex> lock(dumpMutex);
    dump << heading << "\n" << RedactSoap(body) << "\n" << std::flush;
  }

  void Forward(const httplib::Request& request, httplib::Response& response) {
    const std::string action = request.get_header_value("SOAPAction");
    Dump("=== request to " + stsUrl + " (SOAPAction: " + action + ")", request.body);
    try {
      Tamber::Ref<Tamber::Http::HttpRequest> forward;
      Tamber::Http::CreateHttpRequest(Tamber::Http::HTTP_POST, path, forward);
      forward->AddHeader("Content-Type", "text/xml");
      forward->AddHeader("SOAPAction", action);
      forward->WriteBody(request.body);
      Tamber::Ref<Tamber::Http::PendingRequestItem> pending;
      agent->SendRequestAsync(
          forward.get(),
          [](const Tamber::Exception*, Tamber::Http::ClientResponse*, Tamber::Http::PendingRequestItem*) {}, pending);
      Tamber::Ref<Tamber::Http::ClientResponse> answer;
      agent->GetResponse(pending.get(), timeoutMicros, answer);
      const std::string body = ReadAll(*answer);
      Dump("=== answer " + std::to_string(answer->GetStatusCode()) + " " + answer->GetReasonPhrase(), body);
      response.status = answer->GetStatusCode();
      response.set_content(body, "text/xml");
    } catch (const Tamber::Exception& e) {
      Dump("=== no answer: " + std::string(e.what()), "");
      response.status = BAD_GATEWAY;
    }
  }
};

SoapDumpRelay::SoapDumpRelay(const std::string& stsUrl, Tamber::Ssl::SSLContext* sslContext, const std::string& pin,
                             int64_t timeoutMicros, std::ostream& dump)
    : _impl(new Impl(stsUrl, sslContext, pin, timeoutMicros, dump)) {}

SoapDumpRelay::~SoapDumpRelay() = default;

std::string SoapDumpRelay::GetUrl() const { return "http://127.0.0.1:" + std::to_string(_impl->port) + _impl->path; }

}  // namespace Cli
