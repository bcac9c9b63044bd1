#include "tamber/xml/security/TrustChainKeyResolver.h"

#include <algorithm>
#include <cstdint>

#include <openssl/err.h>
#include <openssl/sha.h>
#include <openssl/x509_vfy.h>

#include "tamber/crypto/LruCache.h"
#include "tamber/system/DateTime.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

constexpr size_t kCachedVerdicts = 1024;
constexpr int kMaxChainDepth = 8;
constexpr int64_t kMicrosPerSecond = 1000000;

int64_t Seconds(const ASN1_TIME* time, const char* what) {
  return Crypto::ToDateTime(time, what).GetUtcTime() / kMicrosPerSecond;
}

int64_t FloorSeconds(int64_t micros) {
  return micros >= 0 ? micros / kMicrosPerSecond : -((-micros + kMicrosPerSecond - 1) / kMicrosPerSecond);
}

}  // namespace

TrustChainKeyResolverImpl::TrustChainKeyResolverImpl(const std::list<Ref<const Crypto::Certificate>>& certificates) {
  std::vector<std::string> thumbprints;
  for (const Ref<const Crypto::Certificate>& certificate : certificates) {
    if (!certificate) throw InvalidArgumentException("The trusted certificate list holds a null certificate");
    const Crypto::CertificateImpl& impl = Crypto::ToCertificateImpl(*certificate);
    if (IsListed(impl)) continue;
    _trusted.push_back(&impl);
    thumbprints.push_back(impl.GetSha256());
  }
  std::sort(thumbprints.begin(), thumbprints.end());
  std::string joined;
  for (const std::string& thumbprint : thumbprints) joined += thumbprint;
  unsigned char digest[SHA256_DIGEST_LENGTH];
  SHA256(reinterpret_cast<const unsigned char*>(joined.data()), joined.size(), digest);
  _fingerprint.assign(reinterpret_cast<const char*>(digest), sizeof digest);
}

bool TrustChainKeyResolverImpl::IsListed(const Crypto::CertificateImpl& certificate) const {
  return std::any_of(_trusted.begin(), _trusted.end(), [&certificate](const Ref<const Crypto::CertificateImpl>& listed) {
    return listed->GetSha256() == certificate.GetSha256();
  });
}

std::vector<Ref<const Crypto::Certificate>> TrustChainKeyResolverImpl::SelectCertificates(
    const std::vector<Ref<const Crypto::Certificate>>& keyInfoCertificates) const {
  std::vector<Ref<const Crypto::Certificate>> selected;
  if (keyInfoCertificates.empty()) {
    selected.assign(_trusted.begin(), _trusted.end());
    return selected;
  }
  if (_trusted.empty()) return selected;
  for (size_t i = 0; i < keyInfoCertificates.size(); ++i) {
    if (IsListed(Crypto::ToCertificateImpl(*keyInfoCertificates[i])) || IsTrustedNow(keyInfoCertificates, i)) {
      selected.push_back(keyInfoCertificates[i]);
    }
  }
  return selected;
}

bool TrustChainKeyResolverImpl::IsTrustedNow(const std::vector<Ref<const Crypto::Certificate>>& keyInfoCertificates,
                                             size_t candidate) const {
  static auto* verdicts = new Crypto::LruCache<ChainVerdict>(kCachedVerdicts);  // never destroyed
  // The verdict depends on the list, the candidate and the intermediates offered with it.
  std::string key = _fingerprint + Crypto::ToCertificateImpl(*keyInfoCertificates[candidate]).GetSha256();
  for (size_t i = 0; i < keyInfoCertificates.size(); ++i) {
    if (i != candidate) key += Crypto::ToCertificateImpl(*keyInfoCertificates[i]).GetSha256();
  }
  ChainVerdict verdict;
  if (!verdicts->Find(key, verdict)) {
    verdict = VerifyChain(keyInfoCertificates, candidate);
    verdicts->Insert(std::move(key), verdict);
  }
  int64_t now = FloorSeconds(System::GetUtcDateTime().GetUtcTime());
  return verdict.chains && verdict.validFrom <= now && now <= verdict.validUntil;
}

TrustChainKeyResolverImpl::ChainVerdict TrustChainKeyResolverImpl::VerifyChain(
    const std::vector<Ref<const Crypto::Certificate>>& keyInfoCertificates, size_t candidate) const {
  ChainVerdict verdict;
  std::unique_ptr<STACK_OF(X509), void (*)(STACK_OF(X509)*)> intermediates(sk_X509_new_null(),
                                                                           [](STACK_OF(X509)* s) { sk_X509_free(s); });
  Crypto::X509StoreCtxPtr context(X509_STORE_CTX_new());
  if (!intermediates || !context) throw XmlSecurityException("Certificate chain cannot be verified: out of memory");
  for (size_t i = 0; i < keyInfoCertificates.size(); ++i) {
    if (i != candidate && !sk_X509_push(intermediates.get(), Crypto::GetX509(*keyInfoCertificates[i]))) {
      throw XmlSecurityException("Certificate chain cannot be verified: out of memory");
    }
  }
  X509* leaf = Crypto::GetX509(*keyInfoCertificates[candidate]);
  if (X509_STORE_CTX_init(context.get(), GetStore(), leaf, intermediates.get()) != 1) {
    throw XmlSecurityException("Certificate chain cannot be verified: " + Crypto::TakeOpenSslError());
  }
  // Any listed certificate is an anchor. Time is left out here, so that the verdict can be kept:
  // the chain's validity window is checked against the clock on every use instead.
  X509_VERIFY_PARAM* parameters = X509_STORE_CTX_get0_param(context.get());
  X509_VERIFY_PARAM_set_flags(parameters, X509_V_FLAG_PARTIAL_CHAIN | X509_V_FLAG_NO_CHECK_TIME);
  X509_VERIFY_PARAM_set_depth(parameters, kMaxChainDepth);
  verdict.chains = X509_verify_cert(context.get()) == 1;
  ERR_clear_error();
  if (!verdict.chains) return verdict;
  STACK_OF(X509)* chain = X509_STORE_CTX_get0_chain(context.get());
  verdict.validFrom = INT64_MIN;
  verdict.validUntil = INT64_MAX;
  for (int i = 0; i < sk_X509_num(chain); ++i) {
    X509* certificate = sk_X509_value(chain, i);
    verdict.validFrom = std::max(verdict.validFrom, Seconds(X509_get0_notBefore(certificate), "notBefore"));
    verdict.validUntil = std::min(verdict.validUntil, Seconds(X509_get0_notAfter(certificate), "notAfter"));
  }
  return verdict;
}

X509_STORE* TrustChainKeyResolverImpl::GetStore() const {
  std::call_once(_storeBuilt, [this] {
    // Only the listed certificates: never the system's trust store.
    Crypto::X509StorePtr store(X509_STORE_new());
    if (!store) throw XmlSecurityException("Certificate store cannot be created: out of memory");
    for (const Ref<const Crypto::CertificateImpl>& certificate : _trusted) {
      if (X509_STORE_add_cert(store.get(), certificate->GetX509()) != 1) {
        throw XmlSecurityException("Certificate store cannot be created: " + Crypto::TakeOpenSslError());
      }
    }
    _store = std::move(store);
  });
  return _store.get();
}

void CreateTrustChainKeyResolver(const std::list<Ref<const Crypto::Certificate>>& certificates,
                                 Ref<KeyInfoResolver>& resolver) {
  resolver = new TrustChainKeyResolverImpl(certificates);
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
