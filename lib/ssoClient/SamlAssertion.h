#ifndef SSOCLIENT_SAMLASSERTION_H
#define SSOCLIENT_SAMLASSERTION_H

// The records of a SAML 2.0 assertion as the STS issues it, and the strict reader that fills
// them from a DOM. Every reader throws ParseException naming the offending node.

#include <set>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include "ssoClient/SamlToken.h"
#include "ssoClient/XmlUtils.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/system/DateTime.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/QName.h"
#include "tamber/xml/security/Signature.h"

namespace SsoClient {

struct NameIDType {
  std::string format;
  std::string value;
};

struct SubjectConfirmationDataType {
  // Bearer tokens only.
  Tamber::System::DateTime notOnOrAfter;
  // Holder-of-key tokens only.
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
};

struct SubjectConfirmationType {
  SamlToken::ConfirmationType method = SamlToken::CONFIRM_BEARER;
  // The delegate id of a delegated token.
  boost::optional<NameIDType> nameId;
  SubjectConfirmationDataType subjectConfirmationData;
};

struct SubjectType {
  NameIDType nameId;
  SubjectConfirmationType subjectConfirmation;
};

struct DelegateType {
  Tamber::System::DateTime delegationInstant;
  NameIDType nameId;
};

struct DelegationRestrictionType {
  std::vector<DelegateType> delegate;
};

struct RenewRestrictionType {
  boost::optional<unsigned long long> count;
};

struct AudienceRestrictionType {
  std::set<std::string> audience;
};

struct ProxyRestrictionType {
  boost::optional<unsigned long long> count;
};

struct ConditionsType {
  Tamber::System::DateTime notBefore;
  Tamber::System::DateTime notOnOrAfter;
  boost::optional<RenewRestrictionType> renewRestriction;
  boost::optional<DelegationRestrictionType> delegationRestriction;
  boost::optional<AudienceRestrictionType> audienceRestriction;
  boost::optional<ProxyRestrictionType> proxyRestriction;
};

struct AdviceType {
  std::vector<Advice> advice;
};

struct AuthnContextType {
  std::string authnContextClassRef;
};

struct AuthnStatementType {
  Tamber::System::DateTime authnInstant;
  AuthnContextType authnContext;
};

struct AttributeType {
  std::string name;
  std::string nameFormat;
  std::string friendlyName;
  std::vector<std::string> attributeValue;
};

struct AttributeStatementType {
  std::vector<AttributeType> attribute;
};

struct SamlAssertionType {
  std::string version;
  std::string id;
  Tamber::System::DateTime issueInstant;
  NameIDType issuer;
  Tamber::Ref<Tamber::Xml::Security::Signature> signature;
  SubjectType subject;
  ConditionsType conditions;
  boost::optional<AdviceType> advice;
  AuthnStatementType authnStatement;
  boost::optional<AttributeStatementType> attributeStatement;
};

// Element readers. Each takes the iterator positioned on its element. A Parse... reader requires
// the element and leaves the iterator on the next accepted sibling; a TryParse... reader returns
// without touching anything when the current node is not its element.
void ParseSamlAssertionElement(NodeFilterIterator& it, SamlAssertionType& assertion);
void ParseSamlIssuerElement(NodeFilterIterator& it, NameIDType& issuer);
// The token's ds:Signature, right after Issuer; lives beside the token validation.
void ParseTokenSignature(NodeFilterIterator& it, Tamber::Xml::ElementNode* assertion,
                         Tamber::Ref<Tamber::Xml::Security::Signature>& signature);
void ParseSubjectElement(NodeFilterIterator& it, SubjectType& subject);
void ParseSubjectNameIdElement(NodeFilterIterator& it, NameIDType& nameId);
void ParseSubjectConfirmationElement(NodeFilterIterator& it, SubjectConfirmationType& confirmation);
// Reads according to `confirmation.method` and fills `confirmation.subjectConfirmationData`.
void ParseSubjectConfirmationDataElement(NodeFilterIterator& it, SubjectConfirmationType& confirmation);
void ParseSubjectConfirmationDataKeyInfoElement(NodeFilterIterator& it, SubjectConfirmationDataType& data);
void ParseConditionsElement(NodeFilterIterator& it, ConditionsType& conditions);
void TryParseDelegationRestriction(NodeFilterIterator& it, boost::optional<DelegationRestrictionType>& restriction);
void ParseDelegate(NodeFilterIterator& it, DelegateType& delegate);
void TryParseAudienceRestriction(NodeFilterIterator& it, boost::optional<AudienceRestrictionType>& restriction);
void TryParseProxyRestriction(NodeFilterIterator& it, boost::optional<ProxyRestrictionType>& restriction);
void TryParseRenewRestriction(NodeFilterIterator& it, boost::optional<RenewRestrictionType>& restriction);
void TryParseAdviceElement(NodeFilterIterator& it, boost::optional<AdviceType>& advice);
void ParseRsaAdviceElement(NodeFilterIterator& it, Advice& advice);
void ParseAuthnStatementElement(NodeFilterIterator& it, AuthnStatementType& statement);
void ParseAuthnContextElement(NodeFilterIterator& it, AuthnContextType& context);
void ParseAttributeStatementElement(NodeFilterIterator& it, AttributeStatementType& statement);
void ParseAttributeElement(NodeFilterIterator& it, AttributeType& attribute);
// The content of any element of NameID type; checks neither the element's name nor moves.
void ParseNameIDType(const NodeFilterIterator& it, NameIDType& nameId);

// Strictness checks.
bool ElementQNameIs(const Tamber::Xml::ElementNode* e, const char* localName, const char* ns);
bool ElementXsiTypeIs(const Tamber::Xml::ElementNode* e, const Tamber::Xml::QName& type);
void RequireElementQName(const Tamber::Xml::ElementNode* e, const char* localName, const char* ns);
// Attribute names as written, prefix included; namespace declarations are always allowed.
void RequireElementAttributesNames(const Tamber::Xml::ElementNode* e, const std::vector<std::string>& required,
                                   const std::vector<std::string>& optional);
// Attribute names resolved to QNames (an unprefixed attribute has no namespace).
void RequireElementAttributesQNames(const Tamber::Xml::ElementNode* e,
                                    const std::vector<Tamber::Xml::QName>& required,
                                    const std::vector<Tamber::Xml::QName>& optional);
void RequireNoAttributes(const Tamber::Xml::ElementNode* e);
void RequireEmptyElement(NodeFilterIterator it);
// Exactly one accepted child, a text node; `text` receives it unchanged.
void RequireTextualContent(NodeFilterIterator it, std::string& text);
void GetDateAttribute(const Tamber::Xml::ElementNode* e, const char* name, Tamber::System::DateTime& date);
void GetBoolAttribute(const Tamber::Xml::ElementNode* e, const char* name, bool& value);
// Leaves `value` unchanged when the attribute is absent.
void GetULongOptionalAttribute(const Tamber::Xml::ElementNode* e, const char* name,
                               boost::optional<unsigned long long>& value);
// How an unprefixed attribute is named in a QName list.
Tamber::Xml::QName LocalName(const char* name);

}  // namespace SsoClient

#endif
