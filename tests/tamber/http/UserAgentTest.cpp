#include "tamber/http/UserAgent.h"

#include <cstdlib>
#include <mutex>
#include <regex>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "support/HttpsTestServer.h"
#include "tamber/Exception.h"
#include "tamber/crypto/TestKeys.h"
#include "tamber/http/HttpException.h"

namespace Tamber {
namespace Http {
namespace {

using TestSupport::CannedResponse;
using TestSupport::HttpsTestServer;
using TestSupport::RawTcpServer;
using TestSupport::RecordedRequest;

constexpr int64_t kPatience = 10 * 1000 * 1000;  // microseconds; only ever reached by a fault

Ref<Ssl::SSLContext> Context(const std::vector<std::string>& trusted = {"ca"}) {
  Ssl::SSLContextOptions options;
  for (const std::string& name : trusted) options.trustedCertificates.push_back(TestKeys::Certificate(name));
  Ref<Ssl::SSLContext> context;
  Ssl::CreateSSLContext(options, context);
  return context;
}

Ref<UserAgent> Agent(ConnectionSpec* spec) {
  Ref<CookieStore> store;
  CreateCookieStore("", store);
  Ref<UserAgent> agent;
  CreateHttpUserAgent(spec, store.get(), nullptr, agent);
  return agent;
}

Ref<ConnectionSpec> Tcp(int port, const std::string& host = "127.0.0.1") {
  Ref<ConnectionSpec> spec;
  CreateTCPConnectionSpec(host, port, false, spec);
  return spec;
}

Ref<ConnectionSpec> Tls(int port, Ssl::SSLContext* context, const std::string& pin = "",
                        const std::string& name = "127.0.0.1", const std::string& tcpHost = "127.0.0.1") {
  Ref<ConnectionSpec> spec;
  CreateSSLConnectionSpec(Tcp(port, tcpHost).get(), context, name, pin, spec);
  return spec;
}

Ref<UserAgent> HttpsAgent(int port, Ssl::SSLContext* context, const std::string& pin = "",
                          const std::string& name = "127.0.0.1") {
  return Agent(Tls(port, context, pin, name).get());
}

Ref<HttpRequest> Request(HttpMethod method = HTTP_POST, const std::string& body = "<request/>",
                         const std::string& path = "/sts") {
  Ref<HttpRequest> request;
  CreateHttpRequest(method, path, request);
  request->AddHeader("Content-Type", "text/xml");
  request->WriteBody(body);
  return request;
}

Ref<ClientResponse> Send(UserAgent* agent, HttpRequest* request, int64_t timeout = kPatience) {
  Ref<PendingRequestItem> item;
  agent->SendRequestAsync(request, CompletionFunctor(), item);
  Ref<ClientResponse> response;
  agent->GetResponse(item.get(), timeout, response);
  return response;
}

Ref<ClientResponse> Send(UserAgent* agent) { return Send(agent, Request().get()); }

std::string ReadAll(Reader* reader) {
  std::string text;
  char buffer[7];  // small, so that reads in pieces are exercised
  while (size_t count = reader->Read(buffer, sizeof buffer)) text.append(buffer, count);
  return text;
}

// The message of the HttpException (exactly that class) that sending raises.
std::string FailureOf(UserAgent* agent, int64_t timeout = kPatience) {
  try {
    Send(agent, Request().get(), timeout);
  } catch (const HttpTimeoutException& e) {
    return std::string("timeout: ") + e.what();
  } catch (const HttpException& e) {
    return e.what();
  }
  return "no HttpException";
}

std::string Origin(int port) { return "HTTPS request to 127.0.0.1:" + std::to_string(port); }

TEST(UserAgent, PostsTheRequestAsGivenAndReadsTheAnswer) {
  HttpsTestServer server;
  server.SetHandler([](const RecordedRequest&) {
    CannedResponse response;
    response.status = 201;
    response.body = "<answer>created</answer>";
    return response;
  });
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  Ref<HttpRequest> request = Request(HTTP_POST, "<request>\xc3\xa9</request>", "/sts/STSService?x=1");
  request->AddHeader("SOAPAction", "\"urn:action\"");

  Ref<ClientResponse> response = Send(agent.get(), request.get());

  EXPECT_EQ(201, response->GetStatusCode());
  EXPECT_EQ("Created", response->GetReasonPhrase());
  EXPECT_EQ("<answer>created</answer>", ReadAll(response.get()));
  EXPECT_EQ(0u, response->Read(nullptr, 0));
  ASSERT_EQ(1u, server.GetRequests().size());
  const RecordedRequest seen = server.GetRequests()[0];
  EXPECT_EQ("POST /sts/STSService?x=1 HTTP/1.1", seen.RequestLine());
  EXPECT_EQ("text/xml", seen.Header("Content-Type"));
  EXPECT_EQ("\"urn:action\"", seen.Header("SOAPAction"));
  EXPECT_EQ("127.0.0.1:" + std::to_string(server.GetPort()), seen.Header("Host"));
  EXPECT_EQ("<request>\xc3\xa9</request>", seen.body);
  EXPECT_EQ(std::to_string(seen.body.size()), seen.Header("Content-Length"));
  EXPECT_FALSE(seen.HasHeader("Expect"));
  EXPECT_FALSE(seen.HasHeader("Accept-Encoding"));
  EXPECT_FALSE(seen.HasHeader("Cookie"));
}

struct MethodRow {
  HttpMethod method;
  const char* name;
  const char* bodySeen;
  const char* bodyRead;
};

class UserAgentMethods : public testing::TestWithParam<MethodRow> {};

TEST_P(UserAgentMethods, SendsEachMethodOverOneConnection) {
  HttpsTestServer server;
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  // A POST first, so that the handle must shed the previous method and body.
  Send(agent.get());
  Ref<ClientResponse> response = Send(agent.get(), Request(GetParam().method, "payload").get());
  EXPECT_EQ(200, response->GetStatusCode());
  EXPECT_EQ(GetParam().bodyRead, ReadAll(response.get()));
  ASSERT_EQ(2u, server.GetRequests().size());
  const RecordedRequest seen = server.GetRequests()[1];
  EXPECT_EQ(std::string(GetParam().name) + " /sts HTTP/1.1", seen.RequestLine());
  EXPECT_EQ(GetParam().bodySeen, seen.body);
  EXPECT_EQ(server.GetRequests()[0].remotePort, seen.remotePort);
}

INSTANTIATE_TEST_SUITE_P(Methods, UserAgentMethods,
                         testing::Values(MethodRow{HTTP_GET, "GET", "", "<ok/>"},
                                         MethodRow{HTTP_HEAD, "HEAD", "", ""},
                                         MethodRow{HTTP_POST, "POST", "payload", "<ok/>"},
                                         MethodRow{HTTP_PUT, "PUT", "payload", "<ok/>"},
                                         MethodRow{HTTP_DELETE, "DELETE", "payload", "<ok/>"}));

TEST(UserAgent, KeepsItsCookiesAndItsConnectionToItself) {
  HttpsTestServer server;
  server.SetHandler([](const RecordedRequest& request) {
    CannedResponse response;
    if (!request.HasHeader("Cookie")) response.headers.push_back({"Set-Cookie", "session=abc123; Path=/; Secure"});
    return response;
  });
  Ref<Ssl::SSLContext> context = Context();
  Ref<ConnectionSpec> spec = Tls(server.GetPort(), context.get());
  Ref<UserAgent> first = Agent(spec.get());
  Send(first.get());
  Send(first.get());
  Ref<UserAgent> second = Agent(spec.get());
  Send(second.get());

  const std::vector<RecordedRequest> seen = server.GetRequests();
  ASSERT_EQ(3u, seen.size());
  EXPECT_FALSE(seen[0].HasHeader("Cookie"));
  EXPECT_EQ("session=abc123", seen[1].Header("Cookie"));
  EXPECT_EQ(seen[0].remotePort, seen[1].remotePort);
  EXPECT_FALSE(seen[2].HasHeader("Cookie"));
  EXPECT_NE(seen[0].remotePort, seen[2].remotePort);
}

TEST(UserAgent, RefusesACookieStoreInUseAndAConnectionPool) {
  Ref<ConnectionSpec> spec = Tcp(80);
  Ref<CookieStore> store;
  CreateCookieStore("session", store);
  EXPECT_EQ("session", store->GetName());
  Ref<UserAgent> agent;
  CreateHttpUserAgent(spec.get(), store.get(), nullptr, agent);
  Ref<UserAgent> other;
  try {
    CreateHttpUserAgent(spec.get(), store.get(), nullptr, other);
    FAIL() << "a store served two agents";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : The cookie store is in use by another user agent already", e.what());
  }
  Ref<CookieStore> fresh;
  CreateCookieStore("", fresh);
  try {
    CreateHttpUserAgent(spec.get(), fresh.get(), reinterpret_cast<ConnectionPool*>(fresh.get()), other);
    FAIL() << "a connection pool was accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : Connection pools are not supported: user agents keep their own connections",
                 e.what());
  }
  EXPECT_FALSE(other);
}

// TLS refusals: each happens in the handshake, so the server never sees a request.
struct TlsRefusal {
  const char* what;
  const char* serverCertificate;
  std::vector<std::string> trusted;
  const char* name;  // the host the client must be talking to
  const char* reason;
};

class UserAgentRefusesServer : public testing::TestWithParam<TlsRefusal> {};

TEST_P(UserAgentRefusesServer, BeforeSendingAnything) {
  const TlsRefusal& row = GetParam();
  SCOPED_TRACE(row.what);
  HttpsTestServer::Options options;
  options.certificate = row.serverCertificate;
  HttpsTestServer server(options);
  Ref<Ssl::SSLContext> context = Context(row.trusted);
  Ref<UserAgent> agent = Agent(Tls(server.GetPort(), context.get(), "", row.name).get());
  std::string origin = std::string("HTTPS request to ") + row.name + ":" + std::to_string(server.GetPort());
  if (std::string(row.name) != "127.0.0.1") origin += " (at 127.0.0.1:" + std::to_string(server.GetPort()) + ")";
  EXPECT_EQ(origin + " failed: the server certificate was refused: " + row.reason, FailureOf(agent.get()));
  EXPECT_TRUE(server.GetRequests().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Certificates, UserAgentRefusesServer,
    testing::Values(TlsRefusal{"self-signed", "untrusted", {"ca"}, "127.0.0.1", "self-signed certificate"},
                    TlsRefusal{"issuer not trusted", "tls-server", {"untrusted"}, "127.0.0.1",
                               "unable to get local issuer certificate"},
                    TlsRefusal{"IP address not in the certificate", "tls-other", {"ca"}, "127.0.0.1",
                               "IP address mismatch"},
                    TlsRefusal{"host name not in the certificate", "tls-server", {"ca"}, "other.example",
                               "hostname mismatch"}));

TEST(UserAgent, TrustsOnlyItsOwnContextsAnchorsWhateverOtherAgentsTrusted) {
  HttpsTestServer server;
  Ref<Ssl::SSLContext> trusting = Context({"ca"});
  EXPECT_EQ(200, Send(Agent(Tls(server.GetPort(), trusting.get(), "", "127.0.0.1").get()).get())->GetStatusCode());
  Ref<Ssl::SSLContext> other = Context({"untrusted"});
  Ref<UserAgent> agent = Agent(Tls(server.GetPort(), other.get(), "", "127.0.0.1").get());
  EXPECT_EQ("HTTPS request to 127.0.0.1:" + std::to_string(server.GetPort()) +
                " failed: the server certificate was refused: unable to get local issuer certificate",
            FailureOf(agent.get()));
  EXPECT_EQ(1u, server.GetRequests().size());
}

TEST(UserAgent, AcceptsTheNameTheCertificateProvesOverAnotherTcpHost) {
  HttpsTestServer::Options options;
  options.certificate = "tls-other";
  HttpsTestServer server(options);
  Ref<Ssl::SSLContext> context = Context();
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), context.get(), "", "other.example");
  EXPECT_EQ(200, Send(agent.get())->GetStatusCode());
  ASSERT_EQ(1u, server.GetRequests().size());
  EXPECT_EQ("other.example:" + std::to_string(server.GetPort()), server.GetRequests()[0].Header("Host"));
}

TEST(UserAgent, SpeaksToIpv6Loopback) {
  HttpsTestServer::Options options;
  options.address = "::1";
  HttpsTestServer server(options);
  Ref<Ssl::SSLContext> context = Context();
  Ref<UserAgent> agent = Agent(Tls(server.GetPort(), context.get(), "", "::1", "::1").get());
  EXPECT_EQ(200, Send(agent.get())->GetStatusCode());
  ASSERT_EQ(1u, server.GetRequests().size());
  EXPECT_EQ("[::1]:" + std::to_string(server.GetPort()), server.GetRequests()[0].Header("Host"));
}

std::string WithColons(const std::string& hex) {
  std::string text;
  for (size_t i = 0; i < hex.size(); i += 2) text += (i == 0 ? "" : ":") + hex.substr(i, 2);
  return text;
}

std::string UpperWithColons(const std::string& hex) {
  std::string text = WithColons(hex);
  for (char& c : text) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  return text;
}

TEST(UserAgent, APinAloneDecides) {
  // Neither certificate chains to the context's anchor nor names 127.0.0.1: only the pin lets
  // them through.
  for (const char* certificate : {"untrusted", "tls-other"}) {
    SCOPED_TRACE(certificate);
    HttpsTestServer::Options options;
    options.certificate = certificate;
    HttpsTestServer server(options);
    Ref<Ssl::SSLContext> context = Context({"sts"});
    const std::string thumbprint = TestKeys::Certificate(certificate)->GetSha256Thumbprint();
    for (const std::string& pin : {thumbprint, UpperWithColons(thumbprint)}) {
      Ref<UserAgent> agent = HttpsAgent(server.GetPort(), context.get(), pin);
      EXPECT_EQ(200, Send(agent.get())->GetStatusCode());
    }
    EXPECT_EQ(2u, server.GetRequests().size());
  }
}

TEST(UserAgent, RefusesAServerWithAnotherThumbprintThanThePin) {
  // The server is fully trusted, yet not the pinned one.
  HttpsTestServer server;
  Ref<Ssl::SSLContext> context = Context();
  const std::string pinned = TestKeys::Certificate("tls-other")->GetSha256Thumbprint();
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), context.get(), pinned);
  EXPECT_EQ(Origin(server.GetPort()) + " failed: the server certificate's SHA-256 thumbprint " +
                WithColons(TestKeys::Certificate("tls-server")->GetSha256Thumbprint()) +
                " does not match the pinned thumbprint " + WithColons(pinned),
            FailureOf(agent.get()));
  EXPECT_TRUE(server.GetRequests().empty());
}

