#include "CertificateTrust.h"

#include <openssl/x509.h>
#include <openssl/x509v3.h>

#include "tamber/crypto/OpenSsl.h"

namespace DevSts {

bool IsClientCertificateOf(const Tamber::Crypto::Certificate& certificate, const Tamber::Crypto::Certificate& ca) {
  const Tamber::Crypto::X509StorePtr store(X509_STORE_new());
  const Tamber::Crypto::X509StoreCtxPtr context(X509_STORE_CTX_new());
  if (!store || !context || X509_STORE_add_cert(store.get(), Tamber::Crypto::GetX509(ca)) != 1 ||
      X509_STORE_CTX_init(context.get(), store.get(), Tamber::Crypto::GetX509(certificate), nullptr) != 1 ||
      X509_STORE_CTX_set_purpose(context.get(), X509_PURPOSE_SSL_CLIENT) != 1) {
    return false;
  }
  return X509_verify_cert(context.get()) == 1;
}

std::string CommonNameOf(const Tamber::Crypto::Certificate& certificate) {
  char name[256];
  const int length = X509_NAME_get_text_by_NID(X509_get_subject_name(Tamber::Crypto::GetX509(certificate)),
                                               NID_commonName, name, sizeof name);
  return length > 0 ? std::string(name, static_cast<size_t>(length)) : "";
}

}  // namespace DevSts
