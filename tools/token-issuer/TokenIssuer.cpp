#include "TokenIssuer.h"

#include <set>

#include <boost/algorithm/string/join.hpp>

#include "ssoClient/SamlConstants.h"
#include "ssoClient/SignatureAlgorithms.h"
#include "tamber/Exception.h"
#include "tamber/Stream.h"
#include "tamber/StringUtil.h"
#include "tamber/xml/security/Signature.h"

using Tamber::Ref;
using Tamber::System::DateTime;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;
namespace Saml = SsoClient::Saml;
namespace Algorithms = SsoClient::Algorithms;

namespace TokenIssuer {

const char ENTITY_FORMAT[] = "urn:oasis:names:tc:SAML:2.0:nameid-format:entity";
const char URI_NAME_FORMAT[] = "urn:oasis:names:tc:SAML:2.0:attrname-format:uri";

namespace {

const long long ONE_HOUR_MICROS = 3600LL * 1000000LL;

// Prefixes the issuer writes; a value naming a type carries one of them too.
const char SAML[] = "saml2";
const char DEL[] = "del";
const char RSA[] = "rsa";
const char DS[] = "ds";
const char XS[] = "xs";
const char XSI[] = "xsi";

// Appends elements and text to a growing tree, indenting when asked. It also records the prefixes
// used inside attribute values, which exclusive canonicalisation must be told about.
class TreeBuilder {
 public:
  explicit TreeBuilder(bool indent) : _indent(indent) {}

  Ref<ElementNode> Child(ElementNode* parent, const char* prefix, const char* localName) {
    Ref<ElementNode> element;
    Tamber::Xml::CreateElementNode(prefix, localName, element);
    Append(parent, element.get());
    return element;
  }

  Ref<ElementNode> TextChild(ElementNode* parent, const char* prefix, const char* localName, const std::string& text) {
    Ref<ElementNode> element = Child(parent, prefix, localName);
    Ref<Tamber::Xml::TextNode> textNode;
    Tamber::Xml::CreateTextNode(text, textNode);
    element->AppendChild(textNode.get());
    return element;
  }

  // Appends an element made elsewhere (the ds:Signature).
  void Append(ElementNode* parent, Tamber::Xml::Node* child) {
    Indent(parent, Depth(parent) + 1);
    parent->AppendChild(child);
  }

  // Ends an element's content: the closing tag goes on a line of its own.
  void Close(ElementNode* element) { Indent(element, Depth(element)); }

  void SetXsiType(ElementNode* element, const char* prefix, const char* localName) {
    element->SetAttribute(std::string(XSI) + ":type", std::string(prefix) + ":" + localName);
    _valuePrefixes.insert(prefix);
  }

  std::string ValuePrefixList() const { return boost::algorithm::join(_valuePrefixes, " "); }

 private:
  static int Depth(const Tamber::Xml::Node* node) {
    int depth = 0;
    for (const Tamber::Xml::Node* parent = node->GetParent();
         parent != nullptr && parent->GetKind() == Tamber::Xml::Node::ELEMENT; parent = parent->GetParent()) {
      ++depth;
    }
    return depth;
  }

  void Indent(ElementNode* parent, int depth) {
    if (!_indent) return;
    Ref<Tamber::Xml::TextNode> whitespace;
    Tamber::Xml::CreateTextNode("\n" + std::string(2 * depth, ' '), whitespace);
    parent->AppendChild(whitespace.get());
  }

