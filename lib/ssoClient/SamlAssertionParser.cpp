#include "ssoClient/SamlAssertion.h"

#include <algorithm>

#include <boost/lexical_cast.hpp>
#include <boost/numeric/conversion/cast.hpp>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlConstants.h"
#include "tamber/Panic.h"
#include "tamber/StringUtil.h"

using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;

namespace SsoClient {

namespace {

const QName XSI_TYPE(Saml::XSI_NS, "type");
const QName KEY_INFO_CONFIRMATION_DATA_TYPE(Saml::SAML_NS, Saml::KEY_INFO_CONFIRMATION_DATA_TYPE);
const QName DELEGATION_RESTRICTION_TYPE(Saml::DEL_NS, Saml::DELEGATION_RESTRICTION_TYPE);
const QName RENEW_RESTRICTION_TYPE(Saml::RSAEXT_NS, Saml::RENEW_RESTRICTION_TYPE);
const std::string XMLNS_PREFIX = std::string("xmlns") + ":";

bool IsNamespaceDeclaration(const std::string& attributeName) {
  return attributeName == "xmlns" || attributeName.compare(0, XMLNS_PREFIX.size(), XMLNS_PREFIX) == 0;
}

[[noreturn]] void ThrowMissingAttribute(const ElementNode* e, const std::string& attribute) {
  throw ParseException("Node '" + e->GetLocalName() + " is missing required attribute '" + attribute + "'");
}

// Fails with `message` unless the iterator has run past the last accepted child.
void RequireEnd(const NodeFilterIterator& it, const char* message) {
  if (!it.AtEnd()) throw ParseException(message);
}

std::string RequireAttribute(const ElementNode* e, const char* name) {
  std::string value;
  if (!e->GetAttribute(name, value)) ThrowMissingAttribute(e, name);
  return value;
}

// The xsi:type of `e` resolved against the default namespace in scope; false when absent.
bool GetXsiType(const ElementNode* e, QName& type) {
  std::string value;
  if (!e->GetAttribute(XSI_TYPE, value)) return false;
  std::string defaultNamespace;
  if (!e->LookupNamespace("", defaultNamespace)) defaultNamespace.clear();
  ResolveQName(e, value, defaultNamespace, type);
  return true;
}

// Reads a textual child element `localName` (SAML) and moves past it.
void ParseTextElement(NodeFilterIterator& it, const char* localName, std::string& text) {
  RequireElementQName(IteratorToElement(it), localName, Saml::SAML_NS);
  RequireTextualContent(it, text);
  it.MoveToSibling();
}

void ParseAudienceRestrictionContent(NodeFilterIterator it, AudienceRestrictionType& restriction) {
  do {
    std::string audience;
    ParseTextElement(it, "Audience", audience);
    restriction.audience.insert(audience);
  } while (!it.AtEnd());
}

}  // namespace

// ---- Strictness checks ---------------------------------------------------------------------

QName LocalName(const char* name) { return QName("", name); }

bool ElementQNameIs(const ElementNode* e, const char* localName, const char* ns) {
  if (e == nullptr || e->GetLocalName() != localName) return false;
  std::string boundNamespace;
  return e->LookupNamespace(e->GetPrefix(), boundNamespace) && boundNamespace == ns;
}

bool ElementXsiTypeIs(const ElementNode* e, const QName& type) {
  QName actual;
  return GetXsiType(e, actual) && actual == type;
}

void RequireElementQName(const ElementNode* e, const char* localName, const char* ns) {
  if (e == nullptr || e->GetLocalName() != localName) {
    throw ParseException(std::string("Expected element '") + localName + "' not found.");
  }
  if (!ElementQNameIs(e, localName, ns)) {
    throw ParseException("Element '" + e->GetLocalName() + "' has unexpected namespace");
  }
}

void RequireElementAttributesNames(const ElementNode* e, const std::vector<std::string>& required,
                                   const std::vector<std::string>& optional) {
  const std::vector<std::string> names = e->GetAttributeNames();
  std::set<std::string> remaining(names.begin(), names.end());
  for (const std::string& name : required) {
    if (remaining.erase(name) == 0) ThrowMissingAttribute(e, name);
  }
  for (const std::string& name : optional) remaining.erase(name);
  for (const std::string& name : remaining) {
    if (!IsNamespaceDeclaration(name)) {
      throw ParseException("Unexpected attributes on element '" + e->GetLocalName() + "'");
    }
  }
}

void RequireElementAttributesQNames(const ElementNode* e, const std::vector<QName>& required,
                                    const std::vector<QName>& optional) {
  const std::vector<std::string> names = e->GetAttributeNames();
  const std::set<std::string> ordered(names.begin(), names.end());
  // Counted as a set: two spellings of one QName (two prefixes bound to one namespace) count once.
  std::set<QName> found;
  for (const std::string& name : ordered) {
    if (IsNamespaceDeclaration(name)) continue;
    QName qname;
    ResolveQName(e, name, "", qname);
    if (std::find(required.begin(), required.end(), qname) != required.end()) {
      found.insert(qname);
    } else if (std::find(optional.begin(), optional.end(), qname) == optional.end()) {
      throw ParseException("Unexpected attribute '" + qname.ToString() + "' on element '" + e->GetLocalName() + "'");
    }
  }
  if (found.size() == std::set<QName>(required.begin(), required.end()).size()) return;

  std::string ignored;
  auto missing = std::find_if(required.begin(), required.end(),
                              [&](const QName& name) { return !e->GetAttribute(name, ignored); });
  TAMBER_VERIFY_TEXT(missing != required.end(), "missing != required.end()");
  ThrowMissingAttribute(e, missing->ToString());
}

void RequireNoAttributes(const ElementNode* e) { RequireElementAttributesNames(e, {}, {}); }

void RequireEmptyElement(NodeFilterIterator it) {
  if (!it.GetChild().AtEnd()) {
    throw ParseException("Element '" + IteratorToElement(it)->GetLocalName() + "' must be empty");
  }
}

void RequireTextualContent(NodeFilterIterator it, std::string& text) {
  const NodeFilterIterator child = it.GetChild();
  NodeFilterIterator next = child;
  if (child.AtEnd() || child.GetNode()->GetKind() != Tamber::Xml::Node::TEXT || !next.MoveToSibling().AtEnd()) {
    throw ParseException("Element '" + IteratorToElement(it)->GetLocalName() +
                         "' must only have textual content (but has extra children or is empty).");
  }
  text = GetText(Tamber::DynamicCast<Tamber::Xml::TextNode>(child.GetNode()));
}

void GetDateAttribute(const ElementNode* e, const char* name, Tamber::System::DateTime& date) {
  std::string value;
  e->GetAttribute(name, value);
  try {
    date = Tamber::System::DateTime(value);
  } catch (const Tamber::DateTimeFormatException&) {
    throw ParseException(e->GetLocalName() + "/@" + name + " is not a date");
  }
}

void GetBoolAttribute(const ElementNode* e, const char* name, bool& value) {
  std::string text;
  e->GetAttribute(name, text);
  text = Tamber::StringUtil::ToLower(text);
  if (text == "1" || text == "true") {
    value = true;
  } else if (text == "0" || text == "false") {
    value = false;
  } else {
    throw ParseException(e->GetLocalName() + "/@" + name + " is not a Boolean");
  }
}

void GetULongOptionalAttribute(const ElementNode* e, const char* name, boost::optional<unsigned long long>& value) {
  std::string text;
  if (!e->GetAttribute(name, text)) return;
  try {
    value = boost::numeric_cast<unsigned long long>(boost::lexical_cast<long long>(text));
  } catch (const std::bad_cast&) {
    throw ParseException(e->GetLocalName() + "/@" + name + " is not a non-negative integer.");
  }
}

// ---- Element readers -----------------------------------------------------------------------

void ParseNameIDType(const NodeFilterIterator& it, NameIDType& nameId) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementAttributesNames(e, {"Format"}, {});
  nameId.format = RequireAttribute(e, "Format");
  RequireTextualContent(it, nameId.value);
}

