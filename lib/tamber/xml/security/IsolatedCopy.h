#ifndef TAMBER_XML_SECURITY_ISOLATEDCOPY_H
#define TAMBER_XML_SECURITY_ISOLATEDCOPY_H

#include <memory>

#include <libxml/tree.h>

namespace Tamber {
namespace Xml {
namespace Security {

// A copy of an element as the root of a document of its own, so that a signature over it is
// verified on the element alone: "" means the element, "#id" can only resolve inside it, and the
// caller's document is neither changed nor shared with another thread.
//
// The copy canonicalises as the original does in place: every namespace in scope at the original
// is declared on the copy's root (inclusive canonicalisation writes them all there), and with
// `inheritXmlAttributes` the xml:* attributes of the original's ancestors are set on it too
// (Canonical XML 1.0 inherits them; the exclusive form does not).
class IsolatedCopy {
 public:
  // `inner` is a node of `element`'s subtree whose copy GetInner() returns.
  IsolatedCopy(xmlNodePtr element, xmlNodePtr inner, bool inheritXmlAttributes);

  xmlNodePtr GetRoot() const { return xmlDocGetRootElement(_doc.get()); }
  xmlNodePtr GetInner() const { return _inner; }

 private:
  struct DocDeleter {
    void operator()(xmlDocPtr doc) const { xmlFreeDoc(doc); }
  };
  std::unique_ptr<xmlDoc, DocDeleter> _doc;
  xmlNodePtr _inner = nullptr;
};

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