  bool _indent;
  std::set<std::string> _valuePrefixes;
};

void AddNameId(TreeBuilder& tree, ElementNode* parent, const std::string& format, const std::string& value) {
  tree.TextChild(parent, SAML, "NameID", value)->SetAttribute("Format", format);
}

void AddX509Certificate(TreeBuilder& tree, ElementNode* x509Data, const Tamber::Crypto::Certificate& certificate) {
  tree.TextChild(x509Data, DS, "X509Certificate", Tamber::StringUtil::Base64Encode(certificate.GetDer()));
  tree.Close(x509Data);
}

void AddSubject(TreeBuilder& tree, ElementNode* assertion, const TokenRecord& record) {
  Ref<ElementNode> subject = tree.Child(assertion, SAML, "Subject");
  AddNameId(tree, subject.get(), record.subjectFormat, record.subject);
  Ref<ElementNode> confirmation = tree.Child(subject.get(), SAML, "SubjectConfirmation");
  const bool bearer = record.confirmation == SsoClient::SamlToken::CONFIRM_BEARER;
  confirmation->SetAttribute("Method", bearer ? Saml::CONFIRMATION_BEARER : Saml::CONFIRMATION_HOLDER_OF_KEY);
  if (record.delegateId) AddNameId(tree, confirmation.get(), record.delegateId->format, record.delegateId->upn);

  Ref<ElementNode> data = tree.Child(confirmation.get(), SAML, "SubjectConfirmationData");
  if (bearer) {
    data->SetAttribute("NotOnOrAfter", record.bearerNotOnOrAfter.value_or(record.notOnOrAfter).ToString());
  } else {
    if (!record.confirmationCertificate) {
      throw Tamber::InvalidArgumentException("a holder-of-key token needs its confirmation certificate");
    }
    tree.SetXsiType(data.get(), SAML, Saml::KEY_INFO_CONFIRMATION_DATA_TYPE);
    Ref<ElementNode> keyInfo = tree.Child(data.get(), DS, "KeyInfo");
    AddX509Certificate(tree, tree.Child(keyInfo.get(), DS, "X509Data").get(), *record.confirmationCertificate);
    tree.Close(keyInfo.get());
    tree.Close(data.get());
  }
  tree.Close(confirmation.get());
  tree.Close(subject.get());
}

void AddConditions(TreeBuilder& tree, ElementNode* assertion, const TokenRecord& record) {
  Ref<ElementNode> conditions = tree.Child(assertion, SAML, "Conditions");
  conditions->SetAttribute("NotBefore", record.notBefore.ToString());
  conditions->SetAttribute("NotOnOrAfter", record.notOnOrAfter.ToString());
  if (!record.audience.empty()) {
    Ref<ElementNode> restriction = tree.Child(conditions.get(), SAML, "AudienceRestriction");
    for (const std::string& audience : record.audience) tree.TextChild(restriction.get(), SAML, "Audience", audience);
    tree.Close(restriction.get());
  }
  if (record.proxyCount) {
    tree.Child(conditions.get(), SAML, "ProxyRestriction")->SetAttribute("Count", std::to_string(*record.proxyCount));
  }
  if (!record.delegates.empty()) {
    Ref<ElementNode> restriction = tree.Child(conditions.get(), SAML, "Condition");
    tree.SetXsiType(restriction.get(), DEL, Saml::DELEGATION_RESTRICTION_TYPE);
    for (const DelegateRecord& delegate : record.delegates) {
      Ref<ElementNode> element = tree.Child(restriction.get(), DEL, "Delegate");
      element->SetAttribute("DelegationInstant", delegate.delegationInstant.ToString());
      AddNameId(tree, element.get(), delegate.format, delegate.upn);
      tree.Close(element.get());
    }
    tree.Close(restriction.get());
  }
  if (record.renewCount) {
    Ref<ElementNode> restriction = tree.Child(conditions.get(), SAML, "Condition");
    tree.SetXsiType(restriction.get(), RSA, Saml::RENEW_RESTRICTION_TYPE);
    restriction->SetAttribute("Count", std::to_string(*record.renewCount));
  }
  tree.Close(conditions.get());
}

void AddAttribute(TreeBuilder& tree, ElementNode* parent, const AttributeRecord& record) {
  Ref<ElementNode> attribute = tree.Child(parent, SAML, "Attribute");
  if (!record.friendlyName.empty()) attribute->SetAttribute("FriendlyName", record.friendlyName);
  attribute->SetAttribute("Name", record.name);
  attribute->SetAttribute("NameFormat", record.nameFormat);
  for (const std::string& value : record.values) {
    tree.SetXsiType(tree.TextChild(attribute.get(), SAML, "AttributeValue", value).get(), XS, "string");
  }
  tree.Close(attribute.get());
}

void AddAdvice(TreeBuilder& tree, ElementNode* assertion, const TokenRecord& record) {
  if (record.advice.empty()) return;
  Ref<ElementNode> advice = tree.Child(assertion, SAML, "Advice");
  for (const AdviceRecord& entry : record.advice) {
    Ref<ElementNode> rsaAdvice = tree.Child(advice.get(), RSA, "RSAAdvice");
    rsaAdvice->SetAttribute("AdviceSource", entry.source);
    for (const AttributeRecord& attribute : entry.attributes) AddAttribute(tree, rsaAdvice.get(), attribute);
    tree.Close(rsaAdvice.get());
  }
  tree.Close(advice.get());
}

void AddAuthnStatement(TreeBuilder& tree, ElementNode* assertion, const TokenRecord& record) {
  Ref<ElementNode> statement = tree.Child(assertion, SAML, "AuthnStatement");
  statement->SetAttribute("AuthnInstant", record.authnInstant.ToString());
  Ref<ElementNode> context = tree.Child(statement.get(), SAML, "AuthnContext");
  tree.TextChild(context.get(), SAML, "AuthnContextClassRef", record.authnContextClassRef);
  tree.Close(context.get());
  tree.Close(statement.get());
}

std::vector<AttributeRecord> SubjectAttributes(const TokenRecord& record) {
  std::vector<AttributeRecord> attributes;
  if (!record.groups.empty()) {
    attributes.push_back(AttributeRecord{Saml::ATTRIBUTE_GROUP_IDENTITY, record.groups, URI_NAME_FORMAT, "Groups"});
  }
  if (record.isSolution) {
    attributes.push_back(AttributeRecord{Saml::ATTRIBUTE_IS_SOLUTION, {*record.isSolution ? "true" : "false"},
                                         URI_NAME_FORMAT, "isSolution"});
  }
  if (!record.givenName.empty()) {
    attributes.push_back(
        AttributeRecord{Saml::ATTRIBUTE_GIVEN_NAME, {record.givenName}, URI_NAME_FORMAT, "givenName"});
  }
  if (!record.surname.empty()) {
    attributes.push_back(AttributeRecord{Saml::ATTRIBUTE_SURNAME, {record.surname}, URI_NAME_FORMAT, "surname"});
  }
  attributes.insert(attributes.end(), record.otherAttributes.begin(), record.otherAttributes.end());
  return attributes;
}

void AddAttributeStatement(TreeBuilder& tree, ElementNode* assertion, const TokenRecord& record) {
  const std::vector<AttributeRecord> attributes = SubjectAttributes(record);
  if (attributes.empty()) return;
  Ref<ElementNode> statement = tree.Child(assertion, SAML, "AttributeStatement");
  for (const AttributeRecord& attribute : attributes) AddAttribute(tree, statement.get(), attribute);
  tree.Close(statement.get());
}

ElementNode* FindChild(const ElementNode* parent, const char* localName) {
  return parent->FindChildElement(QName(Saml::DSIG_NS, localName));
}

// Names `prefixes` in the InclusiveNamespaces of the reference's exclusive canonicalisation, so
// that the declarations of prefixes used only inside attribute values are signed too.
void AddInclusiveNamespaces(const ElementNode* signature, const std::string& prefixes) {
  if (prefixes.empty()) return;
  const ElementNode* transforms = FindChild(FindChild(FindChild(signature, "SignedInfo"), "Reference"), "Transforms");
  for (Tamber::Xml::Node* node = transforms->GetFirstChild(); node != nullptr; node = node->GetNextSibling()) {
    if (node->GetKind() != Tamber::Xml::Node::ELEMENT) continue;
    ElementNode* transform = Tamber::DynamicCast<ElementNode>(node);
    std::string algorithm;
    if (!transform->GetAttribute("Algorithm", algorithm) || algorithm != Algorithms::EXCLUSIVE_C14N) continue;
    Ref<ElementNode> inclusive;
    Tamber::Xml::CreateElementNode("ec", "InclusiveNamespaces", inclusive);
    inclusive->SetAttribute("xmlns:ec", Algorithms::EXCLUSIVE_C14N);
    inclusive->SetAttribute("PrefixList", prefixes);
    transform->AppendChild(inclusive.get());
  }
}

}  // namespace

TokenRecord::TokenRecord()
    : id("_" + Tamber::StringUtil::GenerateUuid()),
      issueInstant(Tamber::System::GetUtcDateTime()),
      notBefore(issueInstant),
      notOnOrAfter(Tamber::System::DateTimeFromUtc(issueInstant.GetUtcTime() + ONE_HOUR_MICROS, false)),
      authnInstant(issueInstant) {}

void IssueTokenElement(const TokenRecord& record, const Tamber::Crypto::PrivateKey& key,
                       const Tamber::Crypto::Certificate& certificate, Ref<ElementNode>& result) {
  TreeBuilder tree(record.indent);
  Ref<ElementNode> assertion;
  Tamber::Xml::CreateElementNode(SAML, "Assertion", assertion);
  assertion->SetAttribute(std::string("xmlns:") + SAML, Saml::SAML_NS);
  assertion->SetAttribute(std::string("xmlns:") + DEL, Saml::DEL_NS);
  assertion->SetAttribute(std::string("xmlns:") + RSA, Saml::RSAEXT_NS);
  assertion->SetAttribute(std::string("xmlns:") + DS, Saml::DSIG_NS);
  assertion->SetAttribute(std::string("xmlns:") + XS, Saml::XS_NS);
  assertion->SetAttribute(std::string("xmlns:") + XSI, Saml::XSI_NS);
  assertion->SetAttribute("ID", record.id);
  assertion->SetAttribute("IssueInstant", record.issueInstant.ToString());
  assertion->SetAttribute("Version", record.version);

  tree.TextChild(assertion.get(), SAML, "Issuer", record.issuer)->SetAttribute("Format", ENTITY_FORMAT);

  const bool ec = key.GetAlgorithm() == "EC";
  Ref<Tamber::Xml::Security::Signature> signature;
  Tamber::Xml::Security::CreateBlankSignature(assertion.get(), Algorithms::EXCLUSIVE_C14N,
                                              ec ? Algorithms::ECDSA_SHA256 : Algorithms::RSA_SHA256, DS, signature);
  Tamber::Xml::Security::Reference* reference = signature->AddReference("#" + record.id, Algorithms::SHA256);
  reference->AddTransform(Algorithms::ENVELOPED_SIGNATURE);
  reference->AddTransform(Algorithms::EXCLUSIVE_C14N);
  Ref<ElementNode> x509Data;
  Tamber::Xml::CreateElementNode(DS, "X509Data", x509Data);
  TreeBuilder unindented(false);
  AddX509Certificate(unindented, x509Data.get(), certificate);
  signature->SetKeyInfo(x509Data.get());
  // Enveloped: the signature sits right after Issuer when it is computed.
  tree.Append(assertion.get(), signature->GetElement());

  AddSubject(tree, assertion.get(), record);
  AddConditions(tree, assertion.get(), record);
  AddAdvice(tree, assertion.get(), record);
  AddAuthnStatement(tree, assertion.get(), record);
  AddAttributeStatement(tree, assertion.get(), record);
  tree.Close(assertion.get());

  AddInclusiveNamespaces(signature->GetElement(), tree.ValuePrefixList());
  signature->Sign(&key);
  result = assertion;
}

std::string IssueToken(const TokenRecord& record, const Tamber::Crypto::PrivateKey& key,
                       const Tamber::Crypto::Certificate& certificate) {
  Ref<ElementNode> assertion;
  IssueTokenElement(record, key, certificate, assertion);
  Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  assertion->Serialize(writer.get());
  return writer->GetString();
}

}  // namespace TokenIssuer
