#ifndef TAMBER_XML_SECURITY_CANONICALIZER_H
#define TAMBER_XML_SECURITY_CANONICALIZER_H

#include <string>

#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/xml/Dom.h"

namespace Tamber {
namespace Xml {
namespace Security {

// Writes the canonical form of an element's subtree.
class TAMBER_API Canonicalizer : public Object {
 public:
  // Writes the canonical form of `element` and its subtree to `writer`.
  virtual void Canonicalize(const ElementNode* element, Writer* writer) const = 0;
};

// Algorithms by identifier: "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#" (Canonical XML
// 1.0, inclusive, without comments; the identifier without "#" is accepted too),
// "...#WithComments", "http://www.w3.org/2001/10/xml-exc-c14n#" (exclusive) and
// "...#WithComments". Anything else raises InvalidArgumentException.
TAMBER_API void CreateCanonicalizer(const std::string& algorithmUri, Ref<Canonicalizer>& canonicalizer);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
