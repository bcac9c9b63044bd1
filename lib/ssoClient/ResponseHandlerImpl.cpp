#include "ssoClient/ResponseHandlerImpl.h"

#include <initializer_list>

#include "ssoClient/SignatureAlgorithms.h"
#include "ssoClient/WireConstants.h"
#include "ssoClient/XmlUtils.h"
#include "tamber/Panic.h"
#include "tamber/StringUtil.h"
#include "tamber/xml/QName.h"
#include "tamber/xml/security/Canonicalizer.h"

namespace SsoClient {

using Tamber::Ref;
using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;
using Tamber::Xml::QName;

namespace {

const QName kFailedAuthentication(Wire::kWsTrust.uri, "FailedAuthentication");
const QName kWstInvalidSecurityToken(Wire::kWsTrust.uri, "InvalidSecurityToken");
const QName kWsseInvalidSecurityToken(Wire::kWsse.uri, "InvalidSecurityToken");
const std::string kValidStatus = std::string(Wire::kWsTrust.uri) + "/status/valid";
const std::string kInvalidStatus = std::string(Wire::kWsTrust.uri) + "/status/invalid";
const char kFormatError[] = "Unexpected XML format";

// The child of `parent` with that local name, whatever its namespace; null for a null parent.
ElementNode* Child(const ElementNode* parent, const char* localName) {
  return parent == nullptr ? nullptr : parent->FindChildElementByLocalName(localName);
}

// Follows a path of local names from `from`; raises the format error when a step is missing.
ElementNode* Follow(ElementNode* from, std::initializer_list<const char*> path) {
  ElementNode* current = from;
  for (const char* localName : path) {
    current = Child(current, localName);
    if (current == nullptr) throw SsoException(kFormatError);
  }
  return current;
}

bool IsAuthenticationFault(const QName& code) {
  return code == kFailedAuthentication || code == kWstInvalidSecurityToken || code == kWsseInvalidSecurityToken;
}

ElementNode* BodyElement(Node* body) {
  TAMBER_VERIFY_TEXT(body != nullptr, "body != __null");
  return Tamber::DynamicCast<ElementNode>(body);
}

std::string ExtractIssuedToken(ElementNode* body) {
  TAMBER_VERIFY_TEXT(body != nullptr, "body != __null");
  return CanonicalizeToString(Follow(
      body, {"RequestSecurityTokenResponseCollection", "RequestSecurityTokenResponse", "RequestedSecurityToken",
             "Assertion"}));
}

std::string ExtractRenewedToken(ElementNode* body) {
  TAMBER_VERIFY_TEXT(body != nullptr, "body != __null");
  return CanonicalizeToString(Follow(body, {"RequestSecurityTokenResponse", "RequestedSecurityToken", "Assertion"}));
}

bool ParseValidationStatus(Node* body) {
  ElementNode* code = Follow(BodyElement(body), {"RequestSecurityTokenResponse", "Status", "Code"});
  const Tamber::Xml::TextNode* text = GetTextNode(code);
  if (text == nullptr) throw SsoException(kFormatError);
  const std::string status = GetText(text);
  if (status == kValidStatus) return true;
  if (status == kInvalidStatus) return false;
  throw SsoException(kFormatError);
}

SPNegoResponse ParseSPNegoResponse(Node* body) {
  ElementNode* bodyElement = BodyElement(body);
  ElementNode* response = Child(bodyElement, "RequestSecurityTokenResponse");
  const bool isCollection = response == nullptr;
  if (isCollection) {
    response = Child(Child(bodyElement, "RequestSecurityTokenResponseCollection"), "RequestSecurityTokenResponse");
  }
  if (response == nullptr) throw SsoException(kFormatError);

  SPNegoResponse result;
  if (!response->GetAttribute(QName("", "Context"), result.contextId)) throw SsoException(kFormatError);
  const std::string leg = GetText(GetTextNode(Child(response, "BinaryExchange")));
  if (!leg.empty()) {
    try {
      result.leg = Tamber::StringUtil::Base64Decode(leg);
    } catch (const Tamber::Base64FormatException&) {
      throw SsoException("Base64 format exception");
    }
  }
  if (!isCollection) {
    // A bare response is an intermediate leg and must carry one.
    if (result.leg.empty()) throw SsoException(kFormatError);
    return result;
  }

  ElementNode* assertion = Follow(response, {"RequestedSecurityToken", "Assertion"});
  const std::string tokenType = GetText(GetTextNode(Child(response, "TokenType")));
  if (tokenType != Wire::kTokenTypeSaml20) {
    throw SsoException("Invalid token type: " + tokenType + " (expected: " + Wire::kTokenTypeSaml20);
  }
  result.token = CanonicalizeToString(assertion);
  return result;
}

}  // namespace

void ParseResponseDocument(Tamber::Reader* response, Ref<ElementNode>& root) {
  Ref<Tamber::Xml::Document> document;
  try {
    ParseXML(response, document);
  } catch (const Tamber::Xml::XMLParseException& e) {
    throw SsoException(std::string("Response is not well-formed XML: ") + e.what());
  }
  root = document ? document->GetRootElement() : nullptr;
}

void CheckForSoapFault(ElementNode* root) {
  TAMBER_VERIFY_TEXT(root != nullptr, "rootNode != __null");
  ElementNode* fault = Child(Child(root, "Body"), "Fault");
  if (fault == nullptr) return;

  ElementNode* faultCode = Child(fault, "faultcode");
  const Tamber::Xml::TextNode* codeText = GetTextNode(faultCode);
  if (codeText == nullptr) throw SsoException("Invalid SOAP response: missing faultcode.");
  const std::string codeAsWritten = GetText(codeText);
  QName code;
  ResolveQName(faultCode, codeAsWritten, Wire::kSoapEnvelope.uri, code);
  const std::string reason = GetText(GetTextNode(Child(fault, "faultstring")));

  if (IsAuthenticationFault(code)) {
    throw InvalidCredentialsException(reason.empty() ? "Authentication failed" : "Authentication failed: " + reason);
  }
  throw SsoException("Unexpected SOAP fault: " + codeAsWritten + "; request failed.");
}

std::string CanonicalizeToString(const ElementNode* element) {
  if (element == nullptr) return "";
  Ref<Tamber::Xml::Security::Canonicalizer> canonicalizer;
  Tamber::Xml::Security::CreateCanonicalizer(Algorithms::C14N_CANONICALIZER_ID, canonicalizer);
  Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  canonicalizer->Canonicalize(element, writer.get());
  return writer->GetString();
}

void ResponseHandlerImpl::HandleAcquireTokenResponse(Tamber::Reader* response, std::string& token) const {
  token = ProcessResponseWith(response, ExtractIssuedToken);
}

bool ResponseHandlerImpl::HandleValidateSubjectResponse(Tamber::Reader* response) const {
  return ProcessResponseWith(response, ParseValidationStatus);
}

void ResponseHandlerImpl::HandleRenewTokenResponse(Tamber::Reader* response, std::string& token) const {
  token = ProcessResponseWith(response, ExtractRenewedToken);
}

void ResponseHandlerImpl::HandleSPNegoResponse(Tamber::Reader* response, SPNegoResponse& result) const {
  const SPNegoResponse parsed = ProcessResponseWith(response, ParseSPNegoResponse);
  result.contextId = parsed.contextId;
  result.leg = parsed.leg;
  result.token = parsed.token;
}

}  // namespace SsoClient
