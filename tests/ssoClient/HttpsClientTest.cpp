#include "ssoClient/HttpsClient.h"

#include <algorithm>
#include <mutex>
#include <string>
#include <vector>

#include <boost/function.hpp>
#include <boost/make_shared.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "support/HttpsTestServer.h"
#include "tamber/crypto/TestKeys.h"
#include "tamber/http/ClientResponseImpl.h"
#include "tamber/http/HttpException.h"

namespace SsoClient {
namespace {

using Tamber::Ref;
using TestSupport::CannedResponse;
using TestSupport::HttpsTestServer;
using TestSupport::RawTcpServer;
using TestSupport::RecordedRequest;

constexpr long long kTimeout = 10 * 1000 * 1000;  // microseconds; only ever reached by a fault

Ref<Tamber::Ssl::SSLContext> TrustingTestCa() {
  Tamber::Ssl::SSLContextOptions options;
  options.trustedCertificates.push_back(TestKeys::Certificate("ca"));
  Ref<Tamber::Ssl::SSLContext> context;
  Tamber::Ssl::CreateSSLContext(options, context);
  return context;
}

Request IssueRequest(const std::string& body = "<soapenv:Envelope/>") {
  Request request;
  request.soapAction = Request::ISSUE;
  request.body = body;
  return request;
}

std::string ReadAll(Tamber::Reader* reader) {
  std::string text;
  char buffer[4096];
  while (size_t count = reader->Read(buffer, sizeof buffer)) text.append(buffer, count);
  return text;
}

std::string Send(TransportSession& session, const Request& request = IssueRequest()) {
  Ref<Tamber::Reader> response;
  session.SendRequest(request, response);
  return ReadAll(response.get());
}

std::string SendToClient(const HttpsClient& client) { return Send(*client.CreateSession()); }

// The message of the CommunicationException that sending raises.
std::string CommunicationFailure(const HttpsClient& client, const Request& request = IssueRequest()) {
  try {
    Send(*client.CreateSession(), request);
  } catch (const CommunicationException& e) {
    return e.what();
  }
  return "no CommunicationException";
}

std::string Origin(int port) { return "HTTPS request to 127.0.0.1:" + std::to_string(port); }

struct StatusRow {
  int status;
  const char* outcome;  // the body read, or the failure's message
};

class HttpsClientStatus : public testing::TestWithParam<StatusRow> {};

TEST_P(HttpsClientStatus, LetsThrough2xxAnd500AndRefusesTheRest) {
  HttpsTestServer server;
  const int status = GetParam().status;
  server.SetHandler([status](const RecordedRequest&) {
    CannedResponse response;
    response.status = status;
    response.body = "<answer>" + std::to_string(status) + "</answer>";
    return response;
  });
  HttpsClient client(server.GetUrl(), TrustingTestCa().get(), "", kTimeout);
  boost::shared_ptr<TransportSession> session = client.CreateSession();
  Ref<Tamber::Reader> response;
  try {
    session->SendRequest(IssueRequest(), response);
    EXPECT_EQ(GetParam().outcome, ReadAll(response.get()));
  } catch (const CommunicationException& e) {
    EXPECT_EQ(GetParam().outcome, std::string(e.what()));
    EXPECT_FALSE(response);
  }
  EXPECT_EQ(1u, server.GetRequests().size());
}

INSTANTIATE_TEST_SUITE_P(
    Statuses, HttpsClientStatus,
    testing::Values(StatusRow{200, "<answer>200</answer>"}, StatusRow{201, "<answer>201</answer>"},
                    StatusRow{299, "<answer>299</answer>"}, StatusRow{500, "<answer>500</answer>"},
                    StatusRow{300, "Server returned error: 300 Multiple Choice"},
                    StatusRow{302, "Server returned error: 302 Found"},
                    StatusRow{401, "Server returned error: 401 Unauthorized"},
                    StatusRow{404, "Server returned error: 404 Not Found"},
                    StatusRow{503, "Server returned error: 503 Service Unavailable"}),
    [](const testing::TestParamInfo<StatusRow>& info) { return std::to_string(info.param.status); });

TEST(HttpsClient, RefusesAnInformationalStatusAsFinalAnswer) {
  // No HTTP server library sends a 1xx status as the final answer; a raw one does. An interim
  // answer must be followed by a final one, so what follows it is no valid answer at all.
  RawTcpServer server("HTTP/1.1 199 Odd\r\nContent-Length: 5\r\n\r\n<ok/>");
  HttpsClient client("http://127.0.0.1:" + std::to_string(server.GetPort()) + "/sts", nullptr, "", kTimeout);
  EXPECT_EQ("HTTP request to 127.0.0.1:" + std::to_string(server.GetPort()) +
                " failed: Received HTTP/0.9 when not allowed",
            CommunicationFailure(client));
}

TEST(HttpsClient, PostsTheEnvelopeWithContentTypeAndQuotedSoapAction) {
  RawTcpServer server("HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\n<ok/>");
  const std::string host = "127.0.0.1:" + std::to_string(server.GetPort());
  HttpsClient client("http://" + host + "/sts/STSService?tenant=t", nullptr, "", kTimeout);
  const std::string envelope = "<soapenv:Envelope>\xc3\xa9 \"quoted\"</soapenv:Envelope>";
  EXPECT_EQ("<ok/>", Send(*client.CreateSession(), IssueRequest(envelope)));
  EXPECT_EQ("POST /sts/STSService?tenant=t HTTP/1.1\r\n"
            "Host: " + host + "\r\n"
            "Accept: */*\r\n"
            "Content-Type: text/xml\r\n"
            "SOAPAction: \"http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue\"\r\n"
            "Content-Length: " + std::to_string(envelope.size()) + "\r\n"
            "\r\n" + envelope,
            server.GetReceived());
}

TEST(HttpsClient, RefusesASoapActionThatWouldSplitTheHeader) {
  HttpsTestServer server;
  HttpsClient client(server.GetUrl(), TrustingTestCa().get(), "", kTimeout);
  Request request = IssueRequest();
  request.soapAction += "\r\nX-Injected: yes";
  Ref<Tamber::Reader> response;
  EXPECT_THROW(client.CreateSession()->SendRequest(request, response), Tamber::InvalidArgumentException);
  EXPECT_TRUE(server.GetRequests().empty());
}

TEST(HttpsClient, SharesCookiesWithinASessionOnly) {
  HttpsTestServer server;
  server.SetHandler([](const RecordedRequest& request) {
    CannedResponse response;
    if (!request.HasHeader("Cookie")) response.headers.push_back({"Set-Cookie", "STSID=leg1; Path=/"});
    return response;
  });
  HttpsClient client(server.GetUrl(), TrustingTestCa().get(), "", kTimeout);
  boost::shared_ptr<TransportSession> negotiation = client.CreateSession();
  Send(*negotiation);
  Send(*negotiation);
  Send(*client.CreateSession());
  const std::vector<RecordedRequest> seen = server.GetRequests();
  ASSERT_EQ(3u, seen.size());
  EXPECT_FALSE(seen[0].HasHeader("Cookie"));
  EXPECT_EQ("STSID=leg1", seen[1].Header("Cookie"));
  EXPECT_FALSE(seen[2].HasHeader("Cookie"));
}

TEST(HttpsClient, RefusesHttpsWithoutSslContextBeforeAnyTraffic) {
  RawTcpServer server;
  try {
    HttpsClient client("https://127.0.0.1:" + std::to_string(server.GetPort()) + "/sts", nullptr, "", kTimeout);
    FAIL() << "constructed";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : HTTPS connection requested but no SSLContext provided.", e.what());
  }
  EXPECT_EQ(0, server.GetConnectionCount());
}

TEST(HttpsClient, AcceptsPlainHttpWithOrWithoutSslContext) {
  HttpsTestServer::Options options;
  options.plainHttp = true;
  HttpsTestServer server(options);
  EXPECT_EQ("<ok/>", SendToClient(HttpsClient(server.GetUrl(), nullptr, "", kTimeout)));
  EXPECT_EQ("<ok/>", SendToClient(HttpsClient(server.GetUrl(), TrustingTestCa().get(), "", kTimeout)));
}

TEST(HttpsClient, PassesUrlErrorsOn) {
  try {
    HttpsClient client("ftp://sts.example.com/sts", TrustingTestCa().get(), "", kTimeout);
    FAIL() << "constructed";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : Invalid URL: unsupported scheme \"ftp\" (expected http or https)", e.what());
  }
}

TEST(HttpsClient, RefusesAnUntrustedOrMisnamedServerWithoutSendingTheRequest) {
  for (const char* certificate : {"untrusted", "tls-other"}) {
    SCOPED_TRACE(certificate);
    HttpsTestServer::Options options;
    options.certificate = certificate;
    HttpsTestServer server(options);
    HttpsClient client(server.GetUrl(), TrustingTestCa().get(), "", kTimeout);
    const std::string reason = std::string(certificate) == "untrusted" ? "self-signed certificate" : "IP address mismatch";
    EXPECT_EQ(Origin(server.GetPort()) + " failed: the server certificate was refused: " + reason,
              CommunicationFailure(client));
    EXPECT_TRUE(server.GetRequests().empty());
  }
}

TEST(HttpsClient, TalksToThePinnedServerOnly) {
  HttpsTestServer::Options options;
  options.certificate = "untrusted";  // a self-signed development STS
  HttpsTestServer server(options);
  const std::string pin = TestKeys::Certificate("untrusted")->GetSha256Thumbprint();
  EXPECT_EQ("<ok/>", SendToClient(HttpsClient(server.GetUrl(), TrustingTestCa().get(), pin, kTimeout)));
  EXPECT_EQ(1u, server.GetRequests().size());

  const std::string otherPin = TestKeys::Certificate("tls-server")->GetSha256Thumbprint();
  HttpsClient wrong(server.GetUrl(), TrustingTestCa().get(), otherPin, kTimeout);
  const std::string failure = CommunicationFailure(wrong);
  EXPECT_EQ(0u, failure.find(Origin(server.GetPort()) + " failed: the server certificate's SHA-256 thumbprint "))
      << failure;
  EXPECT_EQ(1u, server.GetRequests().size());
}

TEST(HttpsClient, RefusesAMalformedPinAtConstruction) {
  EXPECT_THROW(HttpsClient("https://127.0.0.1/sts", TrustingTestCa().get(), "not a thumbprint", kTimeout),
               Tamber::InvalidArgumentException);
}

TEST(HttpsClient, ReportsARefusedConnection) {
  const int port = TestSupport::UnusedLoopbackPort();
  HttpsClient client("https://127.0.0.1:" + std::to_string(port) + "/sts", TrustingTestCa().get(), "", kTimeout);
  const std::string failure = CommunicationFailure(client);
  EXPECT_EQ(0u, failure.find(Origin(port) + " failed: Failed to connect to 127.0.0.1 port " + std::to_string(port)))
      << failure;
}

TEST(HttpsClient, BoundsTheWaitForASilentServerByTheTimeout) {
  RawTcpServer silent;
  HttpsClient client("https://127.0.0.1:" + std::to_string(silent.GetPort()) + "/sts", TrustingTestCa().get(), "",
                     250 * 1000);
  EXPECT_EQ("No response to the " + Origin(silent.GetPort()) + " within 250 ms", CommunicationFailure(client));
}

TEST(HttpsClient, RefusesAnOversizedAnswer) {
  HttpsTestServer server;
  server.SetHandler([](const RecordedRequest&) {
    CannedResponse response;
    response.chunkedBodySize = 16 * 1024 * 1024 + 1;
    return response;
  });
  HttpsClient client(server.GetUrl(), TrustingTestCa().get(), "", kTimeout);
  EXPECT_EQ(Origin(server.GetPort()) + " failed: the response is larger than the limit of 16777216 bytes",
            CommunicationFailure(client));
}

// Asynchronous sending: exactly one call, with exactly one of the two arguments set.
struct Outcomes {
  std::mutex mutex;
  std::vector<std::string> seen;

