#include "tamber/xml/NodeImpl.h"

#include <algorithm>
#include <cstdint>

#include "tamber/Panic.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/TreeWalk.h"
#include "tamber/xml/XmlText.h"

namespace Tamber {
namespace Xml {

namespace {

static_assert(sizeof(void*) >= sizeof(std::uint64_t), "the parsed position is packed into a pointer");

Wrapper* ExistingWrapperOf(xmlNodePtr node) {
  return static_cast<Wrapper*>(__atomic_load_n(&node->_private, __ATOMIC_ACQUIRE));
}

std::uint64_t ParsedPositionOf(xmlNodePtr node) {
  return node->type == XML_ELEMENT_NODE ? reinterpret_cast<std::uintptr_t>(node->psvi) : 0;
}

// Deletes the wrappers of `root`'s subtree, leaving the nodes to libxml2.
void DeleteWrappers(xmlNodePtr root, const Wrapper* keep) {
  ForEachInSubtree(root, [keep](xmlNodePtr node) {
    Wrapper* wrapper = ExistingWrapperOf(node);
    if (wrapper == nullptr || wrapper == keep) return;
    node->_private = nullptr;
    delete wrapper;
  });
}

}  // namespace

// --- Wrapper -----------------------------------------------------------------------------------

DocumentImpl* TreeOf(xmlNodePtr node) {
  Wrapper* holder = ExistingWrapperOf(reinterpret_cast<xmlNodePtr>(node->doc));
  TAMBER_VERIFY(holder != nullptr);
  return static_cast<DocumentImpl*>(holder);
}

void Wrapper::AddTreeRef() const {
  _refs.fetch_add(1, std::memory_order_relaxed);
  TreeOf(_node)->AddTreeRefs(1);
}

void Wrapper::ReleaseTreeRef() const {
  DocumentImpl* tree = TreeOf(_node);
  const long previous = _refs.fetch_sub(1, std::memory_order_acq_rel);
  TAMBER_VERIFY(previous > 0);
  // May free this wrapper with its tree.
  tree->ReleaseTreeRefs(1);
}

// --- NodeImpl ----------------------------------------------------------------------------------

template <class Interface>
int NodeImpl<Interface>::GetKind() const {
  switch (_node->type) {
    case XML_TEXT_NODE:
      return Node::TEXT;
    case XML_ELEMENT_NODE:
      return Node::ELEMENT;
    case XML_COMMENT_NODE:
      return Node::COMMENT;
    case XML_CDATA_SECTION_NODE:
      return Node::CDATA_SECTION;
    case XML_PI_NODE:
      return Node::PROCESSING_INSTRUCTION;
    case XML_DOCUMENT_NODE:
      return Node::DOCUMENT;
    default:
      return Node::OTHER;
  }
}

template <class Interface>
Document* NodeImpl<Interface>::GetOwnerDocument() const {
  return TreeOf(_node);
}

template <class Interface>
int NodeImpl<Interface>::GetLine() const {
  const std::uint64_t position = ParsedPositionOf(_node);
  return position != 0 ? static_cast<int>(position >> 32) : _node->line;
}

template <class Interface>
int NodeImpl<Interface>::GetColumn() const {
  return static_cast<int>(ParsedPositionOf(_node) & 0xFFFFFFFFu);
}

template <class Interface>
Node* NodeImpl<Interface>::WrapXmlNodeChecked(xmlNodePtr node) {
  return WrapXmlNode(node);
}

template class NodeImpl<Node>;
template class NodeImpl<TextNode>;
template class NodeImpl<ElementNode>;
template class NodeImpl<Document>;

void SetParsedPosition(xmlNodePtr element, unsigned line, unsigned column) {
  const std::uint64_t position = (static_cast<std::uint64_t>(line) << 32) | column;
  element->psvi = reinterpret_cast<void*>(static_cast<std::uintptr_t>(position));
}

// --- TextNodeImpl ------------------------------------------------------------------------------

std::string TextNodeImpl::GetText() const {
  return _node->content != nullptr ? reinterpret_cast<const char*>(_node->content) : "";
}

void TextNodeImpl::SetText(const std::string& text) {
  RequireXmlText(text, "the text");
  xmlNodeSetContent(_node, reinterpret_cast<const xmlChar*>(text.c_str()));
}

// --- DocumentImpl ------------------------------------------------------------------------------

DocumentImpl::DocumentImpl(xmlDocPtr doc) : NodeImpl(reinterpret_cast<xmlNodePtr>(doc)) {
  if (doc->encoding != nullptr) xmlFree(const_cast<xmlChar*>(doc->encoding));
  // The tree's text is UTF-8 whatever the source was; the serialiser then writes non-ASCII
  // characters of attribute values as they are rather than as character references.
  doc->encoding = xmlStrdup(reinterpret_cast<const xmlChar*>("UTF-8"));
  doc->_private = static_cast<Wrapper*>(this);
}

DocumentImpl::~DocumentImpl() {
  xmlDocPtr doc = GetXmlDoc();
  for (xmlNodePtr node : _looseNodes) {
    DeleteWrappers(node, nullptr);
    xmlFreeNode(node);
  }
  DeleteWrappers(_node, this);
  doc->_private = nullptr;
  xmlFreeDoc(doc);
  for (DocumentImpl* detached : _detachedTrees) detached->ReleaseTreeRefs(1);
}

void DocumentImpl::AddTreeRefs(long count) { _treeRefs.fetch_add(count, std::memory_order_relaxed); }

void DocumentImpl::ReleaseTreeRefs(long count) {
  if (count == 0) return;
  const long previous = _treeRefs.fetch_sub(count, std::memory_order_acq_rel);
  TAMBER_VERIFY(previous >= count);
  if (previous == count) delete this;
}

ElementNode* DocumentImpl::GetRootElement() const {
  return WrapXmlElement(xmlDocGetRootElement(GetXmlDoc()));
}

void DocumentImpl::RemoveChild(Node* child) {
  xmlNodePtr node = ToXmlNode(child);
  if (node == nullptr || node->parent != _node) {
    throw InvalidArgumentException("the node to remove is not a child of the document");
  }
  xmlUnlinkNode(node);
  xmlDocPtr doc = xmlNewDoc(reinterpret_cast<const xmlChar*>("1.0"));
  TAMBER_VERIFY(doc != nullptr);
  // Sharing the dictionary spares copying every name of the subtree.
  if (GetXmlDoc()->dict != nullptr) {
    doc->dict = GetXmlDoc()->dict;
    xmlDictReference(doc->dict);
  }
  auto* tree = new DocumentImpl(doc);
  // This document keeps the detached tree alive while it lives, so that a caller holding only a
  // plain pointer to the detached node may still take a Ref to it.
  tree->AddTreeRefs(1);
  _detachedTrees.push_back(tree);
  MoveSubtree(node, tree, nullptr);
}

void DocumentImpl::AddLooseNode(xmlNodePtr node) { _looseNodes.push_back(node); }

bool DocumentImpl::TakeLooseNode(xmlNodePtr node) {
  auto found = std::find(_looseNodes.begin(), _looseNodes.end(), node);
  if (found == _looseNodes.end()) return false;
  _looseNodes.erase(found);
  return true;
}

// --- Moves -------------------------------------------------------------------------------------

void LinkAsLastChild(xmlNodePtr parent, xmlNodePtr child) {
  child->parent = parent;
  child->next = nullptr;
  child->prev = parent->last;
  if (parent->last != nullptr) {
    parent->last->next = child;
  } else {
    parent->children = child;
  }
  parent->last = child;
}

void MoveSubtree(xmlNodePtr node, DocumentImpl* destination, xmlNodePtr parent) {
  DocumentImpl* source = TreeOf(node);
  xmlNodePtr linkTo = parent != nullptr ? parent : reinterpret_cast<xmlNodePtr>(destination->GetXmlDoc());
  if (source == destination) {
    LinkAsLastChild(linkTo, node);
    return;
  }
  // Adoption clears what it takes for schema or XPath data; the parsed positions live there.
  struct Position {
    xmlNodePtr element;
    void* position;
    unsigned short line;
  };
  std::vector<Position> positions;
  long movedRefs = 0;
  ForEachInSubtree(node, [&](xmlNodePtr current) {
    if (Wrapper* wrapper = ExistingWrapperOf(current)) movedRefs += wrapper->GetRefCount();
    if (ParsedPositionOf(current) != 0) positions.push_back({current, current->psvi, current->line});
  });
  const int adopted = xmlDOMWrapAdoptNode(nullptr, source->GetXmlDoc(), node, destination->GetXmlDoc(), parent, 0);
  TAMBER_VERIFY(adopted == 0);
  for (const Position& saved : positions) {
    saved.element->psvi = saved.position;
    saved.element->line = saved.line;
  }
  LinkAsLastChild(linkTo, node);
  destination->AddTreeRefs(movedRefs);
  // May free the source tree, which no longer holds the subtree.
  source->ReleaseTreeRefs(movedRefs);
}

}  // namespace Xml
}  // namespace Tamber
