#include "ssoClient/xmlCommonBuilders.h"

#include "ssoClient/Verify.h"
#include "ssoClient/XmlUtils.h"
#include "tamber/Stream.h"

namespace SsoClient {

using Tamber::Ref;
using Tamber::Xml::ElementNode;

ElementBuilderImpl::ElementBuilderImpl(const std::string& prefix, const std::string& localName,
                                       const AttributeMap& attributes)
    : _prefix(prefix), _localName(localName), _attributes(attributes) {}

void ElementBuilderImpl::build(Ref<ElementNode>& out) const {
  Tamber::Xml::CreateElementNode(_prefix, _localName, out);
  for (const auto& attribute : _attributes) {
    ElementDefineAttribute(out.get(), attribute);
  }
}

TextElementBuilderImpl::TextElementBuilderImpl(const std::string& prefix, const std::string& localName,
                                               const AttributeMap& attributes, const std::string& text)
    : _element(prefix, localName, attributes), _text(text) {}

void TextElementBuilderImpl::build(Ref<ElementNode>& out) const {
  _element.build(out);
  Ref<Tamber::Xml::TextNode> text;
  Tamber::Xml::CreateTextNode(_text, text);
  out->AppendChild(text.get());
}

PreBuiltElementImpl::PreBuiltElementImpl(const Ref<ElementNode>& element) : _element(element) {}

void PreBuiltElementImpl::build(Ref<ElementNode>& out) const {
  const Tamber::Xml::Node* parent = _element ? _element->GetParent() : nullptr;
  if (parent != nullptr && parent->GetKind() != Tamber::Xml::Node::DOCUMENT) {
    throw Tamber::InvalidStateException("The pre-built element <" + _element->GetPrefix() + ":" +
                                        _element->GetLocalName() +
                                        "> already stands in a built tree and cannot be placed twice");
  }
  out = _element;
}

XMLCompositeBuilder::XMLCompositeBuilder(BuilderPtr rootBuilder) {
  SSOCLIENT_VERIFY_NOT_NULL(rootBuilder);
  _rootBuilder = std::move(rootBuilder);
}

XMLCompositeBuilder& XMLCompositeBuilder::Add(BuilderPtr child) {
  if (child) {
    _children.push_back(std::move(child));
  }
  return *this;
}

void XMLCompositeBuilder::build(Ref<ElementNode>& out) const {
  _rootBuilder->build(out);
  for (const BuilderPtr& child : _children) {
    BuildAndAppendChildTo(out.get(), child);
  }
}

BuilderPtr ElementBuilder(const std::string& prefix, const std::string& localName, const AttributeMap& attributes) {
  return BuilderPtr(new ElementBuilderImpl(prefix, localName, attributes));
}

BuilderPtr ElementBuilder(const std::string& prefix, const std::string& localName) {
  return ElementBuilder(prefix, localName, AttributeMap());
}

BuilderPtr TextElementBuilder(const std::string& prefix, const std::string& localName, const AttributeMap& attributes,
                              const std::string& text) {
  return BuilderPtr(new TextElementBuilderImpl(prefix, localName, attributes, text));
}

BuilderPtr TextElementBuilder(const std::string& prefix, const std::string& localName, const std::string& text) {
  return TextElementBuilder(prefix, localName, AttributeMap(), text);
}

boost::shared_ptr<XMLCompositeBuilder> CompositeBuilder(BuilderPtr root, std::initializer_list<BuilderPtr> children) {
  boost::shared_ptr<XMLCompositeBuilder> composite(new XMLCompositeBuilder(std::move(root)));
  for (const BuilderPtr& child : children) {
    composite->Add(child);
  }
  return composite;
}

BuilderPtr InsertSamlTokenBuilder(const SamlToken& token) {
  Ref<Tamber::Xml::Document> document;
  ParseXML(token.ToXml(), document);
  Ref<ElementNode> assertion(document->GetRootElement());
  if (assertion) {
    document->RemoveChild(assertion.get());
  }
  return BuilderPtr(new PreBuiltElementImpl(assertion));
}

std::string SerializeToXML(const BuilderPtr& builder) {
  Ref<ElementNode> element;
  builder->build(element);
  Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  element->Serialize(writer.get());
  return writer->GetString();
}

void BuildAndAppendChildTo(ElementNode* parent, BuilderPtr child) {
  Ref<ElementNode> element;
  child->build(element);
  parent->AppendChild(element.get());
}

void ElementDefineAttribute(ElementNode* element, const std::pair<const std::string, std::string>& attribute) {
  element->SetAttribute(attribute.first, attribute.second);
}

}  // namespace SsoClient