TEST(UserAgent, PresentsTheClientCertificateForMutualTls) {
  HttpsTestServer::Options options;
  options.requireClientCertificate = true;
  HttpsTestServer server(options);

  Ssl::SSLContextOptions withIdentity;
  withIdentity.trustedCertificates.push_back(TestKeys::Certificate("ca"));
  withIdentity.clientCertificate = TestKeys::Certificate("client");
  withIdentity.clientKey = TestKeys::PrivateKey("client");
  Ref<Ssl::SSLContext> context;
  Ssl::CreateSSLContext(withIdentity, context);
  EXPECT_EQ(200, Send(HttpsAgent(server.GetPort(), context.get()).get())->GetStatusCode());

  const std::string failure = FailureOf(HttpsAgent(server.GetPort(), Context().get()).get());
  EXPECT_EQ(0u, failure.find(Origin(server.GetPort()) + " failed: ")) << failure;
  EXPECT_EQ(1u, server.GetRequests().size());
}

TEST(UserAgent, TrustsAnyServerOnlyWhenVerificationIsTurnedOff) {
  HttpsTestServer::Options options;
  options.certificate = "untrusted";
  HttpsTestServer server(options);
  Ssl::SSLContextOptions unverified;
  unverified.verifyPeer = false;
  unverified.verifyHostName = false;
  Ref<Ssl::SSLContext> context;
  Ssl::CreateSSLContext(unverified, context);
  EXPECT_EQ(200, Send(HttpsAgent(server.GetPort(), context.get()).get())->GetStatusCode());
}

