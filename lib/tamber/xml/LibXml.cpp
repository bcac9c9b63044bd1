#include "tamber/xml/LibXml.h"

#include <mutex>
#include <typeinfo>

#include <libxml/parser.h>

#include "tamber/Panic.h"
#include "tamber/xml/Namespace.h"
#include "tamber/xml/NodeImpl.h"
#include "tamber/xml/TreeWalk.h"

namespace Tamber {
namespace Xml {

namespace {

// Swallows libxml2's unstructured messages (they would go to stderr).
void IgnoreGenericError(void*, const char*, ...) {}

std::string OneLine(const char* message) {
  std::string text = message ? message : "";
  while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) text.pop_back();
  for (char& c : text) {
    if (c == '\n') c = ' ';
  }
  return text;
}

Wrapper* ExistingWrapperOf(xmlNodePtr node) {
  return static_cast<Wrapper*>(__atomic_load_n(&node->_private, __ATOMIC_ACQUIRE));
}

Wrapper* CreateWrapper(xmlNodePtr node) {
  switch (node->type) {
    case XML_ELEMENT_NODE:
      return new ElementNodeImpl(node);
    case XML_TEXT_NODE:
    case XML_CDATA_SECTION_NODE:
      return new TextNodeImpl(node);
    case XML_ATTRIBUTE_NODE:
    case XML_NAMESPACE_DECL:
    case XML_DOCUMENT_NODE:
      // Attributes are reached through their element; a document has its wrapper from birth.
      TAMBER_VERIFY_TEXT(false, "WrapXmlNode: a node of a kind that has no wrapper");
      return nullptr;
    default:
      return new OtherNodeImpl(node);
  }
}

}  // namespace

void EnsureLibXmlInitialized() {
  static std::once_flag once;
  std::call_once(once, [] {
    LIBXML_TEST_VERSION;
    xmlInitParser();
  });
}

// --- Errors ------------------------------------------------------------------------------------

std::string DescribeXmlError(const xmlError& error) {
  if (error.line <= 0) return OneLine(error.message);
  std::string text = "line " + std::to_string(error.line);
  if (error.int2 > 0) text += ", column " + std::to_string(error.int2);
  return text + ": " + OneLine(error.message);
}

ScopedXmlErrorCapture::ScopedXmlErrorCapture()
    : _previousHandler(xmlStructuredError),
      _previousContext(xmlStructuredErrorContext),
      _previousGeneric(xmlGenericError),
      _previousGenericContext(xmlGenericErrorContext) {
  xmlSetStructuredErrorFunc(this, &ScopedXmlErrorCapture::OnError);
  xmlSetGenericErrorFunc(nullptr, &IgnoreGenericError);
}

ScopedXmlErrorCapture::~ScopedXmlErrorCapture() {
  xmlSetGenericErrorFunc(_previousGenericContext, _previousGeneric);
  xmlSetStructuredErrorFunc(_previousContext, _previousHandler);
}

void ScopedXmlErrorCapture::OnError(void* capture, xmlErrorPtr error) {
  auto* self = static_cast<ScopedXmlErrorCapture*>(capture);
  if (error == nullptr || error->level < XML_ERR_ERROR || self->HasError()) return;
  self->_firstError = DescribeXmlError(*error);
}

// --- Wrappers ----------------------------------------------------------------------------------

xmlNodePtr ToXmlNode(const Node* node) {
  if (node == nullptr) return nullptr;
  // The exact wrapper classes first: a cross cast to Wrapper searches the whole hierarchy, and
  // building a request converts nodes hundreds of times.
  const std::type_info& type = typeid(*node);
  if (type == typeid(ElementNodeImpl)) return static_cast<const ElementNodeImpl*>(node)->GetXmlNodePtr();
  if (type == typeid(TextNodeImpl)) return static_cast<const TextNodeImpl*>(node)->GetXmlNodePtr();
  const auto* wrapper = dynamic_cast<const Wrapper*>(node);
  return wrapper != nullptr ? wrapper->GetXmlNodePtr() : nullptr;
}

xmlDocPtr ToXmlDoc(const Document* document) { return reinterpret_cast<xmlDocPtr>(ToXmlNode(document)); }

Node* WrapXmlNode(xmlNodePtr node) {
  if (node == nullptr) return nullptr;
  if (Wrapper* existing = ExistingWrapperOf(node)) return existing->AsNode();
  TAMBER_VERIFY_TEXT(node->doc != nullptr && node->doc->_private != nullptr,
                     "WrapXmlNode: the node is not in a tree of the layer");
  Wrapper* created = CreateWrapper(node);
  // Readers of one tree on several threads may race to wrap the same node: the first one wins.
  void* expected = nullptr;
  if (!__atomic_compare_exchange_n(&node->_private, &expected, static_cast<void*>(created), false,
                                   __ATOMIC_ACQ_REL, __ATOMIC_ACQUIRE)) {
    delete created;
    return static_cast<Wrapper*>(expected)->AsNode();
  }
  return created->AsNode();
}

ElementNode* WrapXmlElement(xmlNodePtr node) {
  if (node == nullptr) return nullptr;
  TAMBER_VERIFY(node->type == XML_ELEMENT_NODE);
  return static_cast<ElementNodeImpl*>(WrapXmlNode(node));
}

Document* WrapXmlDoc(xmlDocPtr doc) {
  if (doc == nullptr) return nullptr;
  return TreeOf(reinterpret_cast<xmlNodePtr>(doc));
}

void AdoptXmlDocument(xmlDocPtr doc, Ref<Document>& document) {
  TAMBER_VERIFY(doc != nullptr && doc->_private == nullptr);
  document = new DocumentImpl(doc);
}

void ResolvePendingNamespaces(ElementNode* element) { ResolvePendingNamespaces(ToXmlNode(element)); }

void ResolvePendingNamespaces(xmlNodePtr element) {
  if (element != nullptr && element->type == XML_ELEMENT_NODE) BindUnboundNames(element);
}

void NotifySubtreeAdded(xmlNodePtr subtree) { ResolvePendingNamespaces(subtree); }

void ForgetWrappers(xmlNodePtr subtree) {
  if (subtree->doc != nullptr && subtree->doc->_private != nullptr) TreeOf(subtree)->TakeLooseNode(subtree);
  ForEachInSubtree(subtree, [](xmlNodePtr node) {
    Wrapper* wrapper = ExistingWrapperOf(node);
    if (wrapper == nullptr) return;
    TAMBER_VERIFY_TEXT(wrapper->GetRefCount() == 0, "ForgetWrappers: a node to be freed is still referenced");
    node->_private = nullptr;
    delete wrapper;
  });
}

void FreeXmlSubtree(xmlNodePtr subtree) {
  ForgetWrappers(subtree);
  xmlUnlinkNode(subtree);
  xmlFreeNode(subtree);
}

}  // namespace Xml
}  // namespace Tamber
