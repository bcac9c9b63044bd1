#include "tamber/http/ConnectionSpec.h"

#include <string>

#include <gtest/gtest.h>

#include "tamber/Exception.h"
#include "tamber/http/ConnectionSpecImpl.h"
#include "tamber/crypto/TestKeys.h"

namespace Tamber {
namespace Http {
namespace {

Ref<Ssl::SSLContext> TestContext() {
  Ssl::SSLContextOptions options;
  options.trustedCertificates.push_back(TestKeys::Certificate("ca"));
  Ref<Ssl::SSLContext> context;
  Ssl::CreateSSLContext(options, context);
  return context;
}

Ref<ConnectionSpec> Tcp(const std::string& host = "127.0.0.1", int port = 8443) {
  Ref<ConnectionSpec> spec;
  CreateTCPConnectionSpec(host, port, false, spec);
  return spec;
}

template <class Call>
std::string InvalidArgumentMessage(Call call) {
  try {
    call();
  } catch (const InvalidArgumentException& e) {
    return e.what();
  }
  return "no InvalidArgumentException";
}

TEST(CreateTCPConnectionSpec, DescribesHostAndPort) {
  Ref<ConnectionSpec> spec = Tcp("::1", 1);
  EXPECT_EQ("::1", spec->GetHost());
  EXPECT_EQ(1, spec->GetPort());
  EXPECT_FALSE(spec->IsSecure());
}

TEST(CreateTCPConnectionSpec, RefusesBadHostsAndPorts) {
  const std::string hostMessage =
      "\" (expected a DNS name, an IPv4 address or an IPv6 address without brackets)";
  EXPECT_EQ("Invalid argument : Bad host name \"" + hostMessage, InvalidArgumentMessage([] { Tcp(""); }));
  EXPECT_EQ("Invalid argument : Bad host name \"[::1]" + hostMessage, InvalidArgumentMessage([] { Tcp("[::1]"); }));
  EXPECT_EQ("Invalid argument : Bad host name \"a/b" + hostMessage, InvalidArgumentMessage([] { Tcp("a/b"); }));
  EXPECT_EQ("Invalid argument : Bad port 0 (expected 1 to 65535)", InvalidArgumentMessage([] { Tcp("h", 0); }));
  EXPECT_EQ("Invalid argument : Bad port 65536 (expected 1 to 65535)",
            InvalidArgumentMessage([] { Tcp("h", 65536); }));
}

TEST(CreateSSLConnectionSpec, WrapsTheTcpDescriptionWithTheNameToProve) {
  Ref<ConnectionSpec> tcp = Tcp("127.0.0.1", 9443);
  Ref<ConnectionSpec> spec;
  CreateSSLConnectionSpec(tcp.get(), TestContext().get(), "other.example", "", spec);
  EXPECT_TRUE(spec->IsSecure());
  EXPECT_EQ("other.example", spec->GetHost());
  EXPECT_EQ(9443, spec->GetPort());
  EXPECT_EQ(tcp.get(), &GetTcpPart(*spec));
}

TEST(CreateSSLConnectionSpec, RefusesMissingPartsAndBadHosts) {
  Ref<ConnectionSpec> spec;
  Ref<ConnectionSpec> tcp = Tcp();
  Ref<Ssl::SSLContext> context = TestContext();
  EXPECT_EQ("Invalid argument : A TLS connection needs a plain TCP connection description to run over",
            InvalidArgumentMessage([&] { CreateSSLConnectionSpec(nullptr, context.get(), "h", "", spec); }));
  Ref<ConnectionSpec> secure;
  CreateSSLConnectionSpec(tcp.get(), context.get(), "h", "", secure);
  EXPECT_EQ("Invalid argument : A TLS connection needs a plain TCP connection description to run over",
            InvalidArgumentMessage([&] { CreateSSLConnectionSpec(secure.get(), context.get(), "h", "", spec); }));
  EXPECT_EQ("Invalid argument : A TLS connection needs an SSL context",
            InvalidArgumentMessage([&] { CreateSSLConnectionSpec(tcp.get(), nullptr, "h", "", spec); }));
  EXPECT_EQ(
      "Invalid argument : Bad host name \"\" (expected a DNS name, an IPv4 address or an IPv6 address without "
      "brackets)",
      InvalidArgumentMessage([&] { CreateSSLConnectionSpec(tcp.get(), context.get(), "", "", spec); }));
  EXPECT_FALSE(spec);
}

const char kThumbprint[] = "0123456789abcdef0123456789ABCDEF0123456789abcdef0123456789abcdef";
const char kThumbprintWithColons[] =
    "01:23:45:67:89:AB:CD:EF:01:23:45:67:89:ab:cd:ef:01:23:45:67:89:ab:cd:ef:01:23:45:67:89:ab:cd:ef";

TEST(ParseThumbprintPin, ReadsHexInAnyCaseWithOrWithoutColons) {
  const std::vector<unsigned char> expected = {0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef, 0x01, 0x23, 0x45,
                                               0x67, 0x89, 0xab, 0xcd, 0xef, 0x01, 0x23, 0x45, 0x67, 0x89, 0xab,
                                               0xcd, 0xef, 0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef};
  EXPECT_EQ(expected, ParseThumbprintPin(kThumbprint));
  EXPECT_EQ(expected, ParseThumbprintPin(kThumbprintWithColons));
  EXPECT_TRUE(ParseThumbprintPin("").empty());
}

class ParseThumbprintPinRefuses : public testing::TestWithParam<std::string> {};

TEST_P(ParseThumbprintPinRefuses, WithInvalidArgumentQuotingIt) {
  const std::string pin = GetParam();
  EXPECT_EQ(
      "Invalid argument : The SSL parameter must be empty or the SHA-256 thumbprint of the server certificate (64 "
      "hexadecimal digits, optionally with a colon between each pair); found \"" +
          pin + "\"",
      InvalidArgumentMessage([&pin] { ParseThumbprintPin(pin); }));
}

INSTANTIATE_TEST_SUITE_P(
    Pins, ParseThumbprintPinRefuses,
    testing::Values(std::string(kThumbprint).substr(2),                      // SHA-1 length and shorter
                    std::string(kThumbprint) + "00",                         // longer
                    std::string(kThumbprint).replace(10, 1, "g"),            // not hex
                    std::string(kThumbprintWithColons).replace(2, 1, "-"),   // other separator
                    std::string(kThumbprintWithColons).replace(5, 1, "5"),   // a colon missing
                    ":" + std::string(kThumbprintWithColons).substr(1),      // misplaced colon
                    std::string(kThumbprintWithColons) + ":",                // trailing colon
                    std::string(" ") + kThumbprint,                          // white space
                    "sha256/AAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAA="));  // a key pin, not a thumbprint

}  // namespace
}  // namespace Http
}  // namespace Tamber
