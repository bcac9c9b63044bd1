#ifndef TAMBER_XML_LIBXML_H
#define TAMBER_XML_LIBXML_H

// Internal bridge between the layer's DOM objects and the libxml2 tree they wrap. Code of the
// layer that works on libxml2 directly (canonicalisation, signatures) uses these calls; nothing
// here is exported.
//
// Model: every Node is a wrapper kept in `xmlNode::_private` (`xmlDoc::_private` for the document),
// created on first use by WrapXmlNode and freed with its tree. A tree holder owns the xmlDoc and
// counts the Refs on all of its wrappers.
//
// Names of built trees: an element or attribute whose prefix was not bound when it was named keeps
// the qualified name "p:local" in `name` with `ns == NULL` (as libxml2's own parser does for an
// undefined prefix); ResolvePendingNamespaces binds it once a declaration is in scope. Unprefixed
// elements with `ns == NULL` take the default namespace in scope when resolved.

#include <string>

#include <libxml/tree.h>
#include <libxml/xmlerror.h>

#include "tamber/Ref.h"
#include "tamber/xml/Dom.h"

namespace Tamber {
namespace Xml {

// Initialises libxml2 once per process, thread-safely. Never undone: the host may use libxml2
// too, so the layer never calls xmlCleanupParser.
void EnsureLibXmlInitialized();

// The libxml2 node behind a wrapper (the xmlDoc, cast, for a Document). Null for null.
xmlNodePtr ToXmlNode(const Node* node);
xmlDocPtr ToXmlDoc(const Document* document);

// The wrapper of a node of a tree the layer owns, created on first use (stable identity).
// Accepts element, text, CDATA, comment, PI and document nodes; other kinds get a node of kind
// OTHER. Null for null. Must not be called on attribute or namespace nodes.
Node* WrapXmlNode(xmlNodePtr node);
// The same, typed: verifies that `node` is an element.
ElementNode* WrapXmlElement(xmlNodePtr node);
Document* WrapXmlDoc(xmlDocPtr doc);

// Gives `doc` (built or parsed by libxml2 calls) to a new tree holder that owns and frees it.
void AdoptXmlDocument(xmlDocPtr doc, Ref<Document>& document);

// Binds the names of `element` and its subtree that are still unbound (see above) to the
// declarations now in scope. Call before reading the tree as XML (canonicalisation, signing).
void ResolvePendingNamespaces(ElementNode* element);
void ResolvePendingNamespaces(xmlNodePtr element);

// To be called after libxml2/xmlsec calls linked new nodes into a tree of the layer: binds what
// is unbound in `subtree` (wrappers need nothing: they are created on first use).
void NotifySubtreeAdded(xmlNodePtr subtree);

// To be called before libxml2/xmlsec calls free nodes of a tree of the layer (xmlFreeNode,
// xmlNodeSetContent on an element, xmlReplaceNode followed by a free): deletes the wrappers of
// `subtree` and its descendants. Ends the process if one of them is still referenced by a Ref.
void ForgetWrappers(xmlNodePtr subtree);
// Unlinks `subtree` from its tree and frees it with its wrappers (see ForgetWrappers).
void FreeXmlSubtree(xmlNodePtr subtree);

// "line L, column C: message" of a libxml2 structured error (position parts left out when
// unknown), the message on one line without its trailing newline.
std::string DescribeXmlError(const xmlError& error);

// Captures libxml2 errors raised on this thread while it lives (libxml2 2.9 keeps the structured
// error handler per thread) so that nothing is printed to stderr; restores the previous handler
// on destruction.
class ScopedXmlErrorCapture {
 public:
  ScopedXmlErrorCapture();
  ~ScopedXmlErrorCapture();
  ScopedXmlErrorCapture(const ScopedXmlErrorCapture&) = delete;
  ScopedXmlErrorCapture& operator=(const ScopedXmlErrorCapture&) = delete;

  // The first error (level error or fatal) raised since construction, described as by
  // DescribeXmlError; empty when none.
  const std::string& GetFirstError() const { return _firstError; }
  bool HasError() const { return !_firstError.empty(); }

 private:
  static void OnError(void* capture, xmlErrorPtr error);

  std::string _firstError;
  xmlStructuredErrorFunc _previousHandler;
  void* _previousContext;
  xmlGenericErrorFunc _previousGeneric;
  void* _previousGenericContext;
};

}  // namespace Xml
}  // namespace Tamber

#endif
