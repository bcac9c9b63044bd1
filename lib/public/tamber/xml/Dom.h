#ifndef TAMBER_XML_DOM_H
#define TAMBER_XML_DOM_H

#include <string>
#include <vector>

#include "tamber/Exception.h"
#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/xml/QName.h"

namespace Tamber {
namespace Xml {

class Document;
class ElementNode;

// Ill-formed or refused XML; the message names the line and what was wrong.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, XMLParseException, Exception);

// A node of a document tree.
//
// Ownership: nodes belong to their tree. A Ref to any node keeps its whole tree alive, so a Ref
// to a document's root element outlives the released document. Plain Node* pointers (as
// iterators hold them) stay valid while anything keeps the tree alive and the node is not moved
// to another tree.
class TAMBER_API Node : public Object {
 public:
  // Node kinds. Text and comment have the fixed numbers 1 and 3.
  enum Kind {
    TEXT = 1,
    ELEMENT = 2,
    COMMENT = 3,
    CDATA_SECTION = 4,
    PROCESSING_INSTRUCTION = 5,
    DOCUMENT = 6,
    OTHER = 7,
  };

  // One of Kind.
  virtual int GetKind() const = 0;
  // Navigation; null where there is no such node. The tree owns the nodes returned.
  virtual Node* GetFirstChild() const = 0;
  virtual Node* GetNextSibling() const = 0;
  virtual Node* GetParent() const = 0;
  // The document the node belongs to (a lone element built by CreateElementNode has one too).
  virtual Document* GetOwnerDocument() const = 0;
  // The position in the parsed text (1-based); 0 for nodes that were built, not parsed.
  virtual int GetLine() const = 0;
  virtual int GetColumn() const = 0;
};

// A text node (kind 1). CDATA sections are nodes of their own kind.
class TAMBER_API TextNode : public Node {
 public:
  // The text (UTF-8).
  virtual std::string GetText() const = 0;
  virtual void SetText(const std::string& text) = 0;
};

// An element.
//
// Names: an element is created from a prefix and a local name and serialises exactly so. Its
// namespace is resolved from the prefix and the declarations in scope; declarations are set like
// attributes ("xmlns:p" or "xmlns"), possibly on an ancestor that the element is appended to
// later, and they never count as plain attributes. A prefix still unbound has no namespace.
class TAMBER_API ElementNode : public Node {
 public:
  // The name as written: "Assertion" and "saml2" for <saml2:Assertion>.
  virtual std::string GetLocalName() const = 0;
  virtual std::string GetPrefix() const = 0;
  // The namespace bound to the element's own prefix in scope; empty when unbound.
  virtual std::string GetNamespaceURI() const = 0;
  // The namespace bound to `prefix` at this element, walking its own declarations and then its
  // ancestors'. The empty prefix asks for the default namespace. False when unbound.
  virtual bool LookupNamespace(const std::string& prefix, std::string& namespaceUri) const = 0;

  // Attributes are read from the element's own attribute list only (never DTD defaults).
  // By qualified name as written ("ID", "wsu:Id", "xsi:type"); false when absent.
  virtual bool GetAttribute(const std::string& qualifiedName, std::string& value) const = 0;
  // By namespace and local name (an unprefixed attribute has the empty namespace).
  virtual bool GetAttribute(const QName& name, std::string& value) const = 0;
  // The qualified names of the attributes as written, in document order, followed by the
  // namespace declarations of the element ("xmlns", "xmlns:p") in the order they were made.
  virtual std::vector<std::string> GetAttributeNames() const = 0;
  // Sets an attribute by qualified name. "xmlns" and "xmlns:p" make namespace declarations (in
  // the order set) and resolve the names of this element and its subtree anew.
  virtual void SetAttribute(const std::string& qualifiedName, const std::string& value) = 0;

  // The first child element with that namespace and local name, or null.
  virtual ElementNode* FindChildElement(const QName& name) const = 0;
  // The first child element with that local name, whatever its namespace, or null.
  virtual ElementNode* FindChildElementByLocalName(const std::string& localName) const = 0;

  // Appends `child` as the last child. A node of another tree (or a detached root) moves into
  // this tree, with its subtree; its prefixes are resolved against the declarations in scope here.
  virtual void AppendChild(Node* child) = 0;

  // Writes the element and its subtree as XML text (UTF-8, no declaration), markup escaped.
  virtual void Serialize(Writer* writer) const = 0;
};

// A document: the owner of a tree.
class TAMBER_API Document : public Node {
 public:
  // The document element, or null when there is none.
  virtual ElementNode* GetRootElement() const = 0;
  // Detaches `child` (the root element, typically) from the document. The detached subtree gets
  // a document of its own, so Refs to it stay valid and it can be appended elsewhere.
  virtual void RemoveChild(Node* child) = 0;
};

// A new element "prefix:localName" (or "localName" for an empty prefix) in a document of its own.
TAMBER_API void CreateElementNode(const std::string& prefix, const std::string& localName,
                                  Ref<ElementNode>& element);
// A new text node, not yet part of any tree until appended.
TAMBER_API void CreateTextNode(const std::string& text, Ref<TextNode>& node);

}  // namespace Xml
}  // namespace Tamber

#endif
