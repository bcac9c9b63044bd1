#ifndef TOOLS_STS_SOAPREQUEST_H
#define TOOLS_STS_SOAPREQUEST_H

// A SOAP request as the STS reads it: parsed without network access or DTDs, its envelope,
// security header and timestamp checked, and the refusal that every check ends in.

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>

#include <libxml/tree.h>

namespace DevSts {

// The fault codes the STS answers with.
extern const char FAULT_FAILED_AUTHENTICATION[];  // "wst:FailedAuthentication"
extern const char FAULT_INVALID_REQUEST[];        // "wst:InvalidRequest"
extern const char FAULT_REQUEST_FAILED[];         // "wst:RequestFailed"
extern const char FAULT_INVALID_SECURITY_TOKEN[];  // "wst:InvalidSecurityToken"
extern const char FAULT_UNABLE_TO_RENEW[];         // "wst:UnableToRenew"
extern const char FAULT_MESSAGE_EXPIRED[];         // "wsse:MessageExpired"
extern const char FAULT_FAILED_CHECK[];            // "wsse:FailedCheck"

// A request the STS refuses, with the fault code and text of its answer.
class StsFault : public std::runtime_error {
 public:
  StsFault(const std::string& code, const std::string& message) : std::runtime_error(message), _code(code) {}
  const std::string& GetCode() const { return _code; }

 private:
  std::string _code;
};

struct XmlDocumentDeleter {
  void operator()(xmlDoc* document) const { xmlFreeDoc(document); }
};
using XmlDocument = std::unique_ptr<xmlDoc, XmlDocumentDeleter>;

// Whether `node` is an element with that local name and namespace.
bool IsElement(const xmlNode* node, const char* localName, const char* ns);
// The first child element of `parent` with that local name and namespace, or null.
xmlNode* FindChild(const xmlNode* parent, const char* localName, const char* ns);
// The same, refused with wst:InvalidRequest naming what is missing where.
xmlNode* RequireChild(const xmlNode* parent, const char* localName, const char* ns);
// The text content of `element` (empty for null).
std::string TextOf(const xmlNode* element);
// The value of an attribute (unqualified when `ns` is null); empty when absent.
std::string AttributeOf(const xmlNode* element, const char* name, const char* ns = nullptr);
// The UTC time in microseconds of the wsu:`localName` child of `parent`; refused with
// wst:InvalidRequest when it is missing or not a date and time.
int64_t ReadUtcTime(const xmlNode* parent, const char* localName);
// `element` as text of its own, with the namespace declarations it inherits written on it.
std::string SerializeElement(const xmlNode* element);

struct SoapRequest {
  XmlDocument document;
  xmlNode* header = nullptr;
  xmlNode* security = nullptr;   // wsse:Security
  xmlNode* timestamp = nullptr;  // wsu:Timestamp
  xmlNode* body = nullptr;       // soapenv:Body
  xmlNode* content = nullptr;    // the one element inside soapenv:Body
};

// Parses and checks a request: well-formed, no DOCTYPE, a SOAP 1.1 envelope with a security
// header whose wsu:Timestamp holds `nowMicros` within `toleranceSec`, unique wsu:Id values and
// one element in the body.
SoapRequest ReadSoapRequest(const std::string& text, int64_t nowMicros, int64_t toleranceSec);

}  // namespace DevSts

#endif
