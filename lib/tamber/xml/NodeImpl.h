#ifndef TAMBER_XML_NODEIMPL_H
#define TAMBER_XML_NODEIMPL_H

// The wrappers that give libxml2 nodes the layer's Node interfaces. One wrapper per xmlNode, kept
// in `_private`; the document wrapper doubles as the holder of its tree and counts the Refs on
// every wrapper of the tree.

#include <atomic>
#include <string>
#include <vector>

#include <libxml/tree.h>

#include "tamber/xml/Dom.h"

namespace Tamber {
namespace Xml {

class DocumentImpl;

// What every wrapper shares, whatever interface it implements.
class Wrapper {
 public:
  explicit Wrapper(xmlNodePtr node) : _node(node) {}
  Wrapper(const Wrapper&) = delete;
  Wrapper& operator=(const Wrapper&) = delete;
  virtual ~Wrapper() = default;

  xmlNodePtr GetXmlNodePtr() const { return _node; }
  // Refs held on this very wrapper (the tree counts them all).
  long GetRefCount() const { return _refs.load(std::memory_order_acquire); }
  virtual Node* AsNode() = 0;

 protected:
  void AddTreeRef() const;
  void ReleaseTreeRef() const;

  xmlNodePtr const _node;

 private:
  mutable std::atomic<long> _refs{0};
};

// The wrapper of `node`'s document tree: the holder that owns the tree.
DocumentImpl* TreeOf(xmlNodePtr node);

template <class Interface>
class NodeImpl : public Interface, public Wrapper {
 public:
  explicit NodeImpl(xmlNodePtr node) : Wrapper(node) {}

  void AddRef() const override { AddTreeRef(); }
  void Release() const override { ReleaseTreeRef(); }
  Node* AsNode() override { return this; }

  int GetKind() const override;
  Node* GetFirstChild() const override { return WrapXmlNodeChecked(_node->children); }
  Node* GetNextSibling() const override { return WrapXmlNodeChecked(_node->next); }
  Node* GetParent() const override { return WrapXmlNodeChecked(_node->parent); }
  Document* GetOwnerDocument() const override;
  int GetLine() const override;
  int GetColumn() const override;

 protected:
  static Node* WrapXmlNodeChecked(xmlNodePtr node);
};

// Text and CDATA sections: character data.
class TextNodeImpl : public NodeImpl<TextNode> {
 public:
  using NodeImpl::NodeImpl;
  std::string GetText() const override;
  void SetText(const std::string& text) override;
};

// Comments, processing instructions and whatever else libxml2 may hold.
class OtherNodeImpl : public NodeImpl<Node> {
 public:
  using NodeImpl::NodeImpl;
};

class ElementNodeImpl : public NodeImpl<ElementNode> {
 public:
  using NodeImpl::NodeImpl;

  std::string GetLocalName() const override;
  std::string GetPrefix() const override;
  std::string GetNamespaceURI() const override;
  bool LookupNamespace(const std::string& prefix, std::string& namespaceUri) const override;
  bool GetAttribute(const std::string& qualifiedName, std::string& value) const override;
  bool GetAttribute(const QName& name, std::string& value) const override;
  std::vector<std::string> GetAttributeNames() const override;
  void SetAttribute(const std::string& qualifiedName, const std::string& value) override;
  ElementNode* FindChildElement(const QName& name) const override;
  ElementNode* FindChildElementByLocalName(const std::string& localName) const override;
  void AppendChild(Node* child) override;
  void Serialize(Writer* writer) const override;

 private:
  void SetNamespaceDeclaration(const xmlChar* prefix, const std::string& uri);
};

class DocumentImpl : public NodeImpl<Document> {
 public:
  // Takes ownership of `doc` (and gives it an encoding: the tree's text is always UTF-8).
  explicit DocumentImpl(xmlDocPtr doc);

  ElementNode* GetRootElement() const override;
  void RemoveChild(Node* child) override;

  xmlDocPtr GetXmlDoc() const { return reinterpret_cast<xmlDocPtr>(_node); }

  // Counting on the whole tree; the tree is freed when the count falls to zero.
  void AddTreeRefs(long count);
  void ReleaseTreeRefs(long count);

  // Nodes of this document that are in no tree yet (a new text node): freed with the document.
  void AddLooseNode(xmlNodePtr node);
  // Forgets `node` as a loose node; false when it was not one.
  bool TakeLooseNode(xmlNodePtr node);

 private:
  ~DocumentImpl() override;

  std::atomic<long> _treeRefs{0};
  std::vector<xmlNodePtr> _looseNodes;
  // Trees that RemoveChild detached from this one, each kept alive by one count until this
  // document is freed.
  std::vector<DocumentImpl*> _detachedTrees;
};

// The parsed position of an element (where its start tag ends, as a SAX locator reports it), kept
// in its `psvi` field (unused otherwise): libxml2 keeps no column and clamps the line at 65535.
void SetParsedPosition(xmlNodePtr element, unsigned line, unsigned column);

// Moves `node` (with its subtree) from its document into `destination`, as a new last child of
// `parent` (an element of `destination`) or as the root element when `parent` is null; the Refs
// held on the subtree's wrappers move along. `node` must not be linked into its own tree any more.
void MoveSubtree(xmlNodePtr node, DocumentImpl* destination, xmlNodePtr parent);

// Links `child` (unlinked, of the same document) as the last child of `parent`. Unlike
// xmlAddChild, never merges adjacent text nodes (that would free a node a Ref may hold).
void LinkAsLastChild(xmlNodePtr parent, xmlNodePtr child);

}  // namespace Xml
}  // namespace Tamber

#endif
