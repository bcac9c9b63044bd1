#ifndef TAMBER_HTTP_CONNECTIONSPECIMPL_H
#define TAMBER_HTTP_CONNECTIONSPECIMPL_H

#include <string>
#include <vector>

#include "tamber/http/ConnectionSpec.h"

namespace Tamber {
namespace Http {

class TcpConnectionSpec : public ConnectionSpec {
 public:
  TcpConnectionSpec(const std::string& host, int port, bool tcpKeepAlive);

  const std::string& GetHost() const override { return _host; }
  int GetPort() const override { return _port; }
  bool IsSecure() const override { return false; }
  bool UsesTcpKeepAlive() const { return _tcpKeepAlive; }

 private:
  const std::string _host;
  const int _port;
  const bool _tcpKeepAlive;
};

class SslConnectionSpec : public ConnectionSpec {
 public:
  SslConnectionSpec(TcpConnectionSpec* tcp, Ssl::SSLContext* context, const std::string& host,
                    const std::vector<unsigned char>& pin);

  // The name the server must prove.
  const std::string& GetHost() const override { return _host; }
  int GetPort() const override { return _tcp->GetPort(); }
  bool IsSecure() const override { return true; }

  const TcpConnectionSpec& GetTcp() const { return *_tcp; }
  const Ssl::SSLContext& GetSSLContext() const { return *_context; }
  // The SHA-256 thumbprint the server certificate must have; empty when not pinned.
  const std::vector<unsigned char>& GetPin() const { return _pin; }

 private:
  const Ref<TcpConnectionSpec> _tcp;
  const Ref<Ssl::SSLContext> _context;
  const std::string _host;
  const std::vector<unsigned char> _pin;
};

// The TCP part of any spec: the spec itself or the one under TLS.
const TcpConnectionSpec& GetTcpPart(const ConnectionSpec& spec);

// Reads a pin as CreateSSLConnectionSpec accepts it: empty, or 64 hex digits with an optional
// colon between each pair. Raises InvalidArgumentException for anything else.
std::vector<unsigned char> ParseThumbprintPin(const std::string& text);

}  // namespace Http
}  // namespace Tamber

#endif
