#include "TokenService.h"

#include <openssl/crypto.h>

#include <algorithm>
#include <cstdio>

#include "CertificateTrust.h"
#include "KeyDirectory.h"
#include "RequestSignature.h"
#include "StsAnswers.h"
#include "TestMechanism.h"
#include "ssoClient/Exceptions.h"
#include "ssoClient/WireConstants.h"
#include "tamber/Exception.h"
#include "tamber/StringUtil.h"
#include "tamber/system/DateTime.h"

namespace DevSts {

namespace {

namespace Wire = SsoClient::Wire;
using CertificateRef = Tamber::Ref<const Tamber::Crypto::Certificate>;
using SsoClient::SamlToken;

const char* const WST = Wire::kWsTrust.uri;
const char ISSUER[] = "https://localhost/sts/STSService";
const char AUTHN_PASSWORD[] = "urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport";
const char AUTHN_X509[] = "urn:oasis:names:tc:SAML:2.0:ac:classes:X509";
const char AUTHN_KERBEROS[] = "urn:oasis:names:tc:SAML:2.0:ac:classes:Kerberos";
// How many renewals and further delegations a renewable or delegable token allows.
const unsigned long long RENEW_COUNT = 10;
const unsigned long long PROXY_COUNT = 1;

int64_t Now() { return Tamber::System::GetUtcDateTime().GetUtcTime(); }

std::string Upn(const SsoClient::PrincipalId& principal) { return principal.name + "@" + principal.domain; }

bool SameCertificate(const Tamber::Crypto::Certificate& a, const Tamber::Crypto::Certificate& b) {
  return a.GetDer() == b.GetDer();
}

xmlNode* SignatureOf(const SoapRequest& request) {
  return FindChild(request.security, "Signature", SsoClient::Saml::DSIG_NS);
}

xmlNode* SecurityTokenReferenceOf(const xmlNode* signature) {
  return RequireChild(RequireChild(signature, "KeyInfo", SsoClient::Saml::DSIG_NS), "SecurityTokenReference",
                      Wire::kWsse.uri);
}

// Refuses unless `signature` verifies with `certificate` and covers exactly the request's Body
// and Timestamp: a signature over other elements proves nothing about this request.
void VerifySignedBy(const SoapRequest& request, xmlNode* signature, const Tamber::Crypto::Certificate& certificate) {
  const SignatureCheck check = VerifySignatureElement(signature, certificate.GetDer());
  if (!check.valid) {
    throw StsFault(FAULT_FAILED_CHECK, "The signature of the request does not verify with the key of " +
                                           certificate.GetSubjectName() +
                                           (check.error.empty() ? "" : " (" + check.error + ")"));
  }
  const std::vector<std::string> expected = {"#" + AttributeOf(request.body, "Id", Wire::kWsu.uri),
                                             "#" + AttributeOf(request.timestamp, "Id", Wire::kWsu.uri)};
  if (check.referenceUris != expected) {
    throw StsFault(FAULT_FAILED_CHECK, "Expected a signature over soapenv:Body and wsu:Timestamp, found one over " +
                                           std::to_string(check.referenceUris.size()) + " other reference(s)");
  }
}

// The certificate of the wsse:BinarySecurityToken that `reference` ("#" + its wsu:Id) names.
CertificateRef ReferencedCertificate(const SoapRequest& request, const xmlNode* reference) {
  const std::string uri = AttributeOf(reference, "URI");
  const xmlNode* token = nullptr;
  for (const xmlNode* child = request.security->children; child != nullptr && token == nullptr; child = child->next) {
    if (uri.size() > 1 && uri[0] == '#' && IsElement(child, "BinarySecurityToken", Wire::kWsse.uri) &&
        AttributeOf(child, "Id", Wire::kWsu.uri) == uri.substr(1)) {
      token = child;
    }
  }
  if (token == nullptr || AttributeOf(token, "ValueType") != Wire::kX509v3) {
    throw StsFault(FAULT_INVALID_SECURITY_TOKEN,
                   "Expected the signature's key in an X.509 wsse:BinarySecurityToken named by \"" + uri +
                       "\", found none");
  }
  CertificateRef certificate;
  try {
    const std::vector<unsigned char> der = Tamber::StringUtil::Base64Decode(TextOf(token));
    Tamber::Crypto::CreateCertificate(der.data(), der.size(), certificate);
  } catch (const Tamber::Exception& e) {
    throw StsFault(FAULT_INVALID_SECURITY_TOKEN,
                   std::string("Expected a base64 DER certificate in wsse:BinarySecurityToken: ") + e.what());
  }
  return certificate;
}

// The assertion of the security header whose ID `keyIdentifier` names.
const xmlNode* ReferencedAssertion(const SoapRequest& request, const xmlNode* keyIdentifier) {
  if (AttributeOf(keyIdentifier, "ValueType") != Wire::kSamlIdKeyIdentifier) {
    throw StsFault(FAULT_INVALID_SECURITY_TOKEN, "Expected a SAML assertion ID as key identifier, found the type \"" +
                                                     AttributeOf(keyIdentifier, "ValueType") + "\"");
  }
  const std::string id = TextOf(keyIdentifier);
  for (const xmlNode* child = request.security->children; child != nullptr; child = child->next) {
    if (IsElement(child, "Assertion", SsoClient::Saml::SAML_NS) && AttributeOf(child, "ID") == id) return child;
  }
  throw StsFault(FAULT_INVALID_SECURITY_TOKEN, "Expected the security header to hold the assertion " + id +
                                                   " that the signature refers to, found none");
}

TokenIssuer::TokenRecord RecordFor(const std::string& subject, const char* authnContext) {
  TokenIssuer::TokenRecord record;
  record.issuer = ISSUER;
  record.subject = subject;
  record.authnContextClassRef = authnContext;
  return record;
}

TokenIssuer::TokenRecord RecordForUser(const User& user, const char* authnContext) {
  TokenIssuer::TokenRecord record = RecordFor(user.name, authnContext);
  record.groups = user.groups;
  record.givenName = user.givenName;
  record.surname = user.surname;
  return record;
}

// A new token about the subject of `token`, as it was authenticated then.
TokenIssuer::TokenRecord RecordFromToken(const SamlToken& token) {
  TokenIssuer::TokenRecord record = RecordFor(Upn(token.GetSubject()), AUTHN_X509);
  std::vector<SsoClient::PrincipalId> groups;
  token.GetGroups(groups);
  for (const SsoClient::PrincipalId& group : groups) record.groups.push_back(group.domain + "\\" + group.name);
  std::pair<std::string, std::string> fullName;
  token.GetFullName(fullName);
  record.givenName = fullName.first;
  record.surname = fullName.second;
  if (token.IsSolution()) record.isSolution = true;
  std::vector<SsoClient::Delegate> chain;
  token.GetDelegationChain(chain);
  for (const SsoClient::Delegate& delegate : chain) {
    record.delegates.emplace_back(Upn(delegate.principal), delegate.delegationInstant);
  }
  if (!record.delegates.empty()) record.delegateId = record.delegates.back();
  return record;
}

// What a renewal asks for: the token as it was, for a new lifetime.
TrustRequest RenewalOf(const SamlToken& token, int64_t lifetimeSec) {
  TrustRequest trust;
  trust.keyType = Wire::kKeyTypePublicKey;
  trust.lifetimeSec = lifetimeSec;
  std::set<std::string> audience;
  token.GetAudience(audience);
  trust.audience.assign(audience.begin(), audience.end());
  trust.delegable = token.IsDelegable();
  trust.renewable = true;
  std::vector<SsoClient::Advice> advice;
  token.GetAdvice(advice);
  for (const SsoClient::Advice& item : advice) {
    TokenIssuer::AdviceRecord record;
    record.source = item.source;
    for (const SsoClient::AdviceAttribute& attribute : item.attributes) {
      record.attributes.emplace_back(attribute.name, attribute.values);
    }
    trust.advice.push_back(record);
  }
  return trust;
}

std::string OperationOf(const std::string& action) {
  if (action == Wire::kActionIssue) return "issue";
  if (action == Wire::kActionRenew) return "renew";
  if (action == Wire::kActionValidate) return "validate";
  if (action == Wire::kActionChallenge) return "negotiate";
  throw StsFault(FAULT_INVALID_REQUEST, "Expected the SOAPAction of an Issue, Renew, Validate or negotiation "
                                        "request, found \"" + action + "\"");
}

}  // namespace

TokenService::TokenService(const Config& config)
    : _config(config),
      _signingKey(ReadPrivateKey(KeyPath(config.keyDirectory, SIGNING_KEY_FILE))),
      _signingCertificate(ReadCertificate(KeyPath(config.keyDirectory, SIGNING_CERTIFICATE_FILE))),
      _caCertificate(ReadCertificate(KeyPath(config.keyDirectory, CA_CERTIFICATE_FILE))),
      _trusted{_signingCertificate},
      _negotiations(config.clockToleranceSec + 600) {
  for (const SolutionUser& user : config.solutionUsers) {
    const std::string expected = "Expected a PEM certificate for the solution user " + user.name;
    _solutionUsers.emplace_back(user, ParseCertificatePem(user.certificatePem, expected));
  }
}

TokenService::Answer TokenService::Handle(const std::string& soapAction, const std::string& requestText,
                                          const std::string& cookieHeader) {
  Answer answer;
  Outcome outcome;
  try {
    std::string action = soapAction;
    if (action.size() >= 2 && action.front() == '"' && action.back() == '"') action = action.substr(1, action.size() - 2);
    outcome.operation = OperationOf(action);
    const SoapRequest request = ReadSoapRequest(requestText, Now(), _config.clockToleranceSec);
    answer.body = Dispatch(action, request, cookieHeader, answer, outcome);
    Log(outcome, "ok");
  } catch (const StsFault& fault) {
    answer.status = 500;
    answer.body = FaultAnswer(fault.GetCode(), fault.what());
    Log(outcome, "fault " + fault.GetCode());
  } catch (const std::exception& e) {
    answer.status = 500;
    answer.body = FaultAnswer(FAULT_REQUEST_FAILED, "The STS could not process the request");
    Log(outcome, std::string("fault ") + FAULT_REQUEST_FAILED + " (" + e.what() + ")");
  }
  return answer;
}

TokenService::Signer TokenService::VerifySigner(const SoapRequest& request) const {
  Signer signer;
  xmlNode* signature = SignatureOf(request);
  if (signature == nullptr) return signer;
  const xmlNode* tokenReference = SecurityTokenReferenceOf(signature);
  if (const xmlNode* reference = FindChild(tokenReference, "Reference", Wire::kWsse.uri)) {
    signer.certificate = ReferencedCertificate(request, reference);
  } else if (const xmlNode* keyIdentifier = FindChild(tokenReference, "KeyIdentifier", Wire::kWsse.uri)) {
    signer.token = VerifyPresentedToken(ReferencedAssertion(request, keyIdentifier));
    if (signer.token->GetConfirmationMethod() != SamlToken::CONFIRM_HOLDER_OF_KEY) {
      throw StsFault(FAULT_INVALID_SECURITY_TOKEN, "Expected a holder-of-key token to sign with, found a bearer token");
    }
    signer.certificate = signer.token->GetConfirmationCertificate();
  } else {
    throw StsFault(FAULT_INVALID_SECURITY_TOKEN,
                   "Expected the signature's key as a token reference or a SAML key identifier, found neither");
  }
  VerifySignedBy(request, signature, *signer.certificate);
  return signer;
}

std::string TokenService::Dispatch(const std::string& action, const SoapRequest& request,
                                   const std::string& cookieHeader, Answer& answer, Outcome& outcome) {
  const Signer signer = VerifySigner(request);
  if (action == Wire::kActionRenew) return Renew(request, signer, outcome);
  if (action == Wire::kActionValidate) return Validate(request, outcome);
  if (action == Wire::kActionChallenge) return ContinueNegotiation(request, cookieHeader, outcome);
  const TrustRequest trust = ReadIssueRequest(request.content);
  if (trust.binaryExchange) return StartNegotiation(trust, signer, answer, outcome);
  if (const xmlNode* usernameToken = FindChild(request.security, "UsernameToken", Wire::kWsse.uri)) {
    return IssueByPassword(trust, usernameToken, signer, outcome);
  }
  if (FindChild(request.security, "Assertion", SsoClient::Saml::SAML_NS) != nullptr) {
    return ExchangeToken(trust, signer, outcome);
  }
  return IssueByCertificate(trust, signer, outcome);
}

std::string TokenService::IssueByPassword(const TrustRequest& trust, const xmlNode* usernameToken,
                                          const Signer& signer, Outcome& outcome) const {
  outcome.operation = "issue by password";
  outcome.subject = TextOf(RequireChild(usernameToken, "Username", Wire::kWsse.uri));
  const xmlNode* password = RequireChild(usernameToken, "Password", Wire::kWsse.uri);
  if (AttributeOf(password, "Type") != Wire::kPasswordText) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected a password of type ") + Wire::kPasswordText +
                                              ", found \"" + AttributeOf(password, "Type") + "\"");
  }
  const User* user = FindUser(outcome.subject);
  const std::string given = TextOf(password);
  if (user == nullptr || given.size() != user->password.size() ||
      CRYPTO_memcmp(given.data(), user->password.data(), given.size()) != 0) {
    throw StsFault(FAULT_FAILED_AUTHENTICATION, "Wrong user name or password");
  }
  TokenIssuer::TokenRecord record = RecordForUser(*user, AUTHN_PASSWORD);
  return IssueAnswer(SignToken(record, trust, signer.certificate));
}

