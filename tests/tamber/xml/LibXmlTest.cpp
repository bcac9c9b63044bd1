#include "tamber/xml/LibXml.h"

#include <string>

#include <gtest/gtest.h>
#include <libxml/parser.h>

#include "tamber/xml/XmlTestSupport.h"

using Tamber::Ref;
using Tamber::Xml::Document;
using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;
using Tamber::Xml::QName;
using XmlTest::Element;
using XmlTest::Parse;
using XmlTest::Serialize;

namespace {

const xmlChar* X(const char* text) { return reinterpret_cast<const xmlChar*>(text); }

TEST(LibXmlBridge, NodesAddedByLibXml2CallsAreWrappedOnFirstUse) {
  Ref<ElementNode> parent = Element("p", "parent");
  parent->SetAttribute("xmlns:p", "urn:p");
  xmlNodePtr raw = Tamber::Xml::ToXmlNode(parent.get());
  ASSERT_NE(nullptr, raw);
  // As xmlsec does: a node named with a prefix, linked by libxml2.
  xmlNodePtr added = xmlNewDocNode(raw->doc, nullptr, X("p:child"), nullptr);
  xmlAddChild(raw, added);
  Tamber::Xml::NotifySubtreeAdded(added);

  Node* wrapped = Tamber::Xml::WrapXmlNode(added);
  EXPECT_EQ(wrapped, parent->GetFirstChild());
  EXPECT_EQ(added, Tamber::Xml::ToXmlNode(wrapped));
  EXPECT_EQ(wrapped, parent->FindChildElement(QName("urn:p", "child")));
  EXPECT_EQ("<p:parent xmlns:p=\"urn:p\"><p:child/></p:parent>", Serialize(parent.get()));

  Ref<Node> held(wrapped);
  parent.reset();
  EXPECT_EQ("child", Tamber::DynamicCast<ElementNode>(held.get())->GetLocalName());
}

TEST(LibXmlBridge, DocumentWrapperIsTheTreeOfEveryNode) {
  Ref<Document> document = Parse("<r><a/></r>");
  xmlDocPtr doc = Tamber::Xml::ToXmlDoc(document.get());
  EXPECT_EQ(document.get(), Tamber::Xml::WrapXmlDoc(doc));
  EXPECT_EQ(document->GetRootElement(), Tamber::Xml::WrapXmlElement(xmlDocGetRootElement(doc)));
  EXPECT_EQ(nullptr, Tamber::Xml::WrapXmlNode(nullptr));
  EXPECT_EQ(nullptr, Tamber::Xml::ToXmlNode(nullptr));
}

TEST(LibXmlBridge, ForeignNodesHaveNoLibXml2Node) {
  class ForeignNode : public Node {
   public:
    int GetKind() const override { return TEXT; }
    Node* GetFirstChild() const override { return nullptr; }
    Node* GetNextSibling() const override { return nullptr; }
    Node* GetParent() const override { return nullptr; }
    Document* GetOwnerDocument() const override { return nullptr; }
    int GetLine() const override { return 0; }
    int GetColumn() const override { return 0; }
  };
  Ref<Node> foreign(new ForeignNode());
  EXPECT_EQ(nullptr, Tamber::Xml::ToXmlNode(foreign.get()));
  Ref<ElementNode> element = Element("", "e");
  EXPECT_THROW(element->AppendChild(foreign.get()), Tamber::InvalidArgumentException);
}

TEST(LibXmlBridge, AdoptedDocumentIsFreedWithItsLastRef) {
  Tamber::Xml::EnsureLibXmlInitialized();
  const std::string text = "<r><a>t</a></r>";
  xmlDocPtr doc = xmlReadMemory(text.data(), static_cast<int>(text.size()), nullptr, nullptr, XML_PARSE_NONET);
  ASSERT_NE(nullptr, doc);
  Ref<Document> document;
  Tamber::Xml::AdoptXmlDocument(doc, document);
  Ref<ElementNode> root(document->GetRootElement());
  document.reset();
  EXPECT_EQ(text, Serialize(root.get()));
}

TEST(LibXmlBridge, FreeXmlSubtreeDropsTheWrappersOfTheFreedNodes) {
  Ref<Document> document = Parse("<r><a><b/></a><c/></r>");
  ElementNode* root = document->GetRootElement();
  Node* a = root->GetFirstChild();
  ASSERT_NE(nullptr, a->GetFirstChild());
  Tamber::Xml::FreeXmlSubtree(Tamber::Xml::ToXmlNode(a));
  EXPECT_EQ("c", Tamber::DynamicCast<ElementNode>(root->GetFirstChild())->GetLocalName());
  EXPECT_EQ("<r><c/></r>", Serialize(root));
}

TEST(LibXmlBridgeDeathTest, ForgettingAReferencedWrapperEndsTheProcess) {
  Ref<Document> document = Parse("<r><a/></r>");
  Ref<Node> a(document->GetRootElement()->GetFirstChild());
  EXPECT_DEATH(Tamber::Xml::ForgetWrappers(Tamber::Xml::ToXmlNode(a.get())),
               "Verify failed: ForgetWrappers: a node to be freed is still referenced");
}

TEST(LibXmlBridge, ResolvePendingNamespacesBindsWhatADeclarationNowCovers) {
  Ref<ElementNode> root = Element("", "r");
  Ref<ElementNode> child = Element("q", "c");
  root->AppendChild(child.get());
  xmlNewNs(Tamber::Xml::ToXmlNode(root.get()), X("urn:q"), X("q"));
  EXPECT_EQ("", child->GetNamespaceURI());
  Tamber::Xml::ResolvePendingNamespaces(root.get());
  EXPECT_EQ("urn:q", child->GetNamespaceURI());
  Tamber::Xml::ResolvePendingNamespaces(root.get());
  EXPECT_EQ("<r xmlns:q=\"urn:q\"><q:c/></r>", Serialize(root.get()));
}

int g_outerHandlerCalls = 0;
void OuterHandler(void*, xmlErrorPtr) { ++g_outerHandlerCalls; }

TEST(LibXmlErrors, CaptureKeepsErrorsFromStderrAndRestoresTheHandler) {
  Tamber::Xml::EnsureLibXmlInitialized();
  xmlSetStructuredErrorFunc(nullptr, &OuterHandler);
  g_outerHandlerCalls = 0;
  const std::string bad = "<r>\n<a></r>";
  testing::internal::CaptureStderr();
  {
    Tamber::Xml::ScopedXmlErrorCapture capture;
    xmlFreeDoc(xmlReadMemory(bad.data(), static_cast<int>(bad.size()), nullptr, nullptr, 0));
    EXPECT_TRUE(capture.HasError());
    EXPECT_EQ("line 2, column 8: Opening and ending tag mismatch: a line 2 and r", capture.GetFirstError());
  }
  EXPECT_EQ("", testing::internal::GetCapturedStderr());
  EXPECT_EQ(0, g_outerHandlerCalls);

  xmlFreeDoc(xmlReadMemory(bad.data(), static_cast<int>(bad.size()), nullptr, nullptr, 0));
  EXPECT_LT(0, g_outerHandlerCalls);
  xmlSetStructuredErrorFunc(nullptr, nullptr);
}

TEST(LibXmlErrors, DescribeLeavesOutWhatIsUnknown) {
  xmlError error{};
  char message[] = "Something failed\nBytes: 0x00\n";
  error.message = message;
  EXPECT_EQ("Something failed Bytes: 0x00", Tamber::Xml::DescribeXmlError(error));
  error.line = 4;
  EXPECT_EQ("line 4: Something failed Bytes: 0x00", Tamber::Xml::DescribeXmlError(error));
  error.int2 = 12;
  EXPECT_EQ("line 4, column 12: Something failed Bytes: 0x00", Tamber::Xml::DescribeXmlError(error));
}

}  // namespace
