#ifndef TAMBER_CRYPTO_PRIVATEKEY_H
#define TAMBER_CRYPTO_PRIVATEKEY_H

#include <string>

#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"

namespace Tamber {
namespace Crypto {

// An RSA or EC private key. It is never printed, logged or serialised by the layer.
class TAMBER_API PrivateKey : public Object {
 public:
  // "RSA" or "EC".
  virtual std::string GetAlgorithm() const = 0;
  // True when `certificate` carries the public half of this key.
  virtual bool Matches(const Certificate& certificate) const = 0;
};

// A key from unencrypted PEM (PKCS#8 "PRIVATE KEY", "RSA PRIVATE KEY" or "EC PRIVATE KEY");
// raises CryptoException, whose message never contains key material.
TAMBER_API void CreatePrivateKeyFromPem(const std::string& pem, Ref<const PrivateKey>& key);

}  // namespace Crypto
}  // namespace Tamber

#endif
