#include "SoapRequest.h"

#include <libxml/parser.h>

#include "RequestSignature.h"
#include "ssoClient/WireConstants.h"
#include "tamber/Exception.h"
#include "tamber/system/DateTime.h"

namespace DevSts {

const char FAULT_FAILED_AUTHENTICATION[] = "wst:FailedAuthentication";
const char FAULT_INVALID_REQUEST[] = "wst:InvalidRequest";
const char FAULT_REQUEST_FAILED[] = "wst:RequestFailed";
const char FAULT_INVALID_SECURITY_TOKEN[] = "wst:InvalidSecurityToken";
const char FAULT_UNABLE_TO_RENEW[] = "wst:UnableToRenew";
const char FAULT_MESSAGE_EXPIRED[] = "wsse:MessageExpired";
const char FAULT_FAILED_CHECK[] = "wsse:FailedCheck";

namespace {

namespace Wire = SsoClient::Wire;

const xmlChar* Chars(const char* text) { return reinterpret_cast<const xmlChar*>(text); }
const char* Text(const xmlChar* text) { return reinterpret_cast<const char*>(text); }

struct BufferDeleter {
  void operator()(xmlBuffer* buffer) const { xmlBufferFree(buffer); }
};

void CheckTimestamp(const xmlNode* timestamp, int64_t nowMicros, int64_t toleranceSec) {
  const int64_t tolerance = toleranceSec * 1000000;
  const int64_t created = ReadUtcTime(timestamp, "Created");
  const int64_t expires = ReadUtcTime(timestamp, "Expires");
  if (nowMicros > expires + tolerance) {
    throw StsFault(FAULT_MESSAGE_EXPIRED, "The message has expired: its wsu:Timestamp expired at " +
                                              TextOf(FindChild(timestamp, "Expires", Wire::kWsu.uri)) +
                                              ", before the STS's time " +
                                              Tamber::System::DateTimeFromUtc(nowMicros, false).ToString());
  }
  if (created > nowMicros + tolerance) {
    throw StsFault(FAULT_INVALID_REQUEST, "The wsu:Timestamp was created in the future: " +
                                              TextOf(FindChild(timestamp, "Created", Wire::kWsu.uri)));
  }
}

}  // namespace

bool IsElement(const xmlNode* node, const char* localName, const char* ns) {
  return node != nullptr && node->type == XML_ELEMENT_NODE && xmlStrEqual(node->name, Chars(localName)) &&
         node->ns != nullptr && xmlStrEqual(node->ns->href, Chars(ns));
}

xmlNode* FindChild(const xmlNode* parent, const char* localName, const char* ns) {
  if (parent == nullptr) return nullptr;
  for (xmlNode* child = parent->children; child != nullptr; child = child->next) {
    if (IsElement(child, localName, ns)) return child;
  }
  return nullptr;
}

xmlNode* RequireChild(const xmlNode* parent, const char* localName, const char* ns) {
  xmlNode* child = FindChild(parent, localName, ns);
  if (child == nullptr) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected an element ") + localName + " of namespace " + ns +
                                              " inside " + (parent ? Text(parent->name) : "the request") +
                                              ", found none");
  }
  return child;
}

std::string TextOf(const xmlNode* element) {
  if (element == nullptr) return "";
  xmlChar* content = xmlNodeGetContent(element);
  const std::string text = content == nullptr ? "" : Text(content);
  xmlFree(content);
  return text;
}

std::string AttributeOf(const xmlNode* element, const char* name, const char* ns) {
  xmlChar* value = ns == nullptr ? xmlGetNoNsProp(element, Chars(name)) : xmlGetNsProp(element, Chars(name), Chars(ns));
  const std::string text = value == nullptr ? "" : Text(value);
  xmlFree(value);
  return text;
}

int64_t ReadUtcTime(const xmlNode* parent, const char* localName) {
  const std::string text = TextOf(RequireChild(parent, localName, Wire::kWsu.uri));
  try {
    return Tamber::System::DateTime(text).GetUtcTime();
  } catch (const Tamber::Exception&) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected a UTC date and time in wsu:") + localName +
                                              ", found \"" + text + "\"");
  }
}

std::string SerializeElement(const xmlNode* element) {
  XmlDocument document(xmlNewDoc(Chars("1.0")));
  // Copying into a document of its own declares on the copy what it used from its ancestors.
  xmlNode* copy = xmlDocCopyNode(const_cast<xmlNode*>(element), document.get(), 1);
  if (copy == nullptr) throw std::bad_alloc();
  xmlDocSetRootElement(document.get(), copy);
  std::unique_ptr<xmlBuffer, BufferDeleter> buffer(xmlBufferCreate());
  xmlNodeDump(buffer.get(), document.get(), copy, 0, 0);
  return std::string(Text(xmlBufferContent(buffer.get())), static_cast<size_t>(xmlBufferLength(buffer.get())));
}

SoapRequest ReadSoapRequest(const std::string& text, int64_t nowMicros, int64_t toleranceSec) {
  SoapRequest request;
  request.document.reset(
      xmlReadMemory(text.data(), static_cast<int>(text.size()), nullptr, nullptr, XML_PARSE_NONET | XML_PARSE_NOERROR |
                                                                                      XML_PARSE_NOWARNING));
  if (!request.document) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected a well-formed XML SOAP envelope, found text that is not XML");
  }
  if (request.document->intSubset != nullptr) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected a SOAP envelope without DOCTYPE, found a DOCTYPE");
  }
  const xmlNode* envelope = xmlDocGetRootElement(request.document.get());
  if (!IsElement(envelope, "Envelope", Wire::kSoapEnvelope.uri)) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected a SOAP 1.1 Envelope, found the element ") +
                                              Text(envelope->name));
  }
  request.header = RequireChild(envelope, "Header", Wire::kSoapEnvelope.uri);
  request.security = RequireChild(request.header, "Security", Wire::kWsse.uri);
  request.timestamp = RequireChild(request.security, "Timestamp", Wire::kWsu.uri);
  request.body = RequireChild(envelope, "Body", Wire::kSoapEnvelope.uri);
  request.content = xmlFirstElementChild(request.body);
  if (request.content == nullptr || xmlNextElementSibling(request.content) != nullptr) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected exactly one element inside soapenv:Body");
  }
  if (!RegisterWsuIds(request.document.get())) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected unique wsu:Id values, found one used twice");
  }
  CheckTimestamp(request.timestamp, nowMicros, toleranceSec);
  return request;
}

}  // namespace DevSts
