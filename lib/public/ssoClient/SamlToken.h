#ifndef SSOCLIENT_SAMLTOKEN_H
#define SSOCLIENT_SAMLTOKEN_H

#include <list>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "ssoClient/Export.h"
#include "ssoClient/PrincipalId.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/system/DateTime.h"
#include "tamber/xml/Dom.h"

namespace SsoClient {

// One link of a delegation chain: who acted, and when the delegation happened.
struct SSOCLIENT_API Delegate {
  PrincipalId principal;
  Tamber::System::DateTime delegationInstant;
};

// A named advice attribute with its values in document order.
struct SSOCLIENT_API AdviceAttribute {
  std::string name;
  std::vector<std::string> values;
};

// Advice carried in a token, tagged with its source.
struct SSOCLIENT_API Advice {
  std::string source;
  std::vector<AdviceAttribute> attributes;
};

// An immutable, fully validated view of one SAML 2.0 assertion. Tokens are owned through
// boost::shared_ptr<const SamlToken> and may be read from any number of threads at once.
class SSOCLIENT_API SamlToken {
 public:
  // How the presenter proves it may use the token: by merely holding it (bearer), or by proving
  // possession of the key of GetConfirmationCertificate() (holder-of-key).
  enum ConfirmationType {
    CONFIRM_BEARER = 0,
    CONFIRM_HOLDER_OF_KEY = 1,
  };

  // The assertion's ID.
  virtual const std::string& GetId() const = 0;
  // NotBefore and NotOnOrAfter of the token's conditions.
  virtual const Tamber::System::DateTime& GetStartDate() const = 0;
  virtual const Tamber::System::DateTime& GetEndDate() const = 0;
  // The subject, from its UPN name identifier.
  virtual const PrincipalId& GetSubject() const = 0;
  // True when the token carries a renew restriction with a count above zero.
  virtual bool IsRenewable() const = 0;
  // True when the token carries a proxy restriction with a count above zero.
  virtual bool IsDelegable() const = 0;
  // True when the subject is a solution (a service account) rather than a person.
  virtual bool IsSolution() const = 0;
  // Bearer or holder-of-key.
  virtual ConfirmationType GetConfirmationMethod() const = 0;
  // (given name, surname); each empty when the token carries none.
  virtual void GetFullName(std::pair<std::string, std::string>& fullName) const = 0;
  // The subject's groups, in token order.
  virtual void GetGroups(std::vector<PrincipalId>& groups) const = 0;
  // The delegates, first delegation first.
  virtual void GetDelegationChain(std::vector<Delegate>& chain) const = 0;
  // The audience restriction's members; empty when the token has none.
  virtual void GetAudience(std::set<std::string>& audience) const = 0;
  // The advice entries; empty when none.
  virtual void GetAdvice(std::vector<Advice>& advice) const = 0;
  // The holder-of-key certificate, owned by the token; null for a bearer token.
  virtual const Tamber::Crypto::Certificate* GetConfirmationCertificate() const = 0;
  // The token's XML: the text it was created from, byte for byte, or the canonical form of the
  // element it was created from.
  virtual const std::string& ToXml() const = 0;

 protected:
  ~SamlToken() = default;
};

// Trusted token signers: each certificate is accepted as the signer itself or as a CA the
// signer's certificate chains to.
using CertificateList = std::list<Tamber::Ref<const Tamber::Crypto::Certificate>>;

// Parses and validates an assertion against the STS's signing certificates, allowing
// `clockToleranceSec` seconds of clock skew on both sides of the validity window. Raises
// ParseException or InvalidSignatureException (both InvalidTokenException), or
// Tamber::Xml::XMLParseException for text that is not well-formed XML.
SSOCLIENT_API boost::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                                 const CertificateList& certificates,
                                                                 long long clockToleranceSec);
// The same with a tolerance of 600 seconds.
SSOCLIENT_API boost::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                                 const CertificateList& certificates);
// The same against one certificate.
SSOCLIENT_API boost::shared_ptr<const SamlToken> CreateSamlToken(const std::string& xml,
                                                                 const Tamber::Crypto::Certificate* certificate);
// From an element of a parsed document, which the caller keeps owning; ToXml() then gives its
// canonical form. Raises ParseException or InvalidSignatureException.
SSOCLIENT_API boost::shared_ptr<const SamlToken> CreateSamlTokenFromDom(Tamber::Xml::ElementNode* element,
                                                                        const CertificateList& certificates,
                                                                        long long clockToleranceSec);
// The same with a tolerance of 600 seconds.
SSOCLIENT_API boost::shared_ptr<const SamlToken> CreateSamlTokenFromDom(Tamber::Xml::ElementNode* element,
                                                                        const CertificateList& certificates);

}  // namespace SsoClient

#endif
