#ifndef TAMBER_XML_SECURITY_TRUSTCHAINKEYRESOLVER_H
#define TAMBER_XML_SECURITY_TRUSTCHAINKEYRESOLVER_H

#include <list>
#include <mutex>
#include <string>
#include <vector>

#include "tamber/crypto/CertificateImpl.h"
#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

// Trusts the listed certificates and whatever chains to them. The trust decision is made here with
// OpenSSL against a store built from the list alone; the verifier only receives the chosen keys.
//
// A library call builds a resolver for every token, so chain verdicts live in a process-wide,
// bounded cache keyed by the trusted list's fingerprint and the certificates presented: a chain is
// verified once per list, and only its validity window is checked against the clock on each use.
class TrustChainKeyResolverImpl final : public KeyInfoResolver {
 public:
  explicit TrustChainKeyResolverImpl(const std::list<Ref<const Crypto::Certificate>>& certificates);

  // The certificates whose keys may verify a signature. Without `keyInfoCertificates` (no
  // ds:KeyInfo certificate), every listed certificate. Otherwise those of `keyInfoCertificates`
  // that are listed themselves (dates are not checked: the caller listed them) or chain to a
  // listed certificate (the other KeyInfo certificates may serve as intermediates), with every
  // certificate of the chain valid at the current time.
  std::vector<Ref<const Crypto::Certificate>> SelectCertificates(
      const std::vector<Ref<const Crypto::Certificate>>& keyInfoCertificates) const;

 private:
  struct ChainVerdict {
    bool chains = false;
    int64_t validFrom = 0;   // seconds since the epoch: the latest notBefore of the chain
    int64_t validUntil = 0;  // the earliest notAfter of the chain
  };

  bool IsListed(const Crypto::CertificateImpl& certificate) const;
  bool IsTrustedNow(const std::vector<Ref<const Crypto::Certificate>>& keyInfoCertificates, size_t candidate) const;
  ChainVerdict VerifyChain(const std::vector<Ref<const Crypto::Certificate>>& keyInfoCertificates,
                           size_t candidate) const;
  X509_STORE* GetStore() const;

  std::vector<Ref<const Crypto::CertificateImpl>> _trusted;  // without duplicates
  std::string _fingerprint;                                  // SHA-256 over the sorted thumbprints
  mutable std::once_flag _storeBuilt;
  mutable Crypto::X509StorePtr _store;  // built on the first chain to verify
};

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