TEST(UserAgent, DoesNotFollowRedirects) {
  HttpsTestServer server;
  server.SetHandler([&server](const RecordedRequest&) {
    CannedResponse response;
    response.status = 302;
    response.headers.push_back({"Location", server.GetUrl("/elsewhere")});
    return response;
  });
  Ref<ClientResponse> response = Send(HttpsAgent(server.GetPort(), Context().get()).get());
  EXPECT_EQ(302, response->GetStatusCode());
  EXPECT_EQ("Found", response->GetReasonPhrase());
  EXPECT_EQ(1u, server.GetRequests().size());
}

// Sets environment variables for the life of the object.
class ScopedEnvironment {
 public:
  explicit ScopedEnvironment(const std::vector<std::pair<std::string, std::string>>& variables) {
    for (const auto& variable : variables) {
      setenv(variable.first.c_str(), variable.second.c_str(), 1);
      _names.push_back(variable.first);
    }
  }
  ~ScopedEnvironment() {
    for (const std::string& name : _names) unsetenv(name.c_str());
  }

 private:
  std::vector<std::string> _names;
};

TEST(UserAgent, IgnoresProxySettingsOfTheEnvironment) {
  HttpsTestServer server;
  RawTcpServer proxy("HTTP/1.1 200 Connection established\r\n\r\n");
  const std::string proxyUrl = "http://127.0.0.1:" + std::to_string(proxy.GetPort());
  ScopedEnvironment environment({{"https_proxy", proxyUrl},
                                 {"HTTPS_PROXY", proxyUrl},
                                 {"http_proxy", proxyUrl},
                                 {"ALL_PROXY", proxyUrl},
                                 {"all_proxy", proxyUrl},
                                 {"NO_PROXY", "nothing.example"}});
  EXPECT_EQ(200, Send(HttpsAgent(server.GetPort(), Context().get()).get())->GetStatusCode());
  EXPECT_EQ(0, proxy.GetConnectionCount());
  EXPECT_EQ(1u, server.GetRequests().size());
}

