#ifndef TAMBER_CRYPTO_CERTIFICATEIMPL_H
#define TAMBER_CRYPTO_CERTIFICATEIMPL_H

#include <string>
#include <vector>

#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/OpenSsl.h"

namespace Tamber {
namespace Crypto {

// A decoded certificate. Every field is read at construction, so that one object can be shared
// between threads (CreateCertificate hands out the same object for the same DER).
class CertificateImpl final : public Certificate {
 public:
  // Takes over `x509`, decoded from exactly `der`.
  CertificateImpl(X509Ptr x509, std::vector<unsigned char> der);

  const std::vector<unsigned char>& GetDer() const override { return _der; }
  std::string GetSubjectName() const override { return _subjectName; }
  std::string GetIssuerName() const override { return _issuerName; }
  System::DateTime GetNotBefore() const override { return _notBefore; }
  System::DateTime GetNotAfter() const override { return _notAfter; }
  std::string GetSha256Thumbprint() const override;

  X509* GetX509() const { return _x509.get(); }
  // Null when OpenSSL cannot decode the key (an unknown algorithm).
  EVP_PKEY* GetPublicKey() const { return X509_get0_pubkey(_x509.get()); }
  const std::string& GetSha256() const { return _sha256; }  // raw 32 bytes

 private:
  X509Ptr _x509;
  std::vector<unsigned char> _der;
  std::string _subjectName;
  std::string _issuerName;
  System::DateTime _notBefore;
  System::DateTime _notAfter;
  std::string _sha256;
};

// The layer's implementation behind a Certificate; raises TypeMismatchException for another.
const CertificateImpl& ToCertificateImpl(const Certificate& certificate);

}  // namespace Crypto
}  // namespace Tamber

#endif
