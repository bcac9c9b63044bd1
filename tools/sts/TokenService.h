#ifndef TOOLS_STS_TOKENSERVICE_H
#define TOOLS_STS_TOKENSERVICE_H

// The STS's operations, independent of HTTP: one SOAP request in, one answer out.

#include <string>
#include <utility>
#include <vector>

#include "DevSts.h"
#include "Negotiations.h"
#include "SoapRequest.h"
#include "TokenIssuer.h"
#include "TrustRequest.h"
#include "ssoClient/SamlToken.h"

namespace DevSts {

class TokenService {
 public:
  // Loads the signing key and certificate of the configuration's key directory.
  explicit TokenService(const Config& config);

  struct Answer {
    int status = 200;
    std::string body;
    std::string setCookie;  // a "Set-Cookie" header value, or empty
  };
  // Answers one POST with that SOAPAction header (quoted or not), body and "Cookie" header. Logs
  // one line to stderr.
  Answer Handle(const std::string& soapAction, const std::string& requestText, const std::string& cookieHeader);

 private:
  // What the log line says about a request.
  struct Outcome {
    std::string operation = "unknown";
    std::string subject = "-";
  };

  // Who proved a key by signing a request: the certificate, and the token that confirms it when
  // the signature refers to a SAML token. Both null for an unsigned request.
  struct Signer {
    Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
    boost::shared_ptr<const SsoClient::SamlToken> token;
  };

  // Verifies the signature of a request, before anything of its body is believed.
  Signer VerifySigner(const SoapRequest& request) const;
  std::string Dispatch(const std::string& action, const SoapRequest& request, const std::string& cookieHeader,
                       Answer& answer, Outcome& outcome);
  std::string IssueByPassword(const TrustRequest& trust, const xmlNode* usernameToken, const Signer& signer,
                              Outcome& outcome) const;
  std::string IssueByCertificate(const TrustRequest& trust, const Signer& signer, Outcome& outcome) const;
  std::string ExchangeToken(const TrustRequest& trust, const Signer& signer, Outcome& outcome) const;
  std::string Renew(const SoapRequest& request, const Signer& signer, Outcome& outcome) const;
  std::string Validate(const SoapRequest& request, Outcome& outcome) const;
  std::string StartNegotiation(const TrustRequest& trust, const Signer& signer, Answer& answer, Outcome& outcome);
  std::string ContinueNegotiation(const SoapRequest& request, const std::string& cookieHeader, Outcome& outcome);

  const User* FindUser(const std::string& name) const;
  // The token presented in a request, verified as one this STS issued.
  boost::shared_ptr<const SsoClient::SamlToken> VerifyPresentedToken(const xmlNode* assertion) const;
  // Fills in what `trust` asks for and signs; `signer` is the proven key's certificate or null.
  std::string SignToken(TokenIssuer::TokenRecord& record, const TrustRequest& trust,
                        const Tamber::Ref<const Tamber::Crypto::Certificate>& signer) const;
  void Log(const Outcome& outcome, const std::string& result);

  Config _config;
  Tamber::Ref<const Tamber::Crypto::PrivateKey> _signingKey;
  Tamber::Ref<const Tamber::Crypto::Certificate> _signingCertificate;
  Tamber::Ref<const Tamber::Crypto::Certificate> _caCertificate;
  SsoClient::CertificateList _trusted;
  std::vector<std::pair<SolutionUser, Tamber::Ref<const Tamber::Crypto::Certificate>>> _solutionUsers;
  Negotiations _negotiations;
};

}  // namespace DevSts

#endif