TEST(UserAgent, ReportsARefusedConnectionWithHostPortAndReason) {
  const int port = TestSupport::UnusedLoopbackPort();
  const std::string failure = FailureOf(HttpsAgent(port, Context().get()).get());
  const std::string origin = Origin(port);
  EXPECT_TRUE(std::regex_match(failure, std::regex(origin + " failed: Failed to connect to 127\\.0\\.0\\.1 port " +
                                                   std::to_string(port) + " after [0-9]+ ms: .*")))
      << failure;
}

TEST(UserAgent, GivesUpOnASilentServerAfterTheTimeoutAndCancelsTheRequest) {
  RawTcpServer silent;
  Ref<UserAgent> agent = HttpsAgent(silent.GetPort(), Context().get());
  Ref<PendingRequestItem> item;
  std::mutex mutex;
  std::vector<std::string> outcomes;
  agent->SendRequestAsync(Request().get(),
                          [&](const Exception* error, ClientResponse* response, PendingRequestItem*) {
                            std::lock_guard<std::mutex> lock(mutex);
                            outcomes.push_back(error != nullptr && response == nullptr ? error->what() : "bad");
                          },
                          item);
  Ref<ClientResponse> response;
  try {
    agent->GetResponse(item.get(), 200 * 1000, response);
    FAIL() << "a silent server answered";
  } catch (const HttpTimeoutException& e) {
    EXPECT_EQ("No response to the " + Origin(silent.GetPort()) + " within 200 ms", std::string(e.what()));
  }
  EXPECT_TRUE(item->Wait(kPatience));
  EXPECT_TRUE(item->IsDone());
  std::lock_guard<std::mutex> lock(mutex);
  EXPECT_EQ(std::vector<std::string>{Origin(silent.GetPort()) + " was cancelled"}, outcomes);
  EXPECT_FALSE(response);
}

