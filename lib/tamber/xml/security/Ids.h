#ifndef TAMBER_XML_SECURITY_IDS_H
#define TAMBER_XML_SECURITY_IDS_H

// The attributes that same-document references ("#id") point at.

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

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
