#ifndef TOOLS_TOKENISSUER_TOKENISSUER_H
#define TOOLS_TOKENISSUER_TOKENISSUER_H

// Issues SAML 2.0 assertions of exactly the shape the library accepts, signed as an STS signs
// them: enveloped, exclusive C14N, RSA-SHA256 (ECDSA-SHA256 for an EC key), SHA-256 digest, the
// signer's certificate in ds:KeyInfo/ds:X509Data. For tests, benchmarks and a development STS.

#include <string>
#include <vector>

#include <boost/optional.hpp>

#include "ssoClient/SamlConstants.h"
#include "ssoClient/SamlToken.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"
#include "tamber/system/DateTime.h"
#include "tamber/xml/Dom.h"

namespace TokenIssuer {

extern const char ENTITY_FORMAT[];
extern const char URI_NAME_FORMAT[];

// A delegate of the chain; also the delegate id (its instant unused there).
struct DelegateRecord {
  DelegateRecord(const std::string& upn, const Tamber::System::DateTime& delegationInstant)
      : upn(upn), delegationInstant(delegationInstant) {}

  std::string upn;
  Tamber::System::DateTime delegationInstant;
  std::string format = SsoClient::Saml::UPN_FORMAT;
};

struct AttributeRecord {
  AttributeRecord(const std::string& name, const std::vector<std::string>& values,
                  const std::string& nameFormat = URI_NAME_FORMAT, const std::string& friendlyName = "")
      : name(name), values(values), nameFormat(nameFormat), friendlyName(friendlyName) {}

  std::string name;
  std::vector<std::string> values;
  std::string nameFormat;
  // Omitted when empty.
  std::string friendlyName;
};

struct AdviceRecord {
  std::string source;
  std::vector<AttributeRecord> attributes;
};

// What an assertion says. The defaults make a valid bearer token for alice@example.com, issued
// now by the current clock (the test clock, when set) and valid for one hour.
struct TokenRecord {
  TokenRecord();

  std::string id;  // "_" and a fresh UUID
  std::string version = "2.0";
  Tamber::System::DateTime issueInstant;
  std::string issuer = "https://sts.example/sts";

  std::string subject = "alice@example.com";
  std::string subjectFormat = SsoClient::Saml::UPN_FORMAT;
  SsoClient::SamlToken::ConfirmationType confirmation = SsoClient::SamlToken::CONFIRM_BEARER;
  // Holder-of-key: the certificate whose key the holder proves.
  Tamber::Ref<const Tamber::Crypto::Certificate> confirmationCertificate;
  // Bearer: SubjectConfirmationData/@NotOnOrAfter; the conditions' end when unset.
  boost::optional<Tamber::System::DateTime> bearerNotOnOrAfter;
  // The NameID inside SubjectConfirmation: the last delegate of a delegated token.
  boost::optional<DelegateRecord> delegateId;

  Tamber::System::DateTime notBefore;
  Tamber::System::DateTime notOnOrAfter;
  std::vector<std::string> audience;
  std::vector<DelegateRecord> delegates;  // first delegation first
  boost::optional<unsigned long long> proxyCount;
  boost::optional<unsigned long long> renewCount;

  std::vector<AdviceRecord> advice;

  Tamber::System::DateTime authnInstant;
  std::string authnContextClassRef = "urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport";

  // Attributes; each kind is written only when set.
  std::vector<std::string> groups;  // "DOMAIN\group"
  boost::optional<bool> isSolution;
  std::string givenName;
  std::string surname;
  std::vector<AttributeRecord> otherAttributes;

  // Line breaks and indentation between elements, as some STSs write them.
  bool indent = false;
};

// The signed assertion as an element of a document of its own.
void IssueTokenElement(const TokenRecord& record, const Tamber::Crypto::PrivateKey& key,
                       const Tamber::Crypto::Certificate& certificate,
                       Tamber::Ref<Tamber::Xml::ElementNode>& assertion);
// The signed assertion as text (UTF-8, no XML declaration).
std::string IssueToken(const TokenRecord& record, const Tamber::Crypto::PrivateKey& key,
                       const Tamber::Crypto::Certificate& certificate);

}  // namespace TokenIssuer

#endif
