#ifndef TAMBER_HTTP_CONNECTIONSPEC_H
#define TAMBER_HTTP_CONNECTIONSPEC_H

#include <string>

#include "tamber/Ref.h"
#include "tamber/ssl/SSLContext.h"

namespace Tamber {
namespace Http {

// How to reach one HTTP server: a host and port, plain TCP or TLS over TCP. Immutable.
class TAMBER_API ConnectionSpec : public Object {
 public:
  // The host name requests are addressed to (for TLS: the name the certificate must carry);
  // an IPv6 address without brackets.
  virtual const std::string& GetHost() const = 0;
  // The TCP port connected to.
  virtual int GetPort() const = 0;
  // True for TLS over TCP.
  virtual bool IsSecure() const = 0;
};

// A plain TCP connection to `host` (a DNS name, an IPv4 address or an IPv6 address without
// brackets) and `port` (1 to 65535). `tcpKeepAlive` turns on TCP keep-alive probes on idle
// connections. A bad host or port raises InvalidArgumentException.
TAMBER_API void CreateTCPConnectionSpec(const std::string& host, int port, bool tcpKeepAlive,
                                        Ref<ConnectionSpec>& spec);

// TLS over `tcpSpec` (a plain TCP description), configured by `sslContext` (required).
//
// `host` is the name the server must prove: it is sent as the TLS server name and in the Host
// header and checked against the certificate. It is normally the TCP host; when it differs the
// TCP connection still goes to the TCP host and port.
//
// `sslParameter` pins the server:
//   - empty: the server certificate must chain to the context's trust anchors and name `host`
//     (unless the context turns those checks off);
//   - otherwise the SHA-256 thumbprint of the server's own certificate, as 64 hexadecimal
//     digits in any case, optionally with a colon between each pair ("AB:CD:..."). The
//     connection is accepted exactly when the certificate the server presents has that
//     thumbprint, and then the pin alone decides: neither the trust anchors, nor the host name,
//     nor the validity dates are checked, so that the self-signed certificate of a development
//     server can be pinned.
// Either way the decision is taken during the TLS handshake, before any byte of a request is
// sent. A null or secure `tcpSpec`, a null context, an empty or malformed host and a malformed
// pin raise InvalidArgumentException.
TAMBER_API void CreateSSLConnectionSpec(ConnectionSpec* tcpSpec, Ssl::SSLContext* sslContext,
                                        const std::string& host, const std::string& sslParameter,
                                        Ref<ConnectionSpec>& spec);

}  // namespace Http
}  // namespace Tamber

#endif
