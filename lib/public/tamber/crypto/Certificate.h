#ifndef TAMBER_CRYPTO_CERTIFICATE_H
#define TAMBER_CRYPTO_CERTIFICATE_H

#include <cstddef>
#include <string>
#include <vector>

#include "tamber/Exception.h"
#include "tamber/Ref.h"
#include "tamber/system/DateTime.h"

namespace Tamber {
namespace Crypto {

// Certificate or key material that cannot be read or used; the message says what was expected.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, CryptoException, Exception);

// An X.509 certificate, immutable.
class TAMBER_API Certificate : public Object {
 public:
  // The DER encoding the certificate was made from.
  virtual const std::vector<unsigned char>& GetDer() const = 0;
  // Distinguished names in RFC 2253 form ("CN=sts,O=Example").
  virtual std::string GetSubjectName() const = 0;
  virtual std::string GetIssuerName() const = 0;
  // The validity period the certificate states.
  virtual System::DateTime GetNotBefore() const = 0;
  virtual System::DateTime GetNotAfter() const = 0;
  // SHA-256 of the DER encoding, as lower-case hex without separators.
  virtual std::string GetSha256Thumbprint() const = 0;
};

// A certificate from `length` bytes of DER; anything else (trailing bytes included) raises
// CryptoException.
TAMBER_API void CreateCertificate(const unsigned char* bytes, size_t length, Ref<const Certificate>& certificate);
// A certificate from PEM text (the first CERTIFICATE block); raises CryptoException.
TAMBER_API void CreateCertificateFromPem(const std::string& pem, Ref<const Certificate>& certificate);
// Every CERTIFICATE block of a PEM text, in order; raises CryptoException when there is none.
TAMBER_API void CreateCertificatesFromPem(const std::string& pem, std::vector<Ref<const Certificate>>& certificates);

}  // namespace Crypto
}  // namespace Tamber

#endif
