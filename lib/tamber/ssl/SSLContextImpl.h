#ifndef TAMBER_SSL_SSLCONTEXTIMPL_H
#define TAMBER_SSL_SSLCONTEXTIMPL_H

#include <vector>

#include <openssl/ssl.h>

#include "tamber/crypto/OpenSsl.h"
#include "tamber/ssl/SSLContext.h"

namespace Tamber {
namespace Ssl {

class SSLContextImpl : public SSLContext {
 public:
  explicit SSLContextImpl(const SSLContextOptions& options);

  const std::vector<Ref<const Crypto::Certificate>>& GetTrustedCertificates() const override { return _trusted; }
  bool VerifiesPeer() const override { return _verifyPeer; }
  bool VerifiesHostName() const override { return _verifyHostName; }
  const Crypto::Certificate* GetClientCertificate() const override { return _clientCertificate.get(); }

  // Puts the trust anchors (when given) and the client identity (when given) on a new SSL_CTX.
  // Returns false, with OpenSSL's reason in `failure`, when OpenSSL refuses them.
  bool Apply(SSL_CTX* ctx, std::string& failure) const;

 private:
  std::vector<Ref<const Crypto::Certificate>> _trusted;
  Crypto::X509StorePtr _store;  // null: the system store
  bool _verifyPeer;
  bool _verifyHostName;
  Ref<const Crypto::Certificate> _clientCertificate;
  Ref<const Crypto::PrivateKey> _clientKey;
};

}  // namespace Ssl
}  // namespace Tamber

#endif
