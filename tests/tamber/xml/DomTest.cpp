#include "tamber/xml/Dom.h"

#include <algorithm>
#include <array>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "tamber/xml/XmlTestSupport.h"

using Tamber::InvalidArgumentException;
using Tamber::Ref;
using Tamber::Xml::Document;
using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;
using Tamber::Xml::TextNode;
using XmlTest::Element;
using XmlTest::Parse;
using XmlTest::Serialize;
using XmlTest::Text;

namespace {

const char kAssertion[] =
    "<saml:Assertion xmlns:saml=\"urn:oasis:names:tc:SAML:2.0:assertion\" ID=\"_a1\">"
    "<saml:Issuer>sts</saml:Issuer>"
    "<saml:Subject><saml:NameID>alice</saml:NameID></saml:Subject>"
    "</saml:Assertion>";

ElementNode* AsElement(Node* node) { return Tamber::DynamicCast<ElementNode>(node); }

// --- Ownership ---------------------------------------------------------------------------------

TEST(DomOwnership, RootRefOutlivesTheReleasedDocument) {
  Ref<Document> document = Parse(kAssertion);
  Ref<ElementNode> root(document->GetRootElement());
  document.reset();
  EXPECT_EQ("Assertion", root->GetLocalName());
  EXPECT_EQ(kAssertion, Serialize(root.get()));
}

TEST(DomOwnership, DocumentRefKeepsTheTreeAfterTheRootRefIsReleased) {
  Ref<Document> document = Parse(kAssertion);
  Ref<ElementNode> root(document->GetRootElement());
  root.reset();
  EXPECT_EQ(kAssertion, Serialize(document->GetRootElement()));
}

TEST(DomOwnership, AnyNodeKeepsItsTreeAlive) {
  Ref<Document> document = Parse(kAssertion);
  Ref<Node> nameId(AsElement(document->GetRootElement()->FindChildElementByLocalName("Subject"))->GetFirstChild());
  document.reset();
  EXPECT_EQ("alice", Tamber::DynamicCast<TextNode>(nameId->GetFirstChild())->GetText());
  EXPECT_EQ("Assertion", AsElement(nameId->GetParent()->GetParent())->GetLocalName());
}

TEST(DomOwnership, WrappersKeepTheirIdentity) {
  Ref<Document> document = Parse(kAssertion);
  ElementNode* root = document->GetRootElement();
  EXPECT_EQ(root, document->GetRootElement());
  EXPECT_EQ(root->GetFirstChild(), root->GetFirstChild());
  EXPECT_EQ(root, root->GetFirstChild()->GetParent());
  EXPECT_EQ(document.get(), root->GetParent());
  EXPECT_EQ(document.get(), root->GetOwnerDocument());
}

enum class ReleaseOrder { ROOT_FIRST, DOCUMENT_FIRST };

class RemoveRootTest : public ::testing::TestWithParam<ReleaseOrder> {};

TEST_P(RemoveRootTest, DetachedRootGetsADocumentOfItsOwn) {
  Ref<Document> document = Parse(kAssertion);
  Ref<ElementNode> root(document->GetRootElement());
  document->RemoveChild(root.get());

  EXPECT_EQ(nullptr, document->GetRootElement());
  EXPECT_EQ(nullptr, document->GetFirstChild());
  Document* own = root->GetOwnerDocument();
  EXPECT_NE(document.get(), own);
  EXPECT_EQ(root.get(), own->GetRootElement());
  EXPECT_EQ(own, root->GetParent());

  if (GetParam() == ReleaseOrder::ROOT_FIRST) {
    root.reset();
    EXPECT_EQ(nullptr, document->GetRootElement());
  } else {
    document.reset();
    EXPECT_EQ(kAssertion, Serialize(root.get()));
  }
}

TEST_P(RemoveRootTest, RootTakenOnlyByPointerStaysUsableWhileTheDocumentLives) {
  Ref<Document> document = Parse(kAssertion);
  ElementNode* root = document->GetRootElement();
  document->RemoveChild(root);
  Ref<ElementNode> taken(root);
  if (GetParam() == ReleaseOrder::ROOT_FIRST) {
    taken.reset();
    document.reset();
  } else {
    document.reset();
    EXPECT_EQ(kAssertion, Serialize(taken.get()));
  }
}

TEST_P(RemoveRootTest, DetachedRootIsAppendedElsewhere) {
  Ref<Document> document = Parse(kAssertion);
  Ref<ElementNode> root(document->GetRootElement());
  document->RemoveChild(root.get());
  Ref<ElementNode> envelope = Element("", "Envelope");
  envelope->AppendChild(root.get());
  if (GetParam() == ReleaseOrder::ROOT_FIRST) {
    root.reset();
    document.reset();
  } else {
    document.reset();
    root.reset();
  }
  EXPECT_EQ(std::string("<Envelope>") + kAssertion + "</Envelope>", Serialize(envelope.get()));
}

INSTANTIATE_TEST_SUITE_P(ReleaseOrders, RemoveRootTest,
                         ::testing::Values(ReleaseOrder::ROOT_FIRST, ReleaseOrder::DOCUMENT_FIRST));

TEST(DomOwnership, RemoveChildRefusesANodeThatIsNotAChildOfTheDocument) {
  Ref<Document> document = Parse(kAssertion);
  ElementNode* issuer = AsElement(document->GetRootElement()->GetFirstChild());
  try {
    document->RemoveChild(issuer);
    FAIL() << "no exception";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : the node to remove is not a child of the document", e.what());
  }
  EXPECT_THROW(document->RemoveChild(nullptr), InvalidArgumentException);
}

TEST(DomOwnership, ParsedRootAppendedThenSourceReleased) {
  Ref<ElementNode> envelope = Element("", "Envelope");
  {
    Ref<Document> document = Parse(kAssertion);
    envelope->AppendChild(document->GetRootElement());
    EXPECT_EQ(nullptr, document->GetRootElement());
  }
  EXPECT_EQ(std::string("<Envelope>") + kAssertion + "</Envelope>", Serialize(envelope.get()));
  EXPECT_EQ(envelope->GetOwnerDocument(), envelope->GetFirstChild()->GetOwnerDocument());
}

TEST(DomOwnership, SameTextParsedTwiceAndAppendedTwice) {
  Ref<ElementNode> envelope = Element("", "Envelope");
  Ref<ElementNode> first;
  for (int i = 0; i < 2; ++i) {
    Ref<Document> document = Parse(kAssertion);
    Ref<ElementNode> root(document->GetRootElement());
    document->RemoveChild(root.get());
    envelope->AppendChild(root.get());
    if (i == 0) first = root;
  }
  EXPECT_EQ(std::string("<Envelope>") + kAssertion + kAssertion + "</Envelope>", Serialize(envelope.get()));
  EXPECT_EQ(first.get(), envelope->GetFirstChild());
  envelope.reset();
  // The first assertion keeps the whole envelope tree alive.
  EXPECT_EQ("Envelope", AsElement(first->GetParent())->GetLocalName());
}

// Refs that a caller may hold on a lone element's tree when it appends the element elsewhere.
enum class Held { ELEMENT, CHILD_TEXT, OWN_DOCUMENT };

class LoneElementTest : public ::testing::TestWithParam<std::array<Held, 3>> {};

TEST_P(LoneElementTest, AppendedUnderAnotherTreeThenReleasedInAnyOrder) {
  Ref<ElementNode> parent = Element("", "Parent");
  Ref<ElementNode> element = Element("", "Child");
  Ref<TextNode> text = Text("value");
  element->AppendChild(text.get());
  Ref<Document> ownDocument(element->GetOwnerDocument());

  parent->AppendChild(element.get());
  EXPECT_EQ(parent->GetOwnerDocument(), element->GetOwnerDocument());
  EXPECT_EQ(parent->GetOwnerDocument(), text->GetOwnerDocument());
  EXPECT_EQ(nullptr, ownDocument->GetRootElement());

  for (Held held : GetParam()) {
    switch (held) {
      case Held::ELEMENT:
        element.reset();
        break;
      case Held::CHILD_TEXT:
        text.reset();
        break;
      case Held::OWN_DOCUMENT:
        ownDocument.reset();
        break;
    }
    EXPECT_EQ("<Parent><Child>value</Child></Parent>", Serialize(parent.get()));
  }
}

std::vector<std::array<Held, 3>> AllReleaseOrders() {
  std::array<Held, 3> order{Held::ELEMENT, Held::CHILD_TEXT, Held::OWN_DOCUMENT};
  std::vector<std::array<Held, 3>> orders;
  do {
    orders.push_back(order);
  } while (std::next_permutation(order.begin(), order.end()));
  return orders;
}

INSTANTIATE_TEST_SUITE_P(ReleaseOrders, LoneElementTest, ::testing::ValuesIn(AllReleaseOrders()));

TEST(DomOwnership, ParentReleasedWhileTheAppendedChildIsHeld) {
  Ref<ElementNode> element = Element("", "Child");
  {
    Ref<ElementNode> parent = Element("", "Parent");
    parent->AppendChild(element.get());
  }
  EXPECT_EQ("Parent", AsElement(element->GetParent())->GetLocalName());
  EXPECT_EQ("<Child/>", Serialize(element.get()));
}

TEST(DomOwnership, TextNodeBelongsToNoTreeUntilAppended) {
  Ref<TextNode> text = Text("loose");
  EXPECT_EQ(nullptr, text->GetParent());
  EXPECT_NE(nullptr, text->GetOwnerDocument());
  Ref<ElementNode> element = Element("", "e");
  element->AppendChild(text.get());
  EXPECT_EQ(element.get(), text->GetParent());
  text.reset();
  EXPECT_EQ("<e>loose</e>", Serialize(element.get()));
}

TEST(DomOwnership, UnappendedTextNodeIsFreedWithItsRef) {
  // LeakSanitizer reports the node if its document does not free it.
  Ref<TextNode> text = Text("never appended");
  EXPECT_EQ("never appended", text->GetText());
}

// --- Structure ---------------------------------------------------------------------------------

TEST(DomStructure, AdjacentTextNodesStayDistinct) {
  Ref<ElementNode> element = Element("", "e");
  Ref<TextNode> first = Text("a");
  Ref<TextNode> second = Text("b");
  element->AppendChild(first.get());
  element->AppendChild(second.get());
  EXPECT_EQ(first.get(), element->GetFirstChild());
  EXPECT_EQ(second.get(), first->GetNextSibling());
  EXPECT_EQ("a", first->GetText());
  EXPECT_EQ("<e>ab</e>", Serialize(element.get()));
}

TEST(DomStructure, MovesAChildWithinTheSameTree) {
  Ref<Document> document = Parse("<r><a><x/></a><b/></r>");
  ElementNode* root = document->GetRootElement();
  ElementNode* a = root->FindChildElementByLocalName("a");
  ElementNode* x = a->FindChildElementByLocalName("x");
  root->FindChildElementByLocalName("b")->AppendChild(x);
  EXPECT_EQ("<r><a/><b><x/></b></r>", Serialize(root));
  EXPECT_EQ(x, root->FindChildElementByLocalName("b")->GetFirstChild());
}

struct BadAppend {
  const char* name;
  const char* message;
};

class BadAppendTest : public ::testing::TestWithParam<BadAppend> {};

TEST_P(BadAppendTest, IsRefused) {
  SCOPED_TRACE(GetParam().name);
  Ref<Document> document = Parse("<r><a><b/></a></r>");
  ElementNode* root = document->GetRootElement();
  ElementNode* a = root->FindChildElementByLocalName("a");
  ElementNode* b = a->FindChildElementByLocalName("b");
  const std::string name = GetParam().name;
  try {
    if (name == "itself") a->AppendChild(a);
    if (name == "ancestor") b->AppendChild(root);
    if (name == "document") b->AppendChild(document.get());
    if (name == "null") b->AppendChild(nullptr);
    FAIL() << "no exception";
  } catch (const InvalidArgumentException& e) {
    EXPECT_EQ(std::string("Invalid argument : ") + GetParam().message, e.what());
  }
  EXPECT_EQ("<r><a><b/></a></r>", Serialize(root));
}

INSTANTIATE_TEST_SUITE_P(
    Cases, BadAppendTest,
    ::testing::Values(BadAppend{"itself", "an element cannot be appended to itself or its descendants"},
                      BadAppend{"ancestor", "an element cannot be appended to itself or its descendants"},
                      BadAppend{"document", "only elements, text, comments and processing instructions can be appended"},
                      BadAppend{"null", "the child to append is not a node of a tree"}),
    [](const ::testing::TestParamInfo<BadAppend>& info) { return std::string(info.param.name); });

TEST(DomStructure, NodeKindsOfAParsedDocument) {
  Ref<Document> document = Parse("<r>t<!--c--><![CDATA[<d>]]><?pi data?><e/></r>");
  Node* node = document->GetRootElement()->GetFirstChild();
  EXPECT_EQ(Node::DOCUMENT, document->GetKind());
  EXPECT_EQ(Node::ELEMENT, document->GetRootElement()->GetKind());
  EXPECT_EQ(Node::TEXT, node->GetKind());
  node = node->GetNextSibling();
  EXPECT_EQ(Node::COMMENT, node->GetKind());
  EXPECT_EQ(nullptr, dynamic_cast<TextNode*>(node));
  node = node->GetNextSibling();
  EXPECT_EQ(Node::CDATA_SECTION, node->GetKind());
  EXPECT_EQ("<d>", Tamber::DynamicCast<TextNode>(node)->GetText());
  node = node->GetNextSibling();
  EXPECT_EQ(Node::PROCESSING_INSTRUCTION, node->GetKind());
  node = node->GetNextSibling();
  EXPECT_EQ(Node::ELEMENT, node->GetKind());
  EXPECT_EQ(nullptr, node->GetNextSibling());
}

TEST(DomStructure, TextIsReturnedUnchanged) {
  const std::string text = " \t\r\n a < b && c > d ]]> \"q\" 'a' \xC3\xA9\xE2\x82\xAC ";
  Ref<TextNode> node = Text(text);
  EXPECT_EQ(text, node->GetText());
  node->SetText("other");
  EXPECT_EQ("other", node->GetText());
}

TEST(DomStructure, ParsedTextIsReturnedUnchanged) {
  Ref<Document> document = Parse("<r>  a &amp; b &lt; c\n\t</r>");
  EXPECT_EQ("  a & b < c\n\t", Tamber::DynamicCast<TextNode>(document->GetRootElement()->GetFirstChild())->GetText());
}

struct BadText {
  const char* name;
  std::string text;
};

class BadTextTest : public ::testing::TestWithParam<BadText> {};

TEST_P(BadTextTest, IsRefusedForTextAndAttributes) {
  SCOPED_TRACE(GetParam().name);
  try {
    Text(GetParam().text);
    FAIL() << "no exception";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : the text is not UTF-8 text made of characters that XML allows", e.what());
  }
  Ref<ElementNode> element = Element("", "e");
  try {
    element->SetAttribute("a", GetParam().text);
    FAIL() << "no exception";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ(
        "Invalid argument : the value of attribute 'a' is not UTF-8 text made of characters that XML allows",
        e.what());
  }
  EXPECT_EQ("<e/>", Serialize(element.get()));
}

INSTANTIATE_TEST_SUITE_P(
    Cases, BadTextTest,
    ::testing::Values(BadText{"nul", std::string("a\0b", 3)}, BadText{"control", "a\x01"},
                      BadText{"truncated", "\xC3"}, BadText{"overlong", "\xC0\xBC"},
                      BadText{"surrogate", "\xED\xA0\x80"}, BadText{"fffe", "\xEF\xBF\xBE"},
                      BadText{"stray_continuation", "\x80"}),
    [](const ::testing::TestParamInfo<BadText>& info) { return std::string(info.param.name); });

TEST(DomStructure, BadElementNamesAreRefused) {
  Ref<ElementNode> element;
  for (const auto& name : std::vector<std::pair<std::string, std::string>>{
           {"", "a b"}, {"", ""}, {"p:q", "a"}, {"xmlns", "a"}, {"", "1a"}}) {
    SCOPED_TRACE(name.first + "|" + name.second);
    try {
      Tamber::Xml::CreateElementNode(name.first, name.second, element);
      FAIL() << "no exception";
    } catch (const InvalidArgumentException& e) {
      const std::string qualified = name.first.empty() ? name.second : name.first + ":" + name.second;
      EXPECT_EQ("Invalid argument : '" + qualified + "' is not a valid element name", std::string(e.what()));
    }
  }
  EXPECT_EQ(nullptr, element.get());
}

TEST(DomStructure, ParsedElementsKnowWhereTheirStartTagEnds) {
  Ref<Document> document = Parse("<?xml version=\"1.0\"?>\n<r>\n  <a x=\"1\"/>\n</r>");
  ElementNode* root = document->GetRootElement();
  EXPECT_EQ(2, root->GetLine());
  EXPECT_EQ(3, root->GetColumn());
  ElementNode* a = root->FindChildElementByLocalName("a");
  EXPECT_EQ(3, a->GetLine());
  EXPECT_EQ(11, a->GetColumn());

  // The position survives the move of the subtree into another tree.
  Ref<ElementNode> other = Element("", "other");
  other->AppendChild(a);
  EXPECT_EQ(3, a->GetLine());
  EXPECT_EQ(11, a->GetColumn());
}

TEST(DomStructure, BuiltNodesHaveNoPosition) {
  Ref<ElementNode> element = Element("p", "e");
  EXPECT_EQ(0, element->GetLine());
  EXPECT_EQ(0, element->GetColumn());
}

TEST(DomStructure, ReadersOnSeveralThreadsSeeTheSameWrappers) {
  std::string text = "<r>";
  for (int i = 0; i < 200; ++i) text += "<c>" + std::to_string(i) + "</c>";
  Ref<Document> document = Parse(text + "</r>");
  std::vector<std::vector<Node*>> seen(4);
  std::vector<std::thread> threads;
  for (auto& nodes : seen) {
    threads.emplace_back([&document, &nodes] {
      for (Node* node = document->GetRootElement()->GetFirstChild(); node; node = node->GetNextSibling()) {
        Ref<Node> held(node);
        nodes.push_back(node->GetFirstChild());
      }
    });
  }
  for (auto& thread : threads) thread.join();
  for (const auto& nodes : seen) EXPECT_EQ(seen[0], nodes);
}

}  // namespace
