#include "ssoClient/xmlCommonBuilders.h"

#include <gtest/gtest.h>

#include "ssoClient/BuiltTreeSupport.h"
#include "ssoClient/XmlUtils.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"
#include "tamber/Stream.h"

namespace SsoClient {
namespace {

using BuiltTree::Build;
using BuiltTree::Serialize;
using Tamber::Ref;
using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;

std::vector<Node*> Children(const Node* node) {
  std::vector<Node*> children;
  for (Node* child = node->GetFirstChild(); child != nullptr; child = child->GetNextSibling()) {
    children.push_back(child);
  }
  return children;
}

TEST(ElementBuilderTest, SetsAttributesInAscendingNameOrderWhateverTheOrderGiven) {
  const AttributeMap attributes{{"OK", "1"}, {"Allow", "2"}, {"xmlns:p", "urn:p"}};
  const Ref<ElementNode> element = Build(ElementBuilder("p", "e", attributes));

  EXPECT_EQ((std::vector<std::string>{"Allow", "OK", "xmlns:p"}), element->GetAttributeNames());
  EXPECT_EQ("<p:e xmlns:p=\"urn:p\" Allow=\"2\" OK=\"1\"/>", SerializeToXML(ElementBuilder("p", "e", attributes)));
  EXPECT_EQ("urn:p", element->GetNamespaceURI());
}

TEST(ElementBuilderTest, WithoutAttributesBuildsABareElement) {
  EXPECT_EQ("<soapenv:Header/>", SerializeToXML(ElementBuilder("soapenv", "Header")));
}

TEST(ElementBuilderTest, QualifiedAttributeNamesAreSetAsWritten) {
  const Ref<ElementNode> element =
      Build(ElementBuilder("a", "e", {{"xmlns:a", "urn:a"}, {"xmlns:x", "urn:x"}, {"x:Id", "v"}}));
  std::string value;
  ASSERT_TRUE(element->GetAttribute(Tamber::Xml::QName("urn:x", "Id"), value));
  EXPECT_EQ("v", value);
}

TEST(ElementBuilderTest, EachBuildMakesAFreshElement) {
  const BuilderPtr builder = ElementBuilder("p", "e", {{"xmlns:p", "urn:p"}});
  const Ref<ElementNode> first = Build(builder);
  const Ref<ElementNode> second = Build(builder);
  EXPECT_NE(first.get(), second.get());
  first->SetAttribute("changed", "yes");
  EXPECT_EQ("<p:e xmlns:p=\"urn:p\"/>", Serialize(second.get()));
}

TEST(TextElementBuilderTest, HoldsItsTextAsTheOnlyChild) {
  const Ref<ElementNode> element = Build(TextElementBuilder("p", "t", {{"xmlns:p", "urn:p"}}, "hello"));
  const std::vector<Node*> children = Children(element.get());
  ASSERT_EQ(1u, children.size());
  EXPECT_EQ(Node::TEXT, children[0]->GetKind());
  EXPECT_EQ("<p:t xmlns:p=\"urn:p\">hello</p:t>", Serialize(element.get()));
}

TEST(TextElementBuilderTest, AnEmptyTextStillMakesOneEmptyTextChild) {
  const Ref<ElementNode> element = Build(TextElementBuilder("p", "t", ""));
  const std::vector<Node*> children = Children(element.get());
  ASSERT_EQ(1u, children.size());
  EXPECT_EQ(Node::TEXT, children[0]->GetKind());
  EXPECT_EQ("", GetText(GetTextNode(element.get())));
}

TEST(TextElementBuilderTest, MarkupInTextAndAttributesIsEscapedAndComesBackIntact) {
  const std::string hostile = "a<b>&c]]>\"'</p:t><x/>";
  const std::string text =
      SerializeToXML(TextElementBuilder("p", "t", {{"xmlns:p", "urn:p"}, {"Name", hostile}}, hostile));
  EXPECT_EQ(std::string::npos, text.find("<x/>"));
  EXPECT_EQ(std::string::npos, text.find("]]>"));

  Ref<Tamber::Xml::Document> document;
  ParseXML(text, document);
  ElementNode* root = document->GetRootElement();
  EXPECT_EQ(1u, Children(root).size());
  EXPECT_EQ(hostile, GetText(GetTextNode(root)));
  std::string attribute;
  ASSERT_TRUE(root->GetAttribute("Name", attribute));
  EXPECT_EQ(hostile, attribute);
}

TEST(XMLCompositeBuilderTest, WithoutChildrenBuildsWhatItsRootBuilds) {
  const BuilderPtr root = TextElementBuilder("p", "t", {{"xmlns:p", "urn:p"}, {"a", "1"}}, "x");
  EXPECT_EQ(SerializeToXML(root), SerializeToXML(BuilderPtr(new XMLCompositeBuilder(root))));
}

TEST(XMLCompositeBuilderTest, ChildrenFollowTheRootsOwnContentInTheOrderAdded) {
  boost::shared_ptr<XMLCompositeBuilder> composite(
      new XMLCompositeBuilder(TextElementBuilder("p", "r", {{"xmlns:p", "urn:p"}}, "text")));
  composite->Add(ElementBuilder("p", "b")).Add(ElementBuilder("p", "a"));
  EXPECT_EQ("<p:r xmlns:p=\"urn:p\">text<p:b/><p:a/></p:r>", SerializeToXML(composite));
}

TEST(XMLCompositeBuilderTest, AddOfNullIsIgnoredAndAChainedAddStillAppends) {
  boost::shared_ptr<XMLCompositeBuilder> composite(new XMLCompositeBuilder(ElementBuilder("p", "r")));
  XMLCompositeBuilder& returned = composite->Add(BuilderPtr()).Add(ElementBuilder("p", "c"));
  EXPECT_EQ(composite.get(), &returned);
  EXPECT_EQ("<p:r><p:c/></p:r>", SerializeToXML(composite));
}

TEST(XMLCompositeBuilderTest, AnOuterCompositeExtendsTheElementOfAnInnerOne) {
  const BuilderPtr inner = CompositeBuilder(ElementBuilder("p", "r"), {ElementBuilder("p", "first")});
  const BuilderPtr outer = CompositeBuilder(inner, {ElementBuilder("p", "second"), ElementBuilder("p", "third")});
  EXPECT_EQ("<p:r><p:first/><p:second/><p:third/></p:r>", SerializeToXML(outer));
  // The inner builder itself is unchanged by being extended.
  EXPECT_EQ("<p:r><p:first/></p:r>", SerializeToXML(inner));
}

TEST(XMLCompositeBuilderTest, ADeclarationOnTheRootBindsThePrefixesOfItsChildren) {
  const Ref<ElementNode> element = Build(
      CompositeBuilder(ElementBuilder("p", "r", {{"xmlns:p", "urn:p"}}), {TextElementBuilder("p", "c", "v")}));
  ElementNode* child = element->FindChildElement(Tamber::Xml::QName("urn:p", "c"));
  ASSERT_NE(nullptr, child);
  EXPECT_EQ("<p:r xmlns:p=\"urn:p\"><p:c>v</p:c></p:r>", Serialize(element.get()));
}

TEST(XMLCompositeBuilderTest, BuildingTwiceGivesIndependentTreesWithTheSameText) {
  const BuilderPtr builder = CompositeBuilder(ElementBuilder("p", "r", {{"xmlns:p", "urn:p"}}),
                                              {TextElementBuilder("p", "a", "1"), ElementBuilder("p", "b")});
  const Ref<ElementNode> first = Build(builder);
  const Ref<ElementNode> second = Build(builder);
  EXPECT_EQ(Serialize(first.get()), Serialize(second.get()));

  BuildAndAppendChildTo(first.get(), ElementBuilder("p", "extra"));
  EXPECT_EQ("<p:r xmlns:p=\"urn:p\"><p:a>1</p:a><p:b/></p:r>", Serialize(second.get()));
}

TEST(XMLCompositeBuilderDeathTest, ANullRootEndsTheProcessNamingTheInvariant) {
  EXPECT_DEATH(XMLCompositeBuilder{BuilderPtr()}, "rootBuilder != __null");
}

TEST(SerializeToXMLTest, WritesNoDeclarationAndNoByteOrderMark) {
  const std::string text = SerializeToXML(ElementBuilder("p", "e"));
  EXPECT_EQ("<p:e/>", text);
}

TEST(BuildAndAppendChildToTest, AppendsAsTheLastChild) {
  const Ref<ElementNode> parent = Build(CompositeBuilder(ElementBuilder("p", "r"), {ElementBuilder("p", "a")}));
  BuildAndAppendChildTo(parent.get(), TextElementBuilder("p", "z", "last"));
  EXPECT_EQ("<p:r><p:a/><p:z>last</p:z></p:r>", Serialize(parent.get()));
}

TEST(ElementDefineAttributeTest, SetsTheNamedAttribute) {
  const Ref<ElementNode> element = Build(ElementBuilder("p", "e"));
  ElementDefineAttribute(element.get(), {"Context", "urn:uuid:1"});
  std::string value;
  ASSERT_TRUE(element->GetAttribute("Context", value));
  EXPECT_EQ("urn:uuid:1", value);
}

class InsertSamlTokenBuilderTest : public ::testing::Test {
 protected:
  InsertSamlTokenBuilderTest()
      : _token(CreateSamlToken(TestSupport::IssueTestToken(TestSupport::HolderOfKeyRecord()),
                               TestSupport::TrustedCertificates())) {}

