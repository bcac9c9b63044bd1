#ifndef SSOCLIENT_XMLCOMMONBUILDERS_H
#define SSOCLIENT_XMLCOMMONBUILDERS_H

// Outgoing messages are described as trees of small immutable builders and turned into XML only
// when sent. A builder may be shared by several trees and built several times; each build makes
// fresh nodes (except a pre-built element, which can be placed only once).

#include <initializer_list>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "ssoClient/SamlToken.h"
#include "tamber/Ref.h"
#include "tamber/xml/Dom.h"

namespace SsoClient {

class XMLBaseBuilder {
 public:
  // Creates the element and stores it in `out`, replacing what `out` held.
  virtual void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const = 0;

 protected:
  // Builders are owned by shared pointers made from their concrete type.
  ~XMLBaseBuilder() = default;
};

using BuilderPtr = boost::shared_ptr<const XMLBaseBuilder>;
// Attribute name (qualified as written, "xmlns:p" included) to value; set in the map's order.
using AttributeMap = std::map<std::string, std::string>;

// An element "prefix:localName" with attributes and no content.
class ElementBuilderImpl final : public XMLBaseBuilder {
 public:
  ElementBuilderImpl(const std::string& prefix, const std::string& localName, const AttributeMap& attributes);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  std::string _prefix;
  std::string _localName;
  AttributeMap _attributes;
};

// An element with attributes and one text child.
class TextElementBuilderImpl final : public XMLBaseBuilder {
 public:
  TextElementBuilderImpl(const std::string& prefix, const std::string& localName, const AttributeMap& attributes,
                         const std::string& text);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  ElementBuilderImpl _element;
  std::string _text;
};

// Hands out an element that already exists instead of creating one. The element can stand in
// one tree only: a build after it has been placed raises Tamber::InvalidStateException rather
// than moving it out of the tree that holds it.
class PreBuiltElementImpl final : public XMLBaseBuilder {
 public:
  explicit PreBuiltElementImpl(const Tamber::Ref<Tamber::Xml::ElementNode>& element);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  Tamber::Ref<Tamber::Xml::ElementNode> _element;
};

// The element of a root builder followed by the elements of its children, in the order added.
class XMLCompositeBuilder final : public XMLBaseBuilder {
 public:
  explicit XMLCompositeBuilder(BuilderPtr rootBuilder);
  // Appends `child`; a null child is ignored, so optional parts need no test at the call site.
  XMLCompositeBuilder& Add(BuilderPtr child);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  BuilderPtr _rootBuilder;
  std::vector<BuilderPtr> _children;
};

BuilderPtr ElementBuilder(const std::string& prefix, const std::string& localName, const AttributeMap& attributes);
BuilderPtr ElementBuilder(const std::string& prefix, const std::string& localName);
BuilderPtr TextElementBuilder(const std::string& prefix, const std::string& localName, const AttributeMap& attributes,
                              const std::string& text);
BuilderPtr TextElementBuilder(const std::string& prefix, const std::string& localName, const std::string& text);
// A composite of `root` with `children` added in order (null children skipped).
boost::shared_ptr<XMLCompositeBuilder> CompositeBuilder(BuilderPtr root, std::initializer_list<BuilderPtr> children);

// The assertion element of `token`, parsed afresh from its XML and detached from its document.
BuilderPtr InsertSamlTokenBuilder(const SamlToken& token);

// The XML text of the element `builder` builds, exactly as the serialiser writes it.
std::string SerializeToXML(const BuilderPtr& builder);
// Builds `child` and appends the result as the last child of `parent`.
void BuildAndAppendChildTo(Tamber::Xml::ElementNode* parent, BuilderPtr child);
// Sets the attribute named `attribute.first` (qualified as written) to `attribute.second`.
void ElementDefineAttribute(Tamber::Xml::ElementNode* element, const std::pair<const std::string, std::string>& attribute);

}  // namespace SsoClient

#endif
