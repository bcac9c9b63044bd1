#ifndef TAMBER_XML_SECURITY_IDS_H
#define TAMBER_XML_SECURITY_IDS_H

// The attributes that same-document references ("#id") point at, and their registration with
// libxml2 so that xmlsec resolves them. Only what a signature is about to use gets registered:
// never every "Id" of a document.

#include <string>
#include <vector>

#include <libxml/tree.h>

namespace Tamber {
namespace Xml {
namespace Security {

// "ID", "Id" or "id" in any namespace (so also xml:id and wsu:Id).
bool IsIdAttribute(xmlAttrPtr attribute);
// The element's first ID attribute, or null.
xmlAttrPtr FindIdAttribute(xmlNodePtr element);
// The text of an attribute.
std::string GetAttributeValue(xmlAttrPtr attribute);
// Every ID attribute in the subtree of `root` whose value is `id`, in document order.
std::vector<xmlAttrPtr> FindIdAttributes(xmlNodePtr root, const std::string& id);

// Registers `attribute` as its document's ID for its value while it lives (unless libxml2 already
// knows it), and forgets it again on destruction, leaving the document as it was.
class ScopedIdRegistration {
 public:
  explicit ScopedIdRegistration(xmlAttrPtr attribute);
  ~ScopedIdRegistration();
  ScopedIdRegistration(const ScopedIdRegistration&) = delete;
  ScopedIdRegistration& operator=(const ScopedIdRegistration&) = delete;

 private:
  xmlAttrPtr _registered = nullptr;
};

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