std::string TokenService::IssueByCertificate(const TrustRequest& trust, const Signer& signer,
                                             Outcome& outcome) const {
  outcome.operation = "issue by certificate";
  if (!signer.certificate || signer.token) {
    throw StsFault(FAULT_FAILED_AUTHENTICATION,
                   "Expected a user name token, a SAML token or a signature by a solution user, found none");
  }
  outcome.subject = signer.certificate->GetSubjectName();
  const auto solution = std::find_if(_solutionUsers.begin(), _solutionUsers.end(), [&](const auto& candidate) {
    return SameCertificate(*candidate.second, *signer.certificate);
  });
  const std::string commonName = CommonNameOf(*signer.certificate);
  TokenIssuer::TokenRecord record;
  if (solution != _solutionUsers.end()) {
    record = RecordFor(solution->first.name, AUTHN_X509);
    record.groups = solution->first.groups;
  } else if (IsClientCertificateOf(*signer.certificate, *_caCertificate) &&
             commonName.find('@') != std::string::npos) {
    // Any client identity of the key directory's CA names its solution user.
    record = RecordFor(commonName, AUTHN_X509);
  } else {
    throw StsFault(FAULT_FAILED_AUTHENTICATION,
                   "The signing certificate " + outcome.subject + " belongs to no solution user");
  }
  outcome.subject = record.subject;
  record.isSolution = true;
  return IssueAnswer(SignToken(record, trust, signer.certificate));
}