  boost::shared_ptr<const SamlToken> _token;
};

TEST_F(InsertSamlTokenBuilderTest, YieldsTheAssertionWithItsOwnNameAttributesDeclarationsAndChildren) {
  Ref<Tamber::Xml::Document> original;
  ParseXML(_token->ToXml(), original);

  const Ref<ElementNode> assertion = Build(InsertSamlTokenBuilder(*_token));
  EXPECT_EQ(Serialize(original->GetRootElement()), Serialize(assertion.get()));
  EXPECT_EQ("Assertion", assertion->GetLocalName());
  EXPECT_EQ("urn:oasis:names:tc:SAML:2.0:assertion", assertion->GetNamespaceURI());
  std::string id;
  ASSERT_TRUE(assertion->GetAttribute("ID", id));
  EXPECT_EQ(_token->GetId(), id);
}

TEST_F(InsertSamlTokenBuilderTest, TheAssertionStandsAsAChildWhereTheBuilderWasAdded) {
  const Ref<ElementNode> wrapper = Build(CompositeBuilder(
      ElementBuilder("wst", "RenewTarget", {{"xmlns:wst", "urn:wst"}}), {InsertSamlTokenBuilder(*_token)}));
  const std::vector<Node*> children = Children(wrapper.get());
  ASSERT_EQ(1u, children.size());
  ElementNode* assertion = Tamber::DynamicCast<ElementNode>(children[0]);
  EXPECT_EQ("Assertion", assertion->GetLocalName());
  EXPECT_EQ("urn:oasis:names:tc:SAML:2.0:assertion", assertion->GetNamespaceURI());

  // Parsed again from the text, the embedded assertion is the token's own.
  Ref<Tamber::Xml::Document> reparsed;
  ParseXML(Serialize(wrapper.get()), reparsed);
  Ref<Tamber::Xml::Document> original;
  ParseXML(_token->ToXml(), original);
  ElementNode* embedded = IteratorToElement(
      NodeFilterIterator(reparsed->GetRootElement(), boost::shared_ptr<const NodeFilter>(new SkipWsAndCommentsFilter))
          .GetChild());
  ASSERT_NE(nullptr, embedded);
  EXPECT_EQ(Serialize(original->GetRootElement()), Serialize(embedded));
}

TEST_F(InsertSamlTokenBuilderTest, EachCallYieldsADistinctElement) {
  const Ref<ElementNode> first = Build(InsertSamlTokenBuilder(*_token));
  const Ref<ElementNode> second = Build(InsertSamlTokenBuilder(*_token));
  EXPECT_NE(first.get(), second.get());
}

TEST_F(InsertSamlTokenBuilderTest, APlacedAssertionIsNotMovedOutOfItsTreeByASecondBuild) {
  const BuilderPtr assertion = InsertSamlTokenBuilder(*_token);
  const Ref<ElementNode> tree = Build(CompositeBuilder(ElementBuilder("p", "r"), {assertion}));
  const std::string before = Serialize(tree.get());

  try {
    Build(CompositeBuilder(ElementBuilder("p", "other"), {assertion}));
    FAIL() << "a second placement must be refused";
  } catch (const Tamber::InvalidStateException& e) {
    EXPECT_STREQ("The pre-built element <saml2:Assertion> already stands in a built tree and cannot be placed twice",
                 e.what());
  }
  EXPECT_EQ(before, Serialize(tree.get()));
}

TEST_F(InsertSamlTokenBuilderTest, AnUnplacedAssertionMayBeBuiltAgain) {
  const BuilderPtr assertion = InsertSamlTokenBuilder(*_token);
  const Ref<ElementNode> first = Build(assertion);
  const Ref<ElementNode> second = Build(assertion);
  EXPECT_EQ(first.get(), second.get());
}

}  // namespace
}  // namespace SsoClient
