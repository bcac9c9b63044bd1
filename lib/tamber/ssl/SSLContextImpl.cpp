#include "tamber/ssl/SSLContextImpl.h"

#include "tamber/Exception.h"

namespace Tamber {
namespace Ssl {

namespace {

std::vector<Ref<const Crypto::Certificate>> CollectTrusted(const SSLContextOptions& options) {
  std::vector<Ref<const Crypto::Certificate>> trusted;
  if (!options.trustedCertificatesPem.empty()) Crypto::CreateCertificatesFromPem(options.trustedCertificatesPem, trusted);
  for (const Ref<const Crypto::Certificate>& certificate : options.trustedCertificates) {
    if (!certificate) throw InvalidArgumentException("The trusted certificates of an SSL context must not be null");
    trusted.push_back(certificate);
  }
  return trusted;
}

Crypto::X509StorePtr BuildStore(const std::vector<Ref<const Crypto::Certificate>>& trusted) {
  if (trusted.empty()) return nullptr;
  Crypto::X509StorePtr store(X509_STORE_new());
  if (!store) throw Crypto::CryptoException("Cannot create a certificate store: " + Crypto::TakeOpenSslError());
  for (const Ref<const Crypto::Certificate>& certificate : trusted) {
    // The same certificate given twice is no error.
    if (X509_STORE_add_cert(store.get(), Crypto::GetX509(*certificate)) != 1) Crypto::TakeOpenSslError();
  }
  // The given certificates are anchors, whether or not they are self-signed roots.
  X509_STORE_set_flags(store.get(), X509_V_FLAG_PARTIAL_CHAIN);
  return store;
}

}  // namespace

SSLContextImpl::SSLContextImpl(const SSLContextOptions& options)
    : _trusted(CollectTrusted(options)),
      _store(BuildStore(_trusted)),
      _verifyPeer(options.verifyPeer),
      _verifyHostName(options.verifyHostName),
      _clientCertificate(options.clientCertificate),
      _clientKey(options.clientKey) {
  if (!_clientCertificate != !_clientKey) {
    throw InvalidArgumentException("A client certificate for TLS needs its private key, and a key its certificate");
  }
  if (_clientKey && !_clientKey->Matches(*_clientCertificate)) {
    throw InvalidArgumentException("The client private key does not match the client certificate \"" +
                                   _clientCertificate->GetSubjectName() + "\"");
  }
}

bool SSLContextImpl::Apply(SSL_CTX* ctx, std::string& failure) const {
  if (_store) SSL_CTX_set1_cert_store(ctx, _store.get());
  if (_clientCertificate &&
      (SSL_CTX_use_certificate(ctx, Crypto::GetX509(*_clientCertificate)) != 1 ||
       SSL_CTX_use_PrivateKey(ctx, Crypto::GetEvpPkey(*_clientKey)) != 1)) {
    failure = "the client certificate cannot be used: " + Crypto::TakeOpenSslError();
    return false;
  }
  return true;
}

void CreateSSLContext(const SSLContextOptions& options, Ref<SSLContext>& context) {
  context = new SSLContextImpl(options);
}

}  // namespace Ssl
}  // namespace Tamber
