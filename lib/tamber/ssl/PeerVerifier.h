#ifndef TAMBER_SSL_PEERVERIFIER_H
#define TAMBER_SSL_PEERVERIFIER_H

#include <string>
#include <vector>

#include <openssl/ssl.h>

#include "tamber/ssl/SSLContextImpl.h"

namespace Tamber {
namespace Ssl {

// Decides, inside OpenSSL's handshake, whether the server of one connection attempt is the one
// wanted, so that a refused server never receives a byte of the request. With a pin, the
// server certificate's SHA-256 thumbprint alone decides; without one, the context's chain and
// host-name checks do. The verifier must outlive the handshake of every SSL_CTX it configured;
// renegotiation is turned off so that no later handshake can call it.
class PeerVerifier {
 public:
  PeerVerifier(const SSLContextImpl& context, const std::string& host, const std::vector<unsigned char>& pin);
  PeerVerifier(const PeerVerifier&) = delete;
  PeerVerifier& operator=(const PeerVerifier&) = delete;

  // Configures a new SSL_CTX: trust anchors, client identity, no renegotiation, and this
  // verifier as the certificate check. False when OpenSSL refuses the configuration; the reason
  // is then in GetFailure().
  bool Configure(SSL_CTX* ctx);

  // Why the server (or the configuration) was refused; empty while nothing was.
  const std::string& GetFailure() const { return _failure; }

  // True when a pin decides instead of the chain and host-name checks.
  bool IsPinned() const { return !_pin.empty(); }

 private:
  static int VerifyCallback(X509_STORE_CTX* storeContext, void* verifier);
  bool CheckPin(X509_STORE_CTX* storeContext);
  bool CheckChainAndHost(X509_STORE_CTX* storeContext);

  const SSLContextImpl& _context;
  const std::string _host;
  const std::vector<unsigned char> _pin;
  std::string _failure;
};

// Lower-case hex with a colon between each byte, as thumbprints are shown in messages.
std::string FormatThumbprint(const unsigned char* bytes, size_t length);

}  // namespace Ssl
}  // namespace Tamber

#endif