void ParseSamlAssertionElement(NodeFilterIterator& it, SamlAssertionType& assertion) {
  ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "Assertion", Saml::SAML_NS);
  RequireElementAttributesNames(e, {"Version", "ID", "IssueInstant"}, {});
  assertion.version = RequireAttribute(e, "Version");
  assertion.id = RequireAttribute(e, "ID");
  GetDateAttribute(e, "IssueInstant", assertion.issueInstant);

  NodeFilterIterator child = it.GetChild();
  ParseSamlIssuerElement(child, assertion.issuer);
  ParseTokenSignature(child, e, assertion.signature);
  ParseSubjectElement(child, assertion.subject);
  ParseConditionsElement(child, assertion.conditions);
  TryParseAdviceElement(child, assertion.advice);
  ParseAuthnStatementElement(child, assertion.authnStatement);
  if (!child.AtEnd()) {
    assertion.attributeStatement = AttributeStatementType();
    ParseAttributeStatementElement(child, *assertion.attributeStatement);
  }
  RequireEnd(child, "Unexpected elements under Assertion");
  it.MoveToSibling();
}

void ParseSamlIssuerElement(NodeFilterIterator& it, NameIDType& issuer) {
  RequireElementQName(IteratorToElement(it), "Issuer", Saml::SAML_NS);
  ParseNameIDType(it, issuer);
  it.MoveToSibling();
}