class UserAgentSizeLimit : public testing::TestWithParam<bool> {};

TEST_P(UserAgentSizeLimit, RefusesAnswersOver16MiB) {
  const bool chunked = GetParam();
  const size_t limit = 16 * 1024 * 1024;
  HttpsTestServer server;
  server.SetHandler([&](const RecordedRequest& request) {
    CannedResponse response;
    const size_t size = request.body == "over" ? limit + 1 : limit;
    if (chunked) {
      response.chunkedBodySize = size;
    } else {
      response.body.assign(size, 'x');
    }
    return response;
  });
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  Ref<ClientResponse> atLimit = Send(agent.get(), Request(HTTP_POST, "at").get());
  EXPECT_EQ(limit, ReadAll(atLimit.get()).size());
  try {
    Send(agent.get(), Request(HTTP_POST, "over").get());
    FAIL() << "an answer over the limit was accepted";
  } catch (const HttpException& e) {
    EXPECT_EQ(Origin(server.GetPort()) + " failed: the response is larger than the limit of 16777216 bytes",
              std::string(e.what()));
  }
}

INSTANTIATE_TEST_SUITE_P(Framing, UserAgentSizeLimit, testing::Values(false, true),
                         [](const testing::TestParamInfo<bool>& info) {
                           return info.param ? "Chunked" : "ContentLength";
                         });

