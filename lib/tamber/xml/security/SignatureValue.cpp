#include "tamber/xml/security/SignatureValue.h"

#include <openssl/err.h>

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

// The DER form OpenSSL verifies; empty when `value` is not r || s of the key's size.
std::vector<unsigned char> ToDer(EVP_PKEY* key, const std::vector<unsigned char>& value) {
  const size_t half = static_cast<size_t>(EVP_PKEY_get_bits(key) + 7) / 8;
  if (value.size() != 2 * half) return {};
  Crypto::EcdsaSigPtr signature(ECDSA_SIG_new());
  BIGNUM* r = BN_bin2bn(value.data(), static_cast<int>(half), nullptr);
  BIGNUM* s = BN_bin2bn(value.data() + half, static_cast<int>(half), nullptr);
  if (!signature || r == nullptr || s == nullptr || ECDSA_SIG_set0(signature.get(), r, s) != 1) {
    BN_free(r);
    BN_free(s);
    return {};
  }
  unsigned char* der = nullptr;
  int length = i2d_ECDSA_SIG(signature.get(), &der);
  if (length <= 0) return {};
  std::vector<unsigned char> bytes(der, der + length);
  OPENSSL_free(der);
  return bytes;
}

}  // namespace

bool VerifySignatureValue(EVP_PKEY* key, const EVP_MD* digest, const std::string& data,
                          const std::vector<unsigned char>& value) {
  std::vector<unsigned char> der;
  const std::vector<unsigned char>* signature = &value;
  if (EVP_PKEY_get_base_id(key) == EVP_PKEY_EC) {
    der = ToDer(key, value);
    if (der.empty()) return false;
    signature = &der;
  }
  Crypto::EvpMdCtxPtr context(EVP_MD_CTX_new());
  bool verified = context && EVP_DigestVerifyInit(context.get(), nullptr, digest, nullptr, key) == 1 &&
                  EVP_DigestVerify(context.get(), signature->data(), signature->size(),
                                   reinterpret_cast<const unsigned char*>(data.data()), data.size()) == 1;
  // A refused signature leaves its reason in OpenSSL's queue, which must not reach later calls.
  ERR_clear_error();
  return verified;
}

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