void ParseSubjectElement(NodeFilterIterator& it, SubjectType& subject) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "Subject", Saml::SAML_NS);
  RequireNoAttributes(e);
  NodeFilterIterator child = it.GetChild();
  ParseSubjectNameIdElement(child, subject.nameId);
  ParseSubjectConfirmationElement(child, subject.subjectConfirmation);
  RequireEnd(child, "Unexpected elements after SubjectConfirmation");
  it.MoveToSibling();
}

void ParseSubjectNameIdElement(NodeFilterIterator& it, NameIDType& nameId) {
  RequireElementQName(IteratorToElement(it), "NameID", Saml::SAML_NS);
  ParseNameIDType(it, nameId);
  it.MoveToSibling();
}

void ParseSubjectConfirmationElement(NodeFilterIterator& it, SubjectConfirmationType& confirmation) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "SubjectConfirmation", Saml::SAML_NS);
  RequireElementAttributesNames(e, {"Method"}, {});
  const std::string method = RequireAttribute(e, "Method");
  if (method == Saml::CONFIRMATION_BEARER) {
    confirmation.method = SamlToken::CONFIRM_BEARER;
  } else if (method == Saml::CONFIRMATION_HOLDER_OF_KEY) {
    confirmation.method = SamlToken::CONFIRM_HOLDER_OF_KEY;
  } else {
    throw ParseException("Unknown subject confirmation method: '" + method + "'");
  }

  NodeFilterIterator child = it.GetChild();
  if (ElementQNameIs(IteratorToElement(child), "NameID", Saml::SAML_NS)) {
    NameIDType delegateId;
    ParseNameIDType(child, delegateId);
    confirmation.nameId = delegateId;
    child.MoveToSibling();
  } else {
    confirmation.nameId.reset();
  }
  ParseSubjectConfirmationDataElement(child, confirmation);
  RequireEnd(child, "Unexpected elements after SubjectConfirmationData");
  it.MoveToSibling();
}

void ParseSubjectConfirmationDataElement(NodeFilterIterator& it, SubjectConfirmationType& confirmation) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "SubjectConfirmationData", Saml::SAML_NS);
  SubjectConfirmationDataType& data = confirmation.subjectConfirmationData;
  if (confirmation.method == SamlToken::CONFIRM_BEARER) {
    RequireEmptyElement(it);
    RequireElementAttributesNames(e, {"NotOnOrAfter"}, {});
    GetDateAttribute(e, "NotOnOrAfter", data.notOnOrAfter);
  } else {
    RequireElementAttributesQNames(e, {XSI_TYPE}, {LocalName("NotOnOrAfter")});
    QName type;
    GetXsiType(e, type);
    if (type != KEY_INFO_CONFIRMATION_DATA_TYPE) {
      throw ParseException("Invalid SubjectConfirmationData type: '" + type.ToString() + "'");
    }
    NodeFilterIterator child = it.GetChild();
    ParseSubjectConfirmationDataKeyInfoElement(child, data);
    RequireEnd(child, "Unexpected elements after SubjectConfirmationData/KeyInfo");
  }
  it.MoveToSibling();
}

