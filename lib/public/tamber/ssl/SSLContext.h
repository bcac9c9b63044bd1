#ifndef TAMBER_SSL_SSLCONTEXT_H
#define TAMBER_SSL_SSLCONTEXT_H

#include <string>
#include <vector>

#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace Tamber {
namespace Ssl {

// What an application trusts and presents when the layer opens TLS connections for it.
struct SSLContextOptions {
  // Trust anchors: the certificates of both fields together. When both are empty the system's
  // trust store is used.
  std::string trustedCertificatesPem;  // one or more PEM CERTIFICATE blocks
  std::vector<Ref<const Crypto::Certificate>> trustedCertificates;
  // Chain verification of the server certificate against the trust anchors, and the check that
  // it names the host connected to. Both are on by default; turning either off lets any server
  // that can intercept the traffic read it, so it is for tests against throw-away servers only.
  bool verifyPeer = true;
  bool verifyHostName = true;
  // An optional client identity for mutual TLS: both or neither, the key matching the
  // certificate.
  Ref<const Crypto::Certificate> clientCertificate;
  Ref<const Crypto::PrivateKey> clientKey;
};

// An immutable TLS configuration shared by any number of connections and threads. Every
// connection made with it requires TLS 1.2 at least and never resumes an earlier TLS session,
// so each new connection is verified by a full handshake.
class TAMBER_API SSLContext : public Object {
 public:
  // The trust anchors given (empty when the system store is used).
  virtual const std::vector<Ref<const Crypto::Certificate>>& GetTrustedCertificates() const = 0;
  virtual bool VerifiesPeer() const = 0;
  virtual bool VerifiesHostName() const = 0;
  // The client certificate, or null.
  virtual const Crypto::Certificate* GetClientCertificate() const = 0;
};

// Checks the options and builds the context. Unreadable PEM, or PEM without a certificate,
// raises Crypto::CryptoException; a null trusted certificate, a client certificate without its
// key (or the reverse) and a key that does not match the certificate raise
// InvalidArgumentException.
TAMBER_API void CreateSSLContext(const SSLContextOptions& options, Ref<SSLContext>& context);

}  // namespace Ssl
}  // namespace Tamber

#endif
