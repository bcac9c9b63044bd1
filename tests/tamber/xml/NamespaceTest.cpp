#include "tamber/xml/Namespace.h"

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tamber/xml/Dom.h"
#include "tamber/xml/XmlTestSupport.h"

using Tamber::InvalidArgumentException;
using Tamber::Ref;
using Tamber::Xml::Document;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;
using Tamber::Xml::TextNode;
using XmlTest::Element;
using XmlTest::Parse;
using XmlTest::Serialize;
using XmlTest::Text;

namespace {

const std::string kWsse = "urn:test:wsse";
const std::string kWsu = "urn:test:wsu";
const std::string kSoap = "urn:test:soap";

TEST(BuiltNamespaces, DeclarationSetAfterCreationBindsTheElement) {
  Ref<ElementNode> security = Element("wsse", "Security");
  EXPECT_EQ("", security->GetNamespaceURI());
  security->SetAttribute("xmlns:wsse", kWsse);
  EXPECT_EQ("wsse", security->GetPrefix());
  EXPECT_EQ("Security", security->GetLocalName());
  EXPECT_EQ(kWsse, security->GetNamespaceURI());
  EXPECT_EQ("<wsse:Security xmlns:wsse=\"urn:test:wsse\"/>", Serialize(security.get()));
}

TEST(BuiltNamespaces, ChildAppendedBeforeItsDeclarationAppearsOnAnAncestor) {
  Ref<ElementNode> envelope = Element("soapenv", "Envelope");
  Ref<ElementNode> security = Element("wsse", "Security");
  Ref<ElementNode> timestamp = Element("wsu", "Timestamp");
  Ref<ElementNode> created = Element("wsu", "Created");
  created->AppendChild(Text("2009-03-05T07:08:09.004Z").get());
  timestamp->AppendChild(created.get());
  security->SetAttribute("xmlns:wsse", kWsse);
  security->AppendChild(timestamp.get());
  envelope->AppendChild(security.get());
  EXPECT_EQ(nullptr, security->FindChildElement(QName(kWsu, "Timestamp")));

  envelope->SetAttribute("xmlns:wsu", kWsu);
  envelope->SetAttribute("xmlns:soapenv", kSoap);
  EXPECT_EQ(kWsu, timestamp->GetNamespaceURI());
  EXPECT_EQ(kWsu, created->GetNamespaceURI());
  EXPECT_EQ(kSoap, envelope->GetNamespaceURI());
  EXPECT_EQ(timestamp.get(), security->FindChildElement(QName(kWsu, "Timestamp")));
  EXPECT_EQ(created.get(), timestamp->FindChildElement(QName(kWsu, "Created")));
  EXPECT_EQ(
      "<soapenv:Envelope xmlns:wsu=\"urn:test:wsu\" xmlns:soapenv=\"urn:test:soap\">"
      "<wsse:Security xmlns:wsse=\"urn:test:wsse\"><wsu:Timestamp><wsu:Created>2009-03-05T07:08:09.004Z"
      "</wsu:Created></wsu:Timestamp></wsse:Security></soapenv:Envelope>",
      Serialize(envelope.get()));
}

TEST(BuiltNamespaces, ChildAppendedUnderAnAlreadyDeclaredAncestor) {
  Ref<ElementNode> header = Element("soapenv", "Header");
  header->SetAttribute("xmlns:wsse", kWsse);
  Ref<ElementNode> security = Element("wsse", "Security");
  header->AppendChild(security.get());
  EXPECT_EQ(kWsse, security->GetNamespaceURI());
  EXPECT_EQ(security.get(), header->FindChildElement(QName(kWsse, "Security")));
}

TEST(BuiltNamespaces, AttributesAndDeclarationsSerialiseWhereAndAsSet) {
  Ref<ElementNode> timestamp = Element("wsu", "Timestamp");
  timestamp->SetAttribute("wsu:Id", "ts-1");
  timestamp->SetAttribute("OK", "1");
  timestamp->SetAttribute("Allow", "2");
  timestamp->SetAttribute("xmlns:wsu", kWsu);
  timestamp->SetAttribute("xmlns", kSoap);
  EXPECT_EQ((std::vector<std::string>{"wsu:Id", "OK", "Allow", "xmlns:wsu", "xmlns"}),
            timestamp->GetAttributeNames());
  EXPECT_EQ("<wsu:Timestamp xmlns:wsu=\"urn:test:wsu\" xmlns=\"urn:test:soap\" wsu:Id=\"ts-1\" OK=\"1\" Allow=\"2\"/>",
            Serialize(timestamp.get()));
}

TEST(BuiltNamespaces, PrefixedAttributeIsFoundByQNameOnceDeclared) {
  Ref<ElementNode> body = Element("soapenv", "Body");
  body->SetAttribute("wsu:Id", "body-1");
  std::string value;
  EXPECT_TRUE(body->GetAttribute("wsu:Id", value));
  EXPECT_EQ("body-1", value);
  EXPECT_FALSE(body->GetAttribute(QName(kWsu, "Id"), value));
  EXPECT_FALSE(body->GetAttribute(QName("", "wsu:Id"), value));

  body->SetAttribute("xmlns:wsu", kWsu);
  value.clear();
  EXPECT_TRUE(body->GetAttribute(QName(kWsu, "Id"), value));
  EXPECT_EQ("body-1", value);
  EXPECT_TRUE(body->GetAttribute("wsu:Id", value));
  EXPECT_FALSE(body->GetAttribute(QName("", "Id"), value));

  // Setting it again replaces the value in place.
  body->SetAttribute("wsu:Id", "body-2");
  EXPECT_EQ((std::vector<std::string>{"wsu:Id", "xmlns:wsu"}), body->GetAttributeNames());
  EXPECT_TRUE(body->GetAttribute(QName(kWsu, "Id"), value));
  EXPECT_EQ("body-2", value);
}

TEST(BuiltNamespaces, PrefixedAttributeBindsWhenAnAncestorDeclaresItLater) {
  Ref<ElementNode> envelope = Element("soapenv", "Envelope");
  Ref<ElementNode> body = Element("soapenv", "Body");
  body->SetAttribute("wsu:Id", "b");
  envelope->AppendChild(body.get());
  envelope->SetAttribute("xmlns:wsu", kWsu);
  std::string value;
  EXPECT_TRUE(body->GetAttribute(QName(kWsu, "Id"), value));
  EXPECT_EQ("b", value);
}

TEST(BuiltNamespaces, DeclarationValueIsReadLikeAnAttribute) {
  Ref<ElementNode> element = Element("p", "e");
  element->SetAttribute("xmlns:p", "urn:one");
  element->SetAttribute("xmlns:p", "urn:two");
  std::string value;
  EXPECT_TRUE(element->GetAttribute("xmlns:p", value));
  EXPECT_EQ("urn:two", value);
  EXPECT_FALSE(element->GetAttribute("xmlns", value));
  EXPECT_EQ((std::vector<std::string>{"xmlns:p"}), element->GetAttributeNames());
  EXPECT_EQ("urn:two", element->GetNamespaceURI());
  EXPECT_EQ("<p:e xmlns:p=\"urn:two\"/>", Serialize(element.get()));
}

TEST(BuiltNamespaces, InnerDeclarationRebindsTheSubtree) {
  Ref<ElementNode> outer = Element("p", "outer");
  outer->SetAttribute("xmlns:p", "urn:outer");
  Ref<ElementNode> inner = Element("p", "inner");
  Ref<ElementNode> leaf = Element("p", "leaf");
  leaf->SetAttribute("p:a", "1");
  inner->AppendChild(leaf.get());
  outer->AppendChild(inner.get());
  EXPECT_EQ("urn:outer", leaf->GetNamespaceURI());

  inner->SetAttribute("xmlns:p", "urn:inner");
  EXPECT_EQ("urn:outer", outer->GetNamespaceURI());
  EXPECT_EQ("urn:inner", inner->GetNamespaceURI());
  EXPECT_EQ("urn:inner", leaf->GetNamespaceURI());
  std::string value;
  EXPECT_TRUE(leaf->GetAttribute(QName("urn:inner", "a"), value));
  EXPECT_FALSE(leaf->GetAttribute(QName("urn:outer", "a"), value));
}

TEST(BuiltNamespaces, DefaultDeclarationBindsUnprefixedElementsButNotAttributes) {
  Ref<ElementNode> root = Element("", "Root");
  Ref<ElementNode> child = Element("", "Child");
  child->SetAttribute("a", "1");
  root->AppendChild(child.get());
  EXPECT_EQ("", child->GetNamespaceURI());
  EXPECT_EQ(child.get(), root->FindChildElement(QName("", "Child")));

  root->SetAttribute("xmlns", "urn:default");
  EXPECT_EQ("urn:default", root->GetNamespaceURI());
  EXPECT_EQ("urn:default", child->GetNamespaceURI());
  EXPECT_EQ("", child->GetPrefix());
  EXPECT_EQ(child.get(), root->FindChildElement(QName("urn:default", "Child")));
  std::string value;
  EXPECT_TRUE(child->GetAttribute(QName("", "a"), value));

  Ref<ElementNode> late = Element("", "Late");
  root->AppendChild(late.get());
  EXPECT_EQ("urn:default", late->GetNamespaceURI());

  // xmlns="" takes the default away again.
  Ref<ElementNode> plain = Element("", "Plain");
  plain->SetAttribute("xmlns", "");
  root->AppendChild(plain.get());
  EXPECT_EQ("", plain->GetNamespaceURI());
  std::string uri;
  EXPECT_FALSE(plain->LookupNamespace("", uri));
  EXPECT_EQ("<Root xmlns=\"urn:default\"><Child a=\"1\"/><Late/><Plain xmlns=\"\"/></Root>", Serialize(root.get()));
}

TEST(BuiltNamespaces, UnboundPrefixIsWrittenAsGivenAndNeverMatched) {
  Ref<ElementNode> root = Element("", "root");
  Ref<ElementNode> unbound = Element("x", "e");
  unbound->SetAttribute("y:a", "1");
  root->AppendChild(unbound.get());
  EXPECT_EQ("x", unbound->GetPrefix());
  EXPECT_EQ("e", unbound->GetLocalName());
  EXPECT_EQ("", unbound->GetNamespaceURI());
  EXPECT_EQ(nullptr, root->FindChildElement(QName("", "e")));
  EXPECT_EQ(nullptr, root->FindChildElement(QName("", "x:e")));
  EXPECT_EQ(unbound.get(), root->FindChildElementByLocalName("e"));
  std::string value;
  EXPECT_FALSE(unbound->GetAttribute(QName("", "a"), value));
  EXPECT_TRUE(unbound->GetAttribute("y:a", value));
  EXPECT_EQ("<root><x:e y:a=\"1\"/></root>", Serialize(root.get()));
}

TEST(BuiltNamespaces, LookupNamespaceWalksOwnAndAncestorDeclarations) {
  Ref<ElementNode> root = Element("", "root");
  root->SetAttribute("xmlns:a", "urn:a");
  root->SetAttribute("xmlns", "urn:d");
  Ref<ElementNode> child = Element("", "child");
  child->SetAttribute("xmlns:b", "urn:b");
  root->AppendChild(child.get());

  std::string uri;
  EXPECT_TRUE(child->LookupNamespace("a", uri));
  EXPECT_EQ("urn:a", uri);
  EXPECT_TRUE(child->LookupNamespace("b", uri));
  EXPECT_EQ("urn:b", uri);
  EXPECT_TRUE(child->LookupNamespace("", uri));
  EXPECT_EQ("urn:d", uri);
  EXPECT_TRUE(child->LookupNamespace("xml", uri));
  EXPECT_EQ("http://www.w3.org/XML/1998/namespace", uri);
  uri = "unchanged";
  EXPECT_FALSE(root->LookupNamespace("b", uri));
  EXPECT_FALSE(child->LookupNamespace("c", uri));
  EXPECT_EQ("unchanged", uri);
}

TEST(BuiltNamespaces, ParsedSubtreeKeepsItsOwnDeclarationsInABuiltTree) {
  Ref<Document> token = Parse(
      "<saml:Assertion xmlns:saml=\"urn:test:saml\" xmlns:xsi=\"urn:test:xsi\" ID=\"_1\">"
      "<saml:Issuer>sts</saml:Issuer></saml:Assertion>");
  Ref<ElementNode> assertion(token->GetRootElement());
  token->RemoveChild(assertion.get());
  Ref<ElementNode> target = Element("wst", "RenewTarget");
  target->SetAttribute("xmlns:wst", "urn:test:wst");
  target->AppendChild(assertion.get());
  EXPECT_EQ(
      "<wst:RenewTarget xmlns:wst=\"urn:test:wst\"><saml:Assertion xmlns:saml=\"urn:test:saml\" "
      "xmlns:xsi=\"urn:test:xsi\" ID=\"_1\"><saml:Issuer>sts</saml:Issuer></saml:Assertion></wst:RenewTarget>",
      Serialize(target.get()));
  EXPECT_EQ("urn:test:saml", assertion->GetNamespaceURI());
}

TEST(BuiltNamespaces, MovedSubtreeCarriesTheDeclarationsItUsesFromItsOldAncestors) {
  Ref<Document> document = Parse("<r xmlns:p=\"urn:p\"><p:a><p:b/></p:a></r>");
  ElementNode* a = document->GetRootElement()->FindChildElement(QName("urn:p", "a"));
  ASSERT_NE(nullptr, a);
  Ref<ElementNode> other = Element("", "other");
  other->AppendChild(a);
  document.reset();
  EXPECT_EQ("urn:p", a->GetNamespaceURI());
  EXPECT_EQ("<other><p:a xmlns:p=\"urn:p\"><p:b/></p:a></other>", Serialize(other.get()));
}

TEST(BuiltNamespaces, MarkupIsEscapedAndReadsBackUnchanged) {
  const std::string text = "a<b & c>d ]]> e\r\n\"q\" 'a'";
  const std::string attribute = "x\"y'<&>\t\n\rz";
  Ref<ElementNode> element = Element("", "e");
  element->SetAttribute("a", attribute);
  element->AppendChild(Text(text).get());
  const std::string xml = Serialize(element.get());
  EXPECT_EQ("<e a=\"x&quot;y'&lt;&amp;&gt;&#9;&#10;&#13;z\">a&lt;b &amp; c&gt;d ]]&gt; e&#13;\n\"q\" 'a'</e>", xml);

  Ref<Document> reparsed = Parse(xml);
  std::string value;
  ASSERT_TRUE(reparsed->GetRootElement()->GetAttribute("a", value));
  EXPECT_EQ(attribute, value);
  EXPECT_EQ(text, Tamber::DynamicCast<TextNode>(reparsed->GetRootElement()->GetFirstChild())->GetText());
}

TEST(BuiltNamespaces, NonAsciiTextIsWrittenAsUtf8) {
  Ref<ElementNode> element = Element("", "e");
  element->SetAttribute("a", "\xC3\xA9");
  element->AppendChild(Text("\xE2\x82\xAC").get());
  EXPECT_EQ("<e a=\"\xC3\xA9\">\xE2\x82\xAC</e>", Serialize(element.get()));
}

TEST(BuiltNamespaces, ParsedElementSerialisesExactlyAsWritten) {
  const std::string text =
      "<a:r xmlns:a=\"urn:a\" xmlns=\"urn:d\" z=\"1\" a:y=\"2\">\n  <!-- note -->\n  <c>t</c><?pi x?>"
      "<![CDATA[<raw>]]><e/></a:r>";
  EXPECT_EQ(text, Serialize(Parse("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n" + text)->GetRootElement()));
}

struct BadAttribute {
  const char* name;
  const char* value;
  const char* message;
};

class BadAttributeTest : public ::testing::TestWithParam<BadAttribute> {};

TEST_P(BadAttributeTest, IsRefused) {
  SCOPED_TRACE(GetParam().name);
  Ref<ElementNode> element = Element("", "e");
  try {
    element->SetAttribute(GetParam().name, GetParam().value);
    FAIL() << "no exception";
  } catch (const InvalidArgumentException& e) {
    EXPECT_EQ(std::string("Invalid argument : ") + GetParam().message, e.what());
  }
  EXPECT_TRUE(element->GetAttributeNames().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Cases, BadAttributeTest,
    ::testing::Values(
        BadAttribute{"xmlns:", "urn:x", "'xmlns:' is not a namespace declaration that can be made"},
        BadAttribute{"xmlns:xml", "urn:x", "'xmlns:xml' is not a namespace declaration that can be made"},
        BadAttribute{"xmlns:xmlns", "urn:x", "'xmlns:xmlns' is not a namespace declaration that can be made"},
        BadAttribute{"xmlns:p", "", "the prefix 'p' cannot be bound to an empty namespace"},
        BadAttribute{"", "v", "'' is not a valid attribute name"},
        BadAttribute{"a b", "v", "'a b' is not a valid attribute name"},
        BadAttribute{":a", "v", "':a' is not a valid attribute name"},
        BadAttribute{"a:", "v", "'a:' is not a valid attribute name"},
        BadAttribute{"a:b:c", "v", "'a:b:c' is not a valid attribute name"}));

}  // namespace