void ParseSubjectConfirmationDataKeyInfoElement(NodeFilterIterator& it, SubjectConfirmationDataType& data) {
  const ElementNode* keyInfo = IteratorToElement(it);
  RequireElementQName(keyInfo, "KeyInfo", Saml::DSIG_NS);
  RequireNoAttributes(keyInfo);

  NodeFilterIterator x509Data = it.GetChild();
  RequireElementQName(IteratorToElement(x509Data), "X509Data", Saml::DSIG_NS);
  RequireNoAttributes(IteratorToElement(x509Data));

  NodeFilterIterator x509Certificate = x509Data.GetChild();
  RequireElementQName(IteratorToElement(x509Certificate), "X509Certificate", Saml::DSIG_NS);
  RequireNoAttributes(IteratorToElement(x509Certificate));
  std::string base64;
  RequireTextualContent(x509Certificate, base64);
  RequireEnd(x509Certificate.MoveToSibling(), "Unexpected elements after X509Certificate");
  RequireEnd(x509Data.MoveToSibling(), "Unexpected elements after X509Data");

  // Both failures are malformed token content: the caller expects them as ParseException.
  try {
    const std::vector<unsigned char> der = Tamber::StringUtil::Base64Decode(base64);
    Tamber::Crypto::CreateCertificate(der.data(), der.size(), data.certificate);
  } catch (const Tamber::Base64FormatException& e) {
    throw ParseException(std::string("Invalid X509Certificate in SubjectConfirmationData/KeyInfo: ") + e.what());
  } catch (const Tamber::Crypto::CryptoException& e) {
    throw ParseException(std::string("Invalid X509Certificate in SubjectConfirmationData/KeyInfo: ") + e.what());
  }
  it.MoveToSibling();
}

void ParseConditionsElement(NodeFilterIterator& it, ConditionsType& conditions) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "Conditions", Saml::SAML_NS);
  RequireElementAttributesNames(e, {"NotBefore", "NotOnOrAfter"}, {});
  GetDateAttribute(e, "NotBefore", conditions.notBefore);
  GetDateAttribute(e, "NotOnOrAfter", conditions.notOnOrAfter);

  NodeFilterIterator child = it.GetChild();
  while (!child.AtEnd()) {
    if (!conditions.delegationRestriction) {
      TryParseDelegationRestriction(child, conditions.delegationRestriction);
      if (conditions.delegationRestriction) continue;
    }
    if (!conditions.audienceRestriction) {
      TryParseAudienceRestriction(child, conditions.audienceRestriction);
      if (conditions.audienceRestriction) continue;
    }
    if (!conditions.proxyRestriction) {
      TryParseProxyRestriction(child, conditions.proxyRestriction);
      if (conditions.proxyRestriction) continue;
    }
    if (!conditions.renewRestriction) {
      TryParseRenewRestriction(child, conditions.renewRestriction);
      if (conditions.renewRestriction) continue;
    }
    const ElementNode* unknown = IteratorToElement(child);
    throw ParseException(std::string("Unknown or duplicate restriction node under Conditions") +
                         (unknown != nullptr ? ": " + unknown->GetLocalName() : std::string()));
  }
  it.MoveToSibling();
}

void TryParseDelegationRestriction(NodeFilterIterator& it, boost::optional<DelegationRestrictionType>& restriction) {
  const ElementNode* e = IteratorToElement(it);
  if (!ElementQNameIs(e, "Condition", Saml::SAML_NS) || !ElementXsiTypeIs(e, DELEGATION_RESTRICTION_TYPE)) return;
  RequireElementAttributesQNames(e, {XSI_TYPE}, {});
  DelegationRestrictionType parsed;
  NodeFilterIterator child = it.GetChild();
  do {
    DelegateType delegate;
    ParseDelegate(child, delegate);
    parsed.delegate.push_back(delegate);
  } while (!child.AtEnd());
  restriction = parsed;
  it.MoveToSibling();
}

void ParseDelegate(NodeFilterIterator& it, DelegateType& delegate) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "Delegate", Saml::DEL_NS);
  RequireElementAttributesNames(e, {"DelegationInstant"}, {});
  GetDateAttribute(e, "DelegationInstant", delegate.delegationInstant);
  // What follows the NameID is the delegate's own business.
  const NodeFilterIterator nameId = it.GetChild();
  RequireElementQName(IteratorToElement(nameId), "NameID", Saml::SAML_NS);
  ParseNameIDType(nameId, delegate.nameId);
  it.MoveToSibling();
}

void TryParseAudienceRestriction(NodeFilterIterator& it, boost::optional<AudienceRestrictionType>& restriction) {
  if (!ElementQNameIs(IteratorToElement(it), "AudienceRestriction", Saml::SAML_NS)) return;
  AudienceRestrictionType parsed;
  ParseAudienceRestrictionContent(it.GetChild(), parsed);
  restriction = parsed;
  it.MoveToSibling();
}