TEST(UserAgent, ReadsTheReasonPhraseAsSentEvenWhenItIsOdd) {
  const std::string reply = "HTTP/1.1 404 Not\x01 Here \xff\r\nContent-Length: 2\r\n\r\nno";
  RawTcpServer server(reply);
  Ref<UserAgent> agent = Agent(Tcp(server.GetPort()).get());
  Ref<ClientResponse> response = Send(agent.get());
  EXPECT_EQ(404, response->GetStatusCode());
  EXPECT_EQ("Not? Here ?", response->GetReasonPhrase());
  EXPECT_EQ("no", ReadAll(response.get()));
}

// Asynchronous sending.

struct CompletionLog {
  std::mutex mutex;
  int calls = 0;
  int withError = 0;
  int withResponse = 0;
  int withBoth = 0;
  std::thread::id thread;
  std::vector<std::string> bodies;

  CompletionFunctor Functor() {
    return [this](const Exception* error, ClientResponse* response, PendingRequestItem* item) {
      std::lock_guard<std::mutex> lock(mutex);
      ++calls;
      withError += error != nullptr && response == nullptr;
      withResponse += response != nullptr && error == nullptr;
      withBoth += error != nullptr && response != nullptr;
      thread = std::this_thread::get_id();
      if (response != nullptr) bodies.push_back(item->GetRequest()->GetPath() + ":" + ReadAll(response));
    };
  }
};

TEST(UserAgentAsync, ReturnsAtOnceAndCompletesEachRequestOnceInOrderOnTheWorker) {
  HttpsTestServer server;
  server.SetHandler([](const RecordedRequest& request) {
    CannedResponse response;
    response.body = request.body;
    return response;
  });
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  CompletionLog log;
  std::vector<Ref<PendingRequestItem>> items(3);
  for (size_t i = 0; i < items.size(); ++i) {
    agent->SendRequestAsync(Request(HTTP_POST, "body" + std::to_string(i), "/r" + std::to_string(i)).get(),
                            log.Functor(), items[i]);
  }
  for (const Ref<PendingRequestItem>& item : items) ASSERT_TRUE(item->Wait(kPatience));

  std::lock_guard<std::mutex> lock(log.mutex);
  EXPECT_EQ(3, log.calls);
  EXPECT_EQ(3, log.withResponse);
  EXPECT_EQ(0, log.withBoth);
  EXPECT_NE(std::this_thread::get_id(), log.thread);
  EXPECT_EQ((std::vector<std::string>{"/r0:body0", "/r1:body1", "/r2:body2"}), log.bodies);
  const std::vector<RecordedRequest> seen = server.GetRequests();
  ASSERT_EQ(3u, seen.size());
  EXPECT_EQ("/r0", seen[0].target);
  EXPECT_EQ("/r2", seen[2].target);
}

TEST(UserAgentAsync, CompletesAFailedRequestOnceWithTheFailureAlone) {
  CompletionLog log;
  Ref<UserAgent> agent = HttpsAgent(TestSupport::UnusedLoopbackPort(), Context().get());
  Ref<PendingRequestItem> item;
  agent->SendRequestAsync(Request().get(), log.Functor(), item);
  ASSERT_TRUE(item->Wait(kPatience));
  std::lock_guard<std::mutex> lock(log.mutex);
  EXPECT_EQ(1, log.calls);
  EXPECT_EQ(1, log.withError);
}

