#include "tamber/xml/security/SignatureValue.h"

#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

[[noreturn]] void Fail() { throw XmlSecurityException("Signing failed: " + Crypto::TakeOpenSslError()); }

// OpenSSL writes ECDSA signatures in DER; XML signatures carry r || s of fixed width.
std::vector<unsigned char> FromDer(EVP_PKEY* key, const std::vector<unsigned char>& der) {
  const unsigned char* cursor = der.data();
  Crypto::EcdsaSigPtr signature(d2i_ECDSA_SIG(nullptr, &cursor, static_cast<long>(der.size())));
  if (!signature) Fail();
  const int half = (EVP_PKEY_get_bits(key) + 7) / 8;
  std::vector<unsigned char> value(2 * static_cast<size_t>(half));
  if (BN_bn2binpad(ECDSA_SIG_get0_r(signature.get()), value.data(), half) != half ||
      BN_bn2binpad(ECDSA_SIG_get0_s(signature.get()), value.data() + half, half) != half) {
    Fail();
  }
  return value;
}

}  // namespace

std::vector<unsigned char> ComputeSignatureValue(EVP_PKEY* key, const EVP_MD* digest, const std::string& data) {
  Crypto::EvpMdCtxPtr context(EVP_MD_CTX_new());
  std::vector<unsigned char> signature(static_cast<size_t>(EVP_PKEY_get_size(key)));
  size_t length = signature.size();
  if (!context || EVP_DigestSignInit(context.get(), nullptr, digest, nullptr, key) != 1 ||
      EVP_DigestSign(context.get(), signature.data(), &length, reinterpret_cast<const unsigned char*>(data.data()),
                     data.size()) != 1) {
    Fail();
  }
  signature.resize(length);
  return EVP_PKEY_get_base_id(key) == EVP_PKEY_EC ? FromDer(key, signature) : signature;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
