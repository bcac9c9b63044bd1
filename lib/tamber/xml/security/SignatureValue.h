#ifndef TAMBER_XML_SECURITY_SIGNATUREVALUE_H
#define TAMBER_XML_SECURITY_SIGNATUREVALUE_H

#include <string>
#include <vector>

#include <openssl/evp.h>

namespace Tamber {
namespace Xml {
namespace Security {

// The bytes of ds:SignatureValue for `data` signed with `key` over the hash `digest`: PKCS#1 v1.5
// for RSA; for ECDSA, r and s as unsigned big-endian numbers of the key's size, one after the
// other (not DER). Raises XmlSecurityException with OpenSSL's reason.
std::vector<unsigned char> ComputeSignatureValue(EVP_PKEY* key, const EVP_MD* digest, const std::string& data);

// True when `value`, the bytes of a ds:SignatureValue in the form above, is a signature of `data`
// by the public half of `key` over the hash `digest`. A malformed value is false, not an error.
bool VerifySignatureValue(EVP_PKEY* key, const EVP_MD* digest, const std::string& data,
                          const std::vector<unsigned char>& value);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
