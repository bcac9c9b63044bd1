#ifndef TAMBER_CRYPTO_PRIVATEKEYIMPL_H
#define TAMBER_CRYPTO_PRIVATEKEYIMPL_H

#include <string>

#include "tamber/crypto/OpenSsl.h"
#include "tamber/crypto/PrivateKey.h"

namespace Tamber {
namespace Crypto {

// An RSA or EC private key held as an EVP_PKEY; immutable.
class PrivateKeyImpl final : public PrivateKey {
 public:
  explicit PrivateKeyImpl(EvpPkeyPtr key);

  std::string GetAlgorithm() const override;
  bool Matches(const Certificate& certificate) const override;

  EVP_PKEY* GetEvpPkey() const { return _key.get(); }

 private:
  EvpPkeyPtr _key;
};

}  // namespace Crypto
}  // namespace Tamber

#endif