std::string TokenService::ExchangeToken(const TrustRequest& trust, const Signer& signer, Outcome& outcome) const {
  outcome.operation = "exchange token";
  if (!signer.token) {
    throw StsFault(FAULT_INVALID_SECURITY_TOKEN,
                   "Expected a signature by the key of the presented token, referring to it by its ID");
  }
  outcome.subject = Upn(signer.token->GetSubject());
  if (trust.delegateTo && !signer.token->IsDelegable()) {
    throw StsFault(FAULT_REQUEST_FAILED, "The presented token may not be delegated");
  }
  TokenIssuer::TokenRecord record = RecordFromToken(*signer.token);
  return IssueAnswer(SignToken(record, trust, signer.certificate));
}

std::string TokenService::Renew(const SoapRequest& request, const Signer& signer, Outcome& outcome) const {
  RequireRequestKind(request.content, Wire::kTokenTypeSaml20, Wire::kRequestTypeRenew);
  const xmlNode* target = RequireChild(request.content, "RenewTarget", WST);
  const boost::shared_ptr<const SamlToken> token =
      VerifyPresentedToken(RequireChild(target, "Assertion", SsoClient::Saml::SAML_NS));
  outcome.subject = Upn(token->GetSubject());
  if (token->GetConfirmationMethod() != SamlToken::CONFIRM_HOLDER_OF_KEY || !token->IsRenewable()) {
    throw StsFault(FAULT_UNABLE_TO_RENEW, "Only holder-of-key tokens with a renew restriction can be renewed");
  }
  if (!signer.certificate || !SameCertificate(*signer.certificate, *token->GetConfirmationCertificate())) {
    throw StsFault(FAULT_FAILED_AUTHENTICATION, "Expected a renew request signed by the token's confirmation key");
  }
  const TrustRequest trust = RenewalOf(*token, ReadLifetime(RequireChild(request.content, "Lifetime", WST)));
  TokenIssuer::TokenRecord record = RecordFromToken(*token);
  return RenewAnswer(SignToken(record, trust, signer.certificate));
}

