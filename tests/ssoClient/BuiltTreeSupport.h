#ifndef TESTS_SSOCLIENT_BUILTTREESUPPORT_H
#define TESTS_SSOCLIENT_BUILTTREESUPPORT_H

// Helpers shared by the request-builder suites: build a tree and look at its children.

#include <string>
#include <vector>

#include "ssoClient/xmlCommonBuilders.h"
#include "tamber/Ref.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/XmlTestSupport.h"

namespace BuiltTree {

using XmlTest::Serialize;

inline Tamber::Ref<Tamber::Xml::ElementNode> Build(const SsoClient::BuilderPtr& builder) {
  Tamber::Ref<Tamber::Xml::ElementNode> element;
  builder->build(element);
  return element;
}

inline std::vector<Tamber::Xml::ElementNode*> ChildElements(const Tamber::Xml::ElementNode* element) {
  std::vector<Tamber::Xml::ElementNode*> children;
  for (Tamber::Xml::Node* child = element->GetFirstChild(); child != nullptr; child = child->GetNextSibling()) {
    if (child->GetKind() == Tamber::Xml::Node::ELEMENT) {
      children.push_back(Tamber::DynamicCast<Tamber::Xml::ElementNode>(child));
    }
  }
  return children;
}

// "prefix:local" of each child element, in order.
inline std::vector<std::string> ChildNames(const Tamber::Xml::ElementNode* element) {
  std::vector<std::string> names;
  for (const Tamber::Xml::ElementNode* child : ChildElements(element)) {
    names.push_back(child->GetPrefix() + ":" + child->GetLocalName());
  }
  return names;
}

}  // namespace BuiltTree

#endif