TEST(UserAgentAsync, CancelsARequestWaitingBehindAnother) {
  RawTcpServer silent;
  Ref<UserAgent> agent = HttpsAgent(silent.GetPort(), Context().get());
  CompletionLog log;
  Ref<PendingRequestItem> first;
  Ref<PendingRequestItem> second;
  agent->SendRequestAsync(Request().get(), log.Functor(), first);
  agent->SendRequestAsync(Request().get(), log.Functor(), second);
  second->Cancel();
  ASSERT_TRUE(second->Wait(kPatience));
  EXPECT_FALSE(first->IsDone());
  Ref<ClientResponse> response;
  try {
    agent->GetResponse(second.get(), 0, response);
    FAIL() << "a cancelled request answered";
  } catch (const HttpException& e) {
    EXPECT_EQ(Origin(silent.GetPort()) + " was cancelled", std::string(e.what()));
  }
  first->Cancel();
  ASSERT_TRUE(first->Wait(kPatience));
  std::lock_guard<std::mutex> lock(log.mutex);
  EXPECT_EQ(2, log.calls);
  EXPECT_EQ(2, log.withError);
  first->Cancel();  // done already: nothing happens
}

TEST(UserAgentAsync, ACompletionCannotWaitForAResponse) {
  HttpsTestServer server;
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  std::string refusal;
  Ref<PendingRequestItem> item;
  agent->SendRequestAsync(Request().get(),
                          [&](const Exception*, ClientResponse*, PendingRequestItem* self) {
                            Ref<ClientResponse> response;
                            try {
                              agent->GetResponse(self, kPatience, response);
                            } catch (const InvalidStateException& e) {
                              refusal = e.what();
                            }
                          },
                          item);
  ASSERT_TRUE(item->Wait(kPatience));
  EXPECT_EQ("A completion of an HTTP request cannot wait for a response: the wait would never end", refusal);
}

TEST(UserAgentAsync, AThrowingCompletionIsContained) {
  HttpsTestServer server;
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  Ref<PendingRequestItem> item;
  agent->SendRequestAsync(Request().get(), [](const Exception*, ClientResponse*, PendingRequestItem*) {
    throw std::runtime_error("completion failed");
  }, item);
  Ref<ClientResponse> response;
  agent->GetResponse(item.get(), kPatience, response);
  EXPECT_EQ(200, response->GetStatusCode());
}

TEST(UserAgent, GetResponseRefusesForeignItemsAndNegativeTimeouts) {
  HttpsTestServer server;
  Ref<Ssl::SSLContext> context = Context();
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), context.get());
  Ref<UserAgent> other = HttpsAgent(server.GetPort(), context.get());
  Ref<PendingRequestItem> item;
  agent->SendRequestAsync(Request().get(), CompletionFunctor(), item);
  Ref<ClientResponse> response;
  try {
    other->GetResponse(item.get(), kPatience, response);
    FAIL() << "another agent's item was accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : The pending request does not belong to this user agent", e.what());
  }
  try {
    agent->GetResponse(item.get(), -1, response);
    FAIL() << "a negative timeout was accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : The time to wait must not be negative; found -1", e.what());
  }
  agent->GetResponse(item.get(), kPatience, response);
  EXPECT_EQ(200, response->GetStatusCode());
}

TEST(UserAgent, SendsARequestOnceAndFreezesIt) {
  HttpsTestServer server;
  Ref<UserAgent> agent = HttpsAgent(server.GetPort(), Context().get());
  Ref<HttpRequest> request = Request();
  Send(agent.get(), request.get());
  Ref<PendingRequestItem> item;
  try {
    agent->SendRequestAsync(request.get(), CompletionFunctor(), item);
    FAIL() << "a request was sent twice";
  } catch (const InvalidStateException& e) {
    EXPECT_STREQ("The HTTP request has been sent already", e.what());
  }
  EXPECT_THROW(request->AddHeader("X", "y"), InvalidStateException);
  EXPECT_THROW(request->WriteBody("more"), InvalidStateException);
  EXPECT_FALSE(item);
}

}  // namespace
}  // namespace Http
}  // namespace Tamber