void TryParseProxyRestriction(NodeFilterIterator& it, boost::optional<ProxyRestrictionType>& restriction) {
  const ElementNode* e = IteratorToElement(it);
  if (!ElementQNameIs(e, "ProxyRestriction", Saml::SAML_NS)) return;
  RequireEmptyElement(it);
  RequireElementAttributesNames(e, {"Count"}, {});
  ProxyRestrictionType parsed;
  GetULongOptionalAttribute(e, "Count", parsed.count);
  restriction = parsed;
  it.MoveToSibling();
}

void TryParseRenewRestriction(NodeFilterIterator& it, boost::optional<RenewRestrictionType>& restriction) {
  const ElementNode* e = IteratorToElement(it);
  if (!ElementQNameIs(e, "Condition", Saml::SAML_NS) || !ElementXsiTypeIs(e, RENEW_RESTRICTION_TYPE)) return;
  RequireElementAttributesQNames(e, {XSI_TYPE},
                                 {LocalName("Count"), LocalName("Postdatable"), LocalName("RenewExpired")});
  RenewRestrictionType parsed;
  GetULongOptionalAttribute(e, "Count", parsed.count);
  restriction = parsed;
  it.MoveToSibling();
}

void TryParseAdviceElement(NodeFilterIterator& it, boost::optional<AdviceType>& advice) {
  const ElementNode* e = IteratorToElement(it);
  if (!ElementQNameIs(e, "Advice", Saml::SAML_NS)) return;
  RequireNoAttributes(e);
  AdviceType parsed;
  NodeFilterIterator child = it.GetChild();
  do {
    Advice entry;
    ParseRsaAdviceElement(child, entry);
    parsed.advice.push_back(entry);
  } while (!child.AtEnd());
  advice = parsed;
  it.MoveToSibling();
}

void ParseRsaAdviceElement(NodeFilterIterator& it, Advice& advice) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "RSAAdvice", Saml::RSAEXT_NS);
  RequireElementAttributesNames(e, {"AdviceSource"}, {});
  advice.source = RequireAttribute(e, "AdviceSource");
  NodeFilterIterator child = it.GetChild();
  do {
    AttributeType attribute;
    ParseAttributeElement(child, attribute);
    advice.attributes.push_back(AdviceAttribute{attribute.name, attribute.attributeValue});
  } while (!child.AtEnd());
  it.MoveToSibling();
}

void ParseAuthnStatementElement(NodeFilterIterator& it, AuthnStatementType& statement) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "AuthnStatement", Saml::SAML_NS);
  RequireElementAttributesNames(e, {"AuthnInstant"}, {});
  GetDateAttribute(e, "AuthnInstant", statement.authnInstant);
  NodeFilterIterator child = it.GetChild();
  ParseAuthnContextElement(child, statement.authnContext);
  RequireEnd(child, "Unexpected elements after AuthnContext");
  it.MoveToSibling();
}

void ParseAuthnContextElement(NodeFilterIterator& it, AuthnContextType& context) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "AuthnContext", Saml::SAML_NS);
  RequireNoAttributes(e);
  NodeFilterIterator child = it.GetChild();
  ParseTextElement(child, "AuthnContextClassRef", context.authnContextClassRef);
  RequireEnd(child, "Unexpected elements after AuthnContextClassRef");
  it.MoveToSibling();
}

void ParseAttributeStatementElement(NodeFilterIterator& it, AttributeStatementType& statement) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "AttributeStatement", Saml::SAML_NS);
  RequireNoAttributes(e);
  NodeFilterIterator child = it.GetChild();
  do {
    AttributeType attribute;
    ParseAttributeElement(child, attribute);
    statement.attribute.push_back(attribute);
  } while (!child.AtEnd());
  it.MoveToSibling();
}

void ParseAttributeElement(NodeFilterIterator& it, AttributeType& attribute) {
  const ElementNode* e = IteratorToElement(it);
  RequireElementQName(e, "Attribute", Saml::SAML_NS);
  RequireElementAttributesNames(e, {"Name", "NameFormat"}, {"FriendlyName"});
  attribute.name = RequireAttribute(e, "Name");
  attribute.nameFormat = RequireAttribute(e, "NameFormat");
  e->GetAttribute("FriendlyName", attribute.friendlyName);

  NodeFilterIterator child = it.GetChild();
  while (!child.AtEnd()) {
    RequireElementQName(IteratorToElement(child), "AttributeValue", Saml::SAML_NS);
    std::string value;
    if (!child.GetChild().AtEnd()) RequireTextualContent(child, value);
    attribute.attributeValue.push_back(value);
    child.MoveToSibling();
  }
  it.MoveToSibling();
}

}  // namespace SsoClient