  ResponseCompletion Completion() {
    return [this](const Tamber::Exception* error, Tamber::Reader* response) {
      std::lock_guard<std::mutex> lock(mutex);
      if (error != nullptr && response == nullptr) {
        seen.push_back(std::string("failure: ") + error->what() +
                       (dynamic_cast<const CommunicationException*>(error) != nullptr ? "" : " (wrong class)"));
      } else if (response != nullptr && error == nullptr) {
        seen.push_back("body: " + ReadAll(response));
      } else {
        seen.push_back("both or neither");
      }
    };
  }
};

TEST(HttpsSessionAsync, CompletesOnceWithTheBodyOrTheFailure) {
  HttpsTestServer server;
  server.SetHandler([](const RecordedRequest& request) {
    CannedResponse response;
    response.status = request.body == "fail" ? 404 : 200;
    return response;
  });
  HttpsClient client(server.GetUrl(), TrustingTestCa().get(), "", kTimeout);
  HttpsClient nowhere("https://127.0.0.1:" + std::to_string(TestSupport::UnusedLoopbackPort()) + "/sts",
                      TrustingTestCa().get(), "", kTimeout);
  Outcomes outcomes;
  boost::shared_ptr<TransportSession> session = client.CreateSession();
  std::vector<Ref<Tamber::System::ScheduledItem>> items(3);
  session->SendRequestAsync(IssueRequest("ok"), outcomes.Completion(), items[0]);
  session->SendRequestAsync(IssueRequest("fail"), outcomes.Completion(), items[1]);
  nowhere.CreateSession()->SendRequestAsync(IssueRequest(), outcomes.Completion(), items[2]);
  for (const Ref<Tamber::System::ScheduledItem>& item : items) ASSERT_TRUE(item->Wait(kTimeout));

  std::lock_guard<std::mutex> lock(outcomes.mutex);
  ASSERT_EQ(3u, outcomes.seen.size());
  std::sort(outcomes.seen.begin(), outcomes.seen.end());
  EXPECT_EQ("body: <ok/>", outcomes.seen[0]);
  EXPECT_EQ(0u, outcomes.seen[1].find("failure: HTTPS request to 127.0.0.1:")) << outcomes.seen[1];
  EXPECT_EQ("failure: Server returned error: 404 Not Found", outcomes.seen[2]);
}

TEST(HttpsSessionAsync, YieldsThePendingRequestItself) {
  HttpsTestServer server;
  Ref<Tamber::Http::ConnectionSpec> tcp;
  Tamber::Http::CreateTCPConnectionSpec("127.0.0.1", server.GetPort(), false, tcp);
  Ref<Tamber::Http::ConnectionSpec> spec;
  Tamber::Http::CreateSSLConnectionSpec(tcp.get(), TrustingTestCa().get(), "127.0.0.1", "", spec);
  HttpsSession session(spec.get(), "/sts/x", kTimeout);
  Outcomes outcomes;
  Ref<Tamber::Http::PendingRequestItem> item;
  session.SendRequestAsync(IssueRequest(), outcomes.Completion(), item);
  EXPECT_EQ("/sts/x", item->GetRequest()->GetPath());
  ASSERT_TRUE(item->Wait(kTimeout));
  std::lock_guard<std::mutex> lock(outcomes.mutex);
  EXPECT_EQ(std::vector<std::string>{"body: <ok/>"}, outcomes.seen);
  EXPECT_EQ("/sts/x", server.GetRequests().at(0).target);
}

// Translation of one exchange, without a network.
Ref<Tamber::Http::ClientResponse> Response(int status, const std::string& reason, const std::string& body) {
  return Ref<Tamber::Http::ClientResponse>(new Tamber::Http::ClientResponseImpl(status, reason, body));
}

class TranslateResponseStatus : public testing::TestWithParam<StatusRow> {};

TEST_P(TranslateResponseStatus, MapsTheStatus) {
  Ref<Tamber::Http::ClientResponse> response = Response(GetParam().status, "Reason Text", "<b/>");
  boost::shared_ptr<Tamber::Exception> failure;
  Ref<Tamber::Reader> previous;
  Tamber::CreateStringReader("previous", previous);
  Ref<Tamber::Reader> body = previous;
  TranslateResponse(nullptr, response.get(), failure, body);
  if (failure) {
    EXPECT_NE(nullptr, dynamic_cast<CommunicationException*>(failure.get()));
    EXPECT_EQ(GetParam().outcome, std::string(failure->what()));
    EXPECT_EQ(previous, body);
  } else {
    EXPECT_EQ(GetParam().outcome, ReadAll(body.get()));
    EXPECT_EQ(response, body);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Statuses, TranslateResponseStatus,
    testing::Values(StatusRow{199, "Server returned error: 199 Reason Text"}, StatusRow{200, "<b/>"},
                    StatusRow{201, "<b/>"}, StatusRow{299, "<b/>"},
                    StatusRow{300, "Server returned error: 300 Reason Text"},
                    StatusRow{401, "Server returned error: 401 Reason Text"},
                    StatusRow{404, "Server returned error: 404 Reason Text"}, StatusRow{500, "<b/>"},
                    StatusRow{501, "Server returned error: 501 Reason Text"},
                    StatusRow{503, "Server returned error: 503 Reason Text"}),
    [](const testing::TestParamInfo<StatusRow>& info) { return std::to_string(info.param.status); });

TEST(TranslateResponse, TurnsAnErrorIntoACommunicationExceptionWithItsText) {
  const Tamber::Http::HttpException error("HTTPS request to h:1 failed: reset");
  boost::shared_ptr<Tamber::Exception> failure;
  Ref<Tamber::Reader> body;
  TranslateResponse(&error, nullptr, failure, body);
  ASSERT_NE(nullptr, dynamic_cast<CommunicationException*>(failure.get()));
  EXPECT_STREQ("HTTPS request to h:1 failed: reset", failure->what());
  EXPECT_FALSE(body);
}

TEST(TranslateResponse, KeepsAnEmptyReasonPhraseAsAnEmptyText) {
  boost::shared_ptr<Tamber::Exception> failure;
  Ref<Tamber::Reader> body;
  TranslateResponse(nullptr, Response(404, "", "").get(), failure, body);
  EXPECT_STREQ("Server returned error: 404 ", failure->what());
}

TEST(AsyncTranslateResponse, CallsTheCompletionWithTheTranslation) {
  std::vector<std::string> calls;
  const ResponseCompletion completion = [&](const Tamber::Exception* error, Tamber::Reader* response) {
    calls.push_back(error != nullptr ? error->what() : ReadAll(response));
  };
  AsyncTranslateResponse(completion, nullptr, Response(200, "OK", "<b/>").get(), nullptr);
  AsyncTranslateResponse(completion, nullptr, Response(503, "Busy", "").get(), nullptr);
  EXPECT_EQ((std::vector<std::string>{"<b/>", "Server returned error: 503 Busy"}), calls);
  EXPECT_THROW(AsyncTranslateResponse(ResponseCompletion(), nullptr, Response(200, "OK", "").get(), nullptr),
               boost::bad_function_call);
}

}  // namespace
}  // namespace SsoClient
