#include "CertificateTrust.h"

#include <openssl/x509.h>
#include <openssl/x509v3.h>

#include <memory>

namespace DevSts {

namespace {

struct OpenSslDeleter {
  void operator()(X509* certificate) const { X509_free(certificate); }
  void operator()(X509_STORE* store) const { X509_STORE_free(store); }
  void operator()(X509_STORE_CTX* context) const { X509_STORE_CTX_free(context); }
};
using X509Ptr = std::unique_ptr<X509, OpenSslDeleter>;

X509Ptr ToX509(const Tamber::Crypto::Certificate& certificate) {
  const std::vector<unsigned char>& der = certificate.GetDer();
  const unsigned char* bytes = der.data();
  return X509Ptr(d2i_X509(nullptr, &bytes, static_cast<long>(der.size())));
}

}  // namespace

bool IsClientCertificateOf(const Tamber::Crypto::Certificate& certificate, const Tamber::Crypto::Certificate& ca) {
  const X509Ptr leaf = ToX509(certificate);
  const X509Ptr anchor = ToX509(ca);
  std::unique_ptr<X509_STORE, OpenSslDeleter> store(X509_STORE_new());
  std::unique_ptr<X509_STORE_CTX, OpenSslDeleter> context(X509_STORE_CTX_new());
  if (!leaf || !anchor || !store || !context || X509_STORE_add_cert(store.get(), anchor.get()) != 1 ||
      X509_STORE_CTX_init(context.get(), store.get(), leaf.get(), nullptr) != 1 ||
      X509_STORE_CTX_set_purpose(context.get(), X509_PURPOSE_SSL_CLIENT) != 1) {
    return false;
  }
  return X509_verify_cert(context.get()) == 1;
}

std::string CommonNameOf(const Tamber::Crypto::Certificate& certificate) {
  const X509Ptr x509 = ToX509(certificate);
  if (!x509) return "";
  char name[256];
  const int length = X509_NAME_get_text_by_NID(X509_get_subject_name(x509.get()), NID_commonName, name, sizeof name);
  return length > 0 ? std::string(name, static_cast<size_t>(length)) : "";
}

}  // namespace DevSts
