#ifndef TAMBER_CRYPTO_OPENSSL_H
#define TAMBER_CRYPTO_OPENSSL_H

// Internal bridge to the OpenSSL objects behind the layer's certificates and keys, for the code
// of the layer that calls OpenSSL or xmlsec directly (signatures, TLS). Nothing here is exported.

#include <memory>
#include <string>

#include <openssl/bio.h>
#include <openssl/ecdsa.h>
#include <openssl/evp.h>
#include <openssl/x509.h>

#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace Tamber {
namespace Crypto {

struct OpenSslDeleter {
  void operator()(X509* p) const { X509_free(p); }
  void operator()(EVP_PKEY* p) const { EVP_PKEY_free(p); }
  void operator()(BIO* p) const { BIO_free(p); }
  void operator()(X509_STORE* p) const { X509_STORE_free(p); }
  void operator()(X509_STORE_CTX* p) const { X509_STORE_CTX_free(p); }
  void operator()(EVP_MD_CTX* p) const { EVP_MD_CTX_free(p); }
  void operator()(ECDSA_SIG* p) const { ECDSA_SIG_free(p); }
};
using X509Ptr = std::unique_ptr<X509, OpenSslDeleter>;
using EvpPkeyPtr = std::unique_ptr<EVP_PKEY, OpenSslDeleter>;
using BioPtr = std::unique_ptr<BIO, OpenSslDeleter>;
using X509StorePtr = std::unique_ptr<X509_STORE, OpenSslDeleter>;
using X509StoreCtxPtr = std::unique_ptr<X509_STORE_CTX, OpenSslDeleter>;
using EvpMdCtxPtr = std::unique_ptr<EVP_MD_CTX, OpenSslDeleter>;
using EcdsaSigPtr = std::unique_ptr<ECDSA_SIG, OpenSslDeleter>;

// The certificate's X509 object, owned by the certificate (valid while it lives). Raises
// TypeMismatchException for a Certificate that is not the layer's own.
X509* GetX509(const Certificate& certificate);
// The certificate's public key, owned by the certificate; null when OpenSSL cannot decode it.
EVP_PKEY* GetPublicKey(const Certificate& certificate);
// The private key's EVP_PKEY, owned by the key.
EVP_PKEY* GetEvpPkey(const PrivateKey& key);

// "RSA", "EC" or the short name OpenSSL gives the key type ("ED25519", ...).
std::string DescribeKeyType(const EVP_PKEY* key);

// The reason text of the earliest error in this thread's OpenSSL error queue ("unknown error"
// when it is empty), then empties the queue so that no error lingers for unrelated calls.
std::string TakeOpenSslError();

// A DateTime from an ASN.1 time of a certificate; raises CryptoException naming `what`.
System::DateTime ToDateTime(const ASN1_TIME* time, const char* what);

}  // namespace Crypto
}  // namespace Tamber

#endif
