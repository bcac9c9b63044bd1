#ifndef SSOCLIENT_SECURITYTOKENSERVICE_H
#define SSOCLIENT_SECURITYTOKENSERVICE_H

#include <string>

#include <boost/function.hpp>
#include <boost/optional.hpp>
#include <boost/shared_ptr.hpp>

#include "ssoClient/Export.h"
#include "ssoClient/NegotiationHandler.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"
#include "tamber/Exception.h"
#include "tamber/ssl/SSLContext.h"

namespace SsoClient {

// What a service needs to talk to one STS. Callers fill every field; the factory copies what it
// keeps.
struct SSOCLIENT_API SecurityTokenServiceConfig {
  // The STS endpoint, "https://..." (or "http://..." for tests).
  std::string stsUrl;
  // The STS signing certificates; every token a service returns is validated against them.
  CertificateList trustedCertificates;
  // Handed unchanged to the core layer's description of the SSL connection, beside the host name.
  std::string sslParameter;
  // Key material for holder-of-key tokens and signed requests; absent for bearer tokens only.
  boost::optional<HolderOfKeyConfig> holderOfKeyConfig;
  // The caller's SSL context, required for an HTTPS URL. Not owned: the service takes its own
  // counted reference.
  Tamber::Ssl::SSLContext* sslContext = nullptr;
};

// Completion of an asynchronous token-returning operation: (token, null) on success, (null,
// failure) otherwise. The exception lives only during the call; keep Clone() of it to keep it.
typedef boost::function<void(const boost::shared_ptr<const SamlToken>& token, const Tamber::Exception* error)>
    TokenCallback;
// Completion of ValidateSubjectAsync: (the answer, null) on success, (boost::none, failure)
// otherwise.
typedef boost::function<void(const boost::optional<bool>& valid, const Tamber::Exception* error)>
    ValidateCallback;

// A client of one STS. Immutable: any number of threads may call any operation on one instance
// at the same time. Every failure is an SsoException or a subclass, or
// Tamber::InvalidArgumentException / Tamber::InvalidStateException for a broken precondition.
// Instances live in the boost::shared_ptr of CreateSecurityTokenService.
class SSOCLIENT_API SecurityTokenService {
 public:
  // A token for a user name and password.
  virtual boost::shared_ptr<const SamlToken> AcquireToken(const std::string& user, const std::string& password,
                                                          const TokenSpec& spec) const = 0;
  // A token by GSS/SPNEGO negotiation, driving `handler` on the calling thread.
  virtual boost::shared_ptr<const SamlToken> AcquireTokenByGSS(const TokenSpec& spec,
                                                               NegotiationHandler& handler) const = 0;
  // A token for the configured holder-of-key certificate (requires holderOfKeyConfig).
  virtual boost::shared_ptr<const SamlToken> AcquireTokenByCertificate(const TokenSpec& spec) const = 0;
  // A new token in exchange for `token` (requires holderOfKeyConfig).
  virtual boost::shared_ptr<const SamlToken> AcquireTokenByToken(const SamlToken& token,
                                                                 const TokenSpec& spec) const = 0;
  // Whether the STS still holds the subject of `token` valid.
  virtual bool ValidateSubject(const SamlToken& token) const = 0;
  // A renewal of the holder-of-key `token` for `lifetimeSec` seconds (requires holderOfKeyConfig).
  virtual boost::shared_ptr<const SamlToken> RenewToken(const SamlToken& token, long long lifetimeSec) const = 0;

  // The same operations on a worker thread of the core layer's pool: each returns at once and
  // calls its callback exactly once, on the worker, with the result or the failure. The service,
  // the arguments and the objects behind the shared pointers are kept alive until then; a null
  // token or handler pointer ends the process.
  virtual void AcquireTokenAsync(const std::string& user, const std::string& password, const TokenSpec& spec,
                                 const TokenCallback& callback) const = 0;
  virtual void AcquireTokenByGssAsync(const TokenSpec& spec, const boost::shared_ptr<NegotiationHandler>& handler,
                                      const TokenCallback& callback) const = 0;
  virtual void AcquireTokenByCertificateAsync(const TokenSpec& spec, const TokenCallback& callback) const = 0;
  virtual void AcquireTokenByTokenAsync(const boost::shared_ptr<const SamlToken>& token, const TokenSpec& spec,
                                        const TokenCallback& callback) const = 0;
  virtual void ValidateSubjectAsync(const boost::shared_ptr<const SamlToken>& token,
                                    const ValidateCallback& callback) const = 0;
  virtual void RenewTokenAsync(const boost::shared_ptr<const SamlToken>& token, long long lifetimeSec,
                               const TokenCallback& callback) const = 0;

 protected:
  // Destroyed through the shared pointer made from the concrete type.
  ~SecurityTokenService() = default;
};

// A service for `config`. Opens no connection; raises what the transport raises for a URL it
// cannot use (Tamber::InvalidArgumentException for an HTTPS URL without an SSL context).
SSOCLIENT_API boost::shared_ptr<SecurityTokenService> CreateSecurityTokenService(
    const SecurityTokenServiceConfig& config);

}  // namespace SsoClient

#endif
