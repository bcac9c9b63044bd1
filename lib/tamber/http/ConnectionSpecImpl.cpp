#include "tamber/http/ConnectionSpecImpl.h"

#include "tamber/Exception.h"
#include "tamber/http/UrlSyntax.h"

namespace Tamber {
namespace Http {

namespace {

constexpr size_t kSha256Length = 32;

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

void CheckHost(const std::string& host) {
  if (!IsValidHost(host)) {
    throw InvalidArgumentException("Bad host name \"" + host +
                                   "\" (expected a DNS name, an IPv4 address or an IPv6 address without brackets)");
  }
}

}  // namespace

TcpConnectionSpec::TcpConnectionSpec(const std::string& host, int port, bool tcpKeepAlive)
    : _host(host), _port(port), _tcpKeepAlive(tcpKeepAlive) {}

SslConnectionSpec::SslConnectionSpec(TcpConnectionSpec* tcp, Ssl::SSLContext* context, const std::string& host,
                                     const std::vector<unsigned char>& pin)
    : _tcp(tcp), _context(context), _host(host), _pin(pin) {}

const TcpConnectionSpec& GetTcpPart(const ConnectionSpec& spec) {
  if (spec.IsSecure()) return DynamicCast<const SslConnectionSpec>(&spec)->GetTcp();
  return *DynamicCast<const TcpConnectionSpec>(&spec);
}

std::vector<unsigned char> ParseThumbprintPin(const std::string& text) {
  std::vector<unsigned char> pin;
  if (text.empty()) return pin;
  // Either 64 digits, or 32 pairs joined by colons ("AB:CD:...").
  const bool withColons = text.find(':') != std::string::npos;
  const size_t step = withColons ? 3 : 2;
  const size_t expectedLength = withColons ? kSha256Length * 3 - 1 : kSha256Length * 2;
  bool wellFormed = text.size() == expectedLength;
  for (size_t i = 0; wellFormed && i < text.size(); i += step) {
    const int high = HexValue(text[i]);
    const int low = HexValue(text[i + 1]);
    const bool separatorOk = !withColons || i + 2 == text.size() || text[i + 2] == ':';
    wellFormed = high >= 0 && low >= 0 && separatorOk;
    pin.push_back(static_cast<unsigned char>(high * 16 + low));
  }
  if (!wellFormed) {
    throw InvalidArgumentException(
        "The SSL parameter must be empty or the SHA-256 thumbprint of the server certificate (64 hexadecimal "
        "digits, optionally with a colon between each pair); found \"" +
        text + "\"");
  }
  return pin;
}

void CreateTCPConnectionSpec(const std::string& host, int port, bool tcpKeepAlive, Ref<ConnectionSpec>& spec) {
  CheckHost(host);
  if (!IsValidPort(port)) throw InvalidArgumentException("Bad port " + std::to_string(port) + " (expected 1 to 65535)");
  spec = new TcpConnectionSpec(host, port, tcpKeepAlive);
}

void CreateSSLConnectionSpec(ConnectionSpec* tcpSpec, Ssl::SSLContext* sslContext, const std::string& host,
                             const std::string& sslParameter, Ref<ConnectionSpec>& spec) {
  if (tcpSpec == nullptr || tcpSpec->IsSecure()) {
    throw InvalidArgumentException("A TLS connection needs a plain TCP connection description to run over");
  }
  if (sslContext == nullptr) throw InvalidArgumentException("A TLS connection needs an SSL context");
  CheckHost(host);
  const std::vector<unsigned char> pin = ParseThumbprintPin(sslParameter);
  spec = new SslConnectionSpec(DynamicCast<TcpConnectionSpec>(tcpSpec), sslContext, host, pin);
}

}  // namespace Http
}  // namespace Tamber
