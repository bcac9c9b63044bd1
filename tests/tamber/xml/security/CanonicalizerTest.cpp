#include "tamber/xml/security/Canonicalizer.h"

#include <gtest/gtest.h>

#include <ostream>
#include <string>

#include "tamber/xml/XmlTestSupport.h"

namespace Tamber {
namespace Xml {
namespace Security {
namespace {

const char kInclusive[] = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
const char kInclusiveWithComments[] = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments";
const char kExclusive[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
const char kExclusiveWithComments[] = "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";

std::string Canonicalize(const std::string& algorithm, const ElementNode* element) {
  Ref<Canonicalizer> canonicalizer;
  CreateCanonicalizer(algorithm, canonicalizer);
  Ref<StringWriter> writer;
  CreateStringWriter(writer);
  canonicalizer->Canonicalize(element, writer.get());
  return writer->GetString();
}

// Namespaces (one unused) and xml:lang declared on ancestors of the subtree, attributes out of
// order, a comment, an empty element and an escaped character.
const char kDocument[] =
    "<env:Envelope xmlns:env=\"urn:env\" xmlns:unused=\"urn:unused\" xml:lang=\"en\">\n"
    "  <env:Body xmlns:a=\"urn:a\" xmlns=\"urn:default\">\n"
    "    <a:Item z=\"2\" xmlns:b=\"urn:b\" b:attr=\"1\" a=\"3\"><!-- note --><a:Child>x &amp; y</a:Child><Plain/></a:Item>\n"
    "  </env:Body>\n"
    "</env:Envelope>";

ElementNode* Item(Document* document) {
  ElementNode* body = document->GetRootElement()->FindChildElement(QName("urn:env", "Body"));
  return body->FindChildElement(QName("urn:a", "Item"));
}

struct Form {
  const char* algorithm;
  const char* expected;
};

std::ostream& operator<<(std::ostream& out, const Form& form) { return out << form.algorithm; }

class SubtreeFormTest : public testing::TestWithParam<Form> {};

TEST_P(SubtreeFormTest, WritesTheExpectedBytes) {
  SCOPED_TRACE(GetParam().algorithm);
  Ref<Document> document = XmlTest::Parse(kDocument);
  EXPECT_EQ(GetParam().expected, Canonicalize(GetParam().algorithm, Item(document.get())));
}

INSTANTIATE_TEST_SUITE_P(
    Table, SubtreeFormTest,
    testing::Values(
        // Inclusive: every namespace in scope and the inherited xml:lang land on the apex.
        Form{kInclusive,
             "<a:Item xmlns=\"urn:default\" xmlns:a=\"urn:a\" xmlns:b=\"urn:b\" xmlns:env=\"urn:env\" "
             "xmlns:unused=\"urn:unused\" a=\"3\" z=\"2\" xml:lang=\"en\" b:attr=\"1\"><a:Child>x &amp; y</a:Child>"
             "<Plain></Plain></a:Item>"},
        Form{"http://www.w3.org/TR/2001/REC-xml-c14n-20010315#",
             "<a:Item xmlns=\"urn:default\" xmlns:a=\"urn:a\" xmlns:b=\"urn:b\" xmlns:env=\"urn:env\" "
             "xmlns:unused=\"urn:unused\" a=\"3\" z=\"2\" xml:lang=\"en\" b:attr=\"1\"><a:Child>x &amp; y</a:Child>"
             "<Plain></Plain></a:Item>"},
        Form{kInclusiveWithComments,
             "<a:Item xmlns=\"urn:default\" xmlns:a=\"urn:a\" xmlns:b=\"urn:b\" xmlns:env=\"urn:env\" "
             "xmlns:unused=\"urn:unused\" a=\"3\" z=\"2\" xml:lang=\"en\" b:attr=\"1\"><!-- note -->"
             "<a:Child>x &amp; y</a:Child><Plain></Plain></a:Item>"},
        // Exclusive: only what is used, where it is first used; nothing inherited.
        Form{kExclusive,
             "<a:Item xmlns:a=\"urn:a\" xmlns:b=\"urn:b\" a=\"3\" z=\"2\" b:attr=\"1\"><a:Child>x &amp; y</a:Child>"
             "<Plain xmlns=\"urn:default\"></Plain></a:Item>"},
        Form{kExclusiveWithComments,
             "<a:Item xmlns:a=\"urn:a\" xmlns:b=\"urn:b\" a=\"3\" z=\"2\" b:attr=\"1\"><!-- note -->"
             "<a:Child>x &amp; y</a:Child><Plain xmlns=\"urn:default\"></Plain></a:Item>"}),
    [](const testing::TestParamInfo<Form>& info) { return "Row" + std::to_string(info.index); });

TEST(CanonicalizerTest, InclusiveFormOfASubtreeParsesOnItsOwnWithItsNamespaces) {
  Ref<Document> document = XmlTest::Parse(kDocument);
  Ref<Document> reparsed = XmlTest::Parse(Canonicalize(kInclusive, Item(document.get())));
  ElementNode* child = reparsed->GetRootElement()->FindChildElement(QName("urn:a", "Child"));
  ASSERT_NE(nullptr, child);
  EXPECT_EQ("urn:default", reparsed->GetRootElement()->FindChildElementByLocalName("Plain")->GetNamespaceURI());
}

TEST(CanonicalizerTest, CanonicalizesABuiltTreeWhoseDeclarationCameLater) {
  Ref<ElementNode> root = XmlTest::Element("p", "Root");
  Ref<ElementNode> child = XmlTest::Element("q", "Child");
  child->SetAttribute("q:flag", "on");
  child->AppendChild(XmlTest::Text("<&>").get());
  root->AppendChild(child.get());
  root->SetAttribute("xmlns:p", "urn:p");
  root->SetAttribute("xmlns:q", "urn:q");  // declared after the child was named and appended
  root->SetAttribute("b", "2");
  root->SetAttribute("a", "1");

  EXPECT_EQ("<p:Root xmlns:p=\"urn:p\" xmlns:q=\"urn:q\" a=\"1\" b=\"2\"><q:Child q:flag=\"on\">&lt;&amp;&gt;</q:Child></p:Root>",
            Canonicalize(kInclusive, root.get()));
  EXPECT_EQ("<p:Root xmlns:p=\"urn:p\" a=\"1\" b=\"2\"><q:Child xmlns:q=\"urn:q\" q:flag=\"on\">&lt;&amp;&gt;</q:Child></p:Root>",
            Canonicalize(kExclusive, root.get()));
  EXPECT_EQ("<q:Child xmlns:p=\"urn:p\" xmlns:q=\"urn:q\" q:flag=\"on\">&lt;&amp;&gt;</q:Child>",
            Canonicalize(kInclusive, child.get()));
}

TEST(CanonicalizerTest, RefusesOtherAlgorithms) {
  for (const char* uri : {"http://www.w3.org/2006/12/xml-c14n11", "http://www.w3.org/2001/10/xml-exc-c14n",
                          "http://www.w3.org/TR/2001/REC-xml-c14n-20010315##", ""}) {
    SCOPED_TRACE(uri);
    Ref<Canonicalizer> canonicalizer;
    try {
      CreateCanonicalizer(uri, canonicalizer);
      FAIL() << "accepted";
    } catch (const InvalidArgumentException& e) {
      EXPECT_EQ("Invalid argument : Unsupported canonicalization algorithm \"" + std::string(uri) + "\"", e.what());
    }
    EXPECT_FALSE(canonicalizer);
  }
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