std::string TokenService::Validate(const SoapRequest& request, Outcome& outcome) const {
  RequireRequestKind(request.content, Wire::kTokenTypeStatus, Wire::kRequestTypeValidate);
  const xmlNode* target = RequireChild(request.content, "ValidateTarget", WST);
  const xmlNode* assertion = RequireChild(target, "Assertion", SsoClient::Saml::SAML_NS);
  bool valid = false;
  try {
    const boost::shared_ptr<const SamlToken> token = VerifyPresentedToken(assertion);
    outcome.subject = Upn(token->GetSubject());
    valid = FindUser(outcome.subject) != nullptr ||
            std::any_of(_solutionUsers.begin(), _solutionUsers.end(),
                        [&](const auto& solution) { return solution.first.name == outcome.subject; });
  } catch (const StsFault&) {
    valid = false;
  }
  outcome.operation = valid ? "validate (valid)" : "validate (invalid)";
  return ValidateAnswer(valid);
}

std::string TokenService::StartNegotiation(const TrustRequest& trust, const Signer& signer, Answer& answer,
                                           Outcome& outcome) {
  outcome.operation = "negotiate (first leg)";
  Negotiation negotiation;
  negotiation.user = MechanismUserOf(*trust.binaryExchange);
  outcome.subject = negotiation.user;
  negotiation.challenge = MechanismChallenge();
  negotiation.request = trust;
  negotiation.signer = signer.certificate;
  const std::string contextId = _negotiations.Start(negotiation, Now());
  answer.setCookie = std::string(SESSION_COOKIE_NAME) + "=" + negotiation.cookie + "; Path=/sts; Secure; HttpOnly";
  return SPNegoLegAnswer(contextId, negotiation.challenge);
}

