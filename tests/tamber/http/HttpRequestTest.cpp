#include "tamber/http/HttpRequest.h"

#include <functional>
#include <string>

#include <gtest/gtest.h>

#include "tamber/Exception.h"
#include "tamber/http/HttpRequestImpl.h"

namespace Tamber {
namespace Http {
namespace {

Ref<HttpRequestImpl> Create(HttpMethod method, const std::string& path) {
  Ref<HttpRequest> request;
  CreateHttpRequest(method, path, request);
  return Ref<HttpRequestImpl>(DynamicCast<HttpRequestImpl>(request.get()));
}

std::string InvalidArgumentOf(const std::function<void()>& call) {
  try {
    call();
  } catch (const InvalidArgumentException& e) {
    return e.what();
  }
  return "no InvalidArgumentException";
}

TEST(HttpRequest, KeepsMethodPathHeadersInOrderAndBody) {
  Ref<HttpRequestImpl> request = Create(HTTP_POST, "/sts?a=b");
  request->AddHeader("Content-Type", "text/xml");
  request->AddHeader("SOAPAction", "\"urn:x\"");
  request->AddHeader("X-Empty", "");
  request->WriteBody("<a/>");
  request->WriteBody(std::string("\0b", 2));
  EXPECT_EQ(HTTP_POST, request->GetMethod());
  EXPECT_EQ("/sts?a=b", request->GetPath());
  EXPECT_EQ((std::vector<std::string>{"Content-Type: text/xml", "SOAPAction: \"urn:x\"", "X-Empty;"}),
            request->GetHeaderLines());
  EXPECT_EQ(std::string("<a/>\0b", 6), request->GetBody());
}

TEST(HttpRequest, RefusesHeadersThatCouldSmuggleLines) {
  Ref<HttpRequestImpl> request = Create(HTTP_POST, "/");
  EXPECT_EQ("Invalid argument : Bad HTTP header name \"\"", InvalidArgumentOf([&] { request->AddHeader("", "v"); }));
  EXPECT_EQ("Invalid argument : Bad HTTP header name \"Bad Name\"",
            InvalidArgumentOf([&] { request->AddHeader("Bad Name", "v"); }));
  EXPECT_EQ("Invalid argument : Bad HTTP header name \"Name:\"",
            InvalidArgumentOf([&] { request->AddHeader("Name:", "v"); }));
  EXPECT_EQ("Invalid argument : The value of the HTTP header SOAPAction holds the character 0x0d",
            InvalidArgumentOf([&] { request->AddHeader("SOAPAction", "\"a\"\r\nX-Injected: 1"); }));
  EXPECT_EQ("Invalid argument : The value of the HTTP header A holds the character 0x0a",
            InvalidArgumentOf([&] { request->AddHeader("A", "b\nc"); }));
  EXPECT_EQ("Invalid argument : The value of the HTTP header A holds the character 0x00",
            InvalidArgumentOf([&] { request->AddHeader("A", std::string("b\0c", 3)); }));
  EXPECT_TRUE(request->GetHeaderLines().empty());
}

TEST(HttpRequest, RefusesBadPathsAndMethods) {
  const std::string expected = "\" (expected \"/\" followed by URL path and query characters)";
  for (const char* path : {"", "sts", "/a b", "/a#b", "/a\r\n", "/%g0", "http://host/"}) {
    SCOPED_TRACE(path);
    EXPECT_EQ("Invalid argument : Bad HTTP request path \"" + std::string(path) + expected,
              InvalidArgumentOf([&] { Create(HTTP_GET, path); }));
  }
  EXPECT_EQ("Invalid argument : Unknown HTTP method 6",
            InvalidArgumentOf([] { Create(static_cast<HttpMethod>(6), "/"); }));
  EXPECT_EQ("Invalid argument : Unknown HTTP method 0",
            InvalidArgumentOf([] { Create(static_cast<HttpMethod>(0), "/"); }));
}

TEST(HttpRequest, BecomesReadOnlyWhenFrozen) {
  Ref<HttpRequestImpl> request = Create(HTTP_POST, "/");
  EXPECT_TRUE(request->Freeze());
  EXPECT_FALSE(request->Freeze());
  try {
    request->AddHeader("A", "b");
    FAIL() << "a frozen request changed";
  } catch (const InvalidStateException& e) {
    EXPECT_STREQ("The HTTP request has been sent and can no longer be changed", e.what());
  }
  EXPECT_THROW(request->WriteBody("x"), InvalidStateException);
  EXPECT_TRUE(request->GetHeaderLines().empty());
}

}  // namespace
}  // namespace Http
}  // namespace Tamber