std::string TokenService::ContinueNegotiation(const SoapRequest& request, const std::string& cookieHeader,
                                              Outcome& outcome) {
  outcome.operation = "negotiate (continued leg)";
  const xmlNode* response = request.content;
  if (!IsElement(response, "RequestSecurityTokenResponse", WST)) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected a wst:RequestSecurityTokenResponse continuing a negotiation");
  }
  const std::string contextId = AttributeOf(response, "Context");
  const SsoClient::Leg proof = ReadBinaryExchange(RequireChild(response, "BinaryExchange", WST));
  const Negotiation negotiation = _negotiations.Take(contextId, cookieHeader);
  outcome.subject = negotiation.user;
  const User* user = FindUser(negotiation.user);
  if (user == nullptr || !MechanismProofMatches(MechanismProof(user->password, negotiation.challenge), proof)) {
    throw StsFault(FAULT_FAILED_AUTHENTICATION, "Wrong user name or password");
  }
  TokenIssuer::TokenRecord record = RecordForUser(*user, AUTHN_KERBEROS);
  return SPNegoFinalAnswer(contextId, SsoClient::Leg(), SignToken(record, negotiation.request, negotiation.signer));
}

const User* TokenService::FindUser(const std::string& name) const {
  const auto found = std::find_if(_config.users.begin(), _config.users.end(),
                                  [&](const User& user) { return user.name == name; });
  return found == _config.users.end() ? nullptr : &*found;
}

boost::shared_ptr<const SamlToken> TokenService::VerifyPresentedToken(const xmlNode* assertion) const {
  try {
    return SsoClient::CreateSamlToken(SerializeElement(assertion), _trusted, _config.clockToleranceSec);
  } catch (const Tamber::Exception& e) {
    throw StsFault(FAULT_INVALID_SECURITY_TOKEN, std::string("The presented token is not a valid token of this STS: ") +
                                                     e.what());
  }
}

std::string TokenService::SignToken(TokenIssuer::TokenRecord& record, const TrustRequest& trust,
                                    const CertificateRef& signer) const {
  if (trust.keyType == Wire::kKeyTypePublicKey) {
    if (signer) {
      record.confirmation = SamlToken::CONFIRM_HOLDER_OF_KEY;
      record.confirmationCertificate = signer;
    } else if (!trust.delegateTo) {
      // A delegated token is confirmed by the delegate's key, which the STS does not know:
      // such a token is a bearer token; any other must prove its key.
      throw StsFault(FAULT_INVALID_REQUEST, "Expected a request for a PublicKey token to be signed with that key");
    }
  }
  const int64_t lifetimeSec = std::min(trust.lifetimeSec.value_or(_config.maxLifetimeSec), _config.maxLifetimeSec);
  record.notOnOrAfter = Tamber::System::DateTimeFromUtc(record.notBefore.GetUtcTime() + lifetimeSec * 1000000, false);
  record.audience = trust.audience;
  if (trust.delegable) record.proxyCount = PROXY_COUNT;
  if (trust.renewable) record.renewCount = RENEW_COUNT;
  record.advice = trust.advice;
  if (trust.delegateTo) {
    record.delegates.emplace_back(*trust.delegateTo, record.issueInstant);
    record.delegateId = record.delegates.back();
  }
  return TokenIssuer::IssueToken(record, *_signingKey, *_signingCertificate);
}

void TokenService::Log(const Outcome& outcome, const std::string& result) {
  std::fprintf(stderr, "dev-sts: %s subject=%s outcome=%s\n", outcome.operation.c_str(), outcome.subject.c_str(),
               result.c_str());
}

}  // namespace DevSts
