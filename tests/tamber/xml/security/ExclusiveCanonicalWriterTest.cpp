// The layer's own exclusive canonicalisation against libxml2's on the same subtrees: namespaces
// inherited, redeclared, undeclared and listed as inclusive, attribute order, escaping, comments,
// an excluded subtree; and what it leaves to libxml2.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/XmlTestSupport.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/ExclusiveCanonicalWriter.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"

namespace Tamber {
namespace Xml {
namespace Security {
namespace {

xmlNodePtr FindElement(xmlNodePtr node, const char* localName) {
  for (; node != nullptr; node = node->next) {
    if (node->type != XML_ELEMENT_NODE) continue;
    if (xmlStrEqual(node->name, BAD_CAST localName)) return node;
    if (xmlNodePtr found = FindElement(node->children, localName)) return found;
  }
  return nullptr;
}

struct Case {
  const char* name;
  const char* document;
  const char* root;      // local name of the canonicalised element
  const char* excluded;  // local name of the element left out, or null
  bool withComments;
  const char* inclusivePrefixes = "";
};

class ExclusiveCanonicalWriterTest : public testing::TestWithParam<Case> {};

TEST_P(ExclusiveCanonicalWriterTest, WritesWhatLibXml2Writes) {
  const Case& row = GetParam();
  SCOPED_TRACE(row.name);
  Ref<Document> document = XmlTest::Parse(row.document);
  xmlNodePtr top = ToXmlNode(document->GetRootElement());
  xmlNodePtr root = FindElement(top, row.root);
  ASSERT_NE(nullptr, root);
  xmlNodePtr excluded = row.excluded != nullptr ? FindElement(top, row.excluded) : nullptr;
  xmlSecTransformId algorithm = row.withComments ? xmlSecTransformExclC14NWithCommentsId : xmlSecTransformExclC14NId;

  std::string written;
  ASSERT_TRUE(
      WriteExclusiveCanonicalForm(root, excluded, row.withComments, SplitPrefixList(row.inclusivePrefixes), written));
  const Canonicalization form{algorithm, row.withComments, row.inclusivePrefixes};
  EXPECT_EQ(CanonicalizeSubtreeWithLibXml2(root, excluded, form), written);
  EXPECT_EQ(written, CanonicalizeSubtree(root, excluded, form));
}

INSTANTIATE_TEST_SUITE_P(
    Table, ExclusiveCanonicalWriterTest,
    testing::Values(
        Case{"prefixes used below the root are declared where used, unused ones never",
             "<e:Envelope xmlns:e='urn:e' xmlns:u='urn:unused' xmlns:w='urn:w'><e:Body w:Id='b'>"
             "<a:Item xmlns:a='urn:a' xmlns:z='urn:z'><a:Leaf/></a:Item></e:Body></e:Envelope>",
             "Body", nullptr, false},
        Case{"a default namespace inherited, then undeclared and declared again",
             "<Root xmlns='urn:default'><Part><Inner xmlns=''><Deep xmlns='urn:default'/></Inner></Part></Root>",
             "Part", nullptr, false},
        Case{"an unqualified root under a default namespace declares nothing",
             "<Root xmlns='urn:default'><p:Part xmlns:p='urn:p'><Plain xmlns=''/></p:Part></Root>", "Plain",
             nullptr, false},
        Case{"a prefix redeclared with another URI below, and the first again further down",
             "<a:Top xmlns:a='urn:one'><a:Mid xmlns:a='urn:two'><a:Low xmlns:a='urn:one'/><a:Same/></a:Mid></a:Top>",
             "Top", nullptr, false},
        Case{"attributes ordered by namespace URI then local name, unqualified first; xml:* kept as written",
             "<r xmlns:z='urn:a' xmlns:a='urn:z' a:b='1' z:c='2' d='3' xml:lang='en' c='4' z:a='5'/>", "r", nullptr,
             false},
        Case{"escaping in text and attribute values",
             "<r v='a&amp;b&lt;c&gt;d&quot;e&#9;f&#10;g&#13;h'>1 &amp; 2 &lt; 3 &gt; 0 \"q\" 'a'&#13;&#9;\n</r>", "r",
             nullptr, false},
        Case{"non-ASCII text and CDATA as text", "<r>J\xC3\xBCrgen <![CDATA[<not markup> & more]]></r>", "r", nullptr,
             false},
        Case{"comments left out", "<r><!-- gone --><a>x<!--also gone--></a><?pi data?><?bare?></r>", "r", nullptr,
             false},
        Case{"comments kept", "<r><!-- kept --><a>x<!--also--></a><?pi data?></r>", "r", nullptr, true},
        Case{"an excluded subtree and the whitespace around it",
             "<s:A xmlns:s='urn:s' xmlns:ds='urn:ds' ID='_1'>\n  <s:B>b</s:B>\n  <ds:Signature><ds:V>v</ds:V>"
             "</ds:Signature>\n  <s:C/>\n</s:A>",
             "A", "Signature", false},
        Case{"empty elements written as start and end tags", "<r><a/><b></b><c x='1'/></r>", "r", nullptr, false},
        Case{"inclusive prefixes declared from above the root, once, and again where redeclared",
             "<s:A xmlns:s='urn:s' xmlns:xsi='urn:xsi' xmlns:x='urn:x'><s:B t='xsi:type'><s:C xmlns:xsi='urn:other'>"
             "<s:D/></s:C></s:B></s:A>",
             "B", nullptr, false, "xsi  x\tmissing"},
        Case{"an inclusive prefix the subtree also uses",
             "<s:A xmlns:s='urn:s'><s:B><s:C/></s:B></s:A>", "B", nullptr, false, "s"},
        Case{"the token vectors' shape: a signed assertion naming xsi inclusively",
             "<saml2:Assertion xmlns:saml2='urn:oasis:names:tc:SAML:2.0:assertion' "
             "xmlns:xsi='http://www.w3.org/2001/XMLSchema-instance' ID='_a'><saml2:Subject>"
             "<saml2:SubjectConfirmationData xsi:type='saml2:KeyInfoConfirmationDataType'/></saml2:Subject>"
             "<ds:Signature xmlns:ds='http://www.w3.org/2000/09/xmldsig#'/></saml2:Assertion>",
             "Assertion", "Signature", false, "xsi"}),
    [](const testing::TestParamInfo<Case>& info) { return "Row" + std::to_string(info.index); });

struct LeftToLibXml2 {
  const char* name;
  const char* document;
  const char* inclusivePrefixes;
};

class LeftToLibXml2Test : public testing::TestWithParam<LeftToLibXml2> {};

// The writer declines, and the canonical form (or libxml2's error) is libxml2's.
TEST_P(LeftToLibXml2Test, WriterDeclinesAndLibXml2Decides) {
  const LeftToLibXml2& row = GetParam();
  SCOPED_TRACE(row.name);
  Ref<Document> document = XmlTest::Parse(row.document);
  xmlNodePtr root = ToXmlNode(document->GetRootElement());
  std::string written;
  EXPECT_FALSE(WriteExclusiveCanonicalForm(root, nullptr, false, SplitPrefixList(row.inclusivePrefixes), written));

  const Canonicalization form{xmlSecTransformExclC14NId, false, row.inclusivePrefixes};
  std::string expected;
  try {
    expected = CanonicalizeSubtreeWithLibXml2(root, nullptr, form);
  } catch (const XmlSecurityException& e) {
    expected = e.what();
  }
  try {
    EXPECT_EQ(expected, CanonicalizeSubtree(root, nullptr, form));
  } catch (const XmlSecurityException& e) {
    EXPECT_EQ(expected, e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Table, LeftToLibXml2Test,
    testing::Values(LeftToLibXml2{"a namespace URI with a character to escape", "<p:r xmlns:p='urn:a&amp;b'/>", ""},
                    LeftToLibXml2{"a relative namespace URI", "<p:r xmlns:p='relative/path'/>", ""},
                    LeftToLibXml2{"a declaration the subtree does not use",
                                  "<r xmlns:p='relative'><c/></r>", ""},
                    LeftToLibXml2{"the default namespace listed as inclusive",
                                  "<r xmlns='urn:d'><c xmlns=''/></r>", "#default"}),
    [](const testing::TestParamInfo<LeftToLibXml2>& info) { return "Row" + std::to_string(info.index); });

TEST(ExclusiveCanonicalWriterTest, InclusiveFormIsLibXml2s) {
  Ref<Document> document = XmlTest::Parse("<r xmlns:x='urn:x' xml:lang='de'><c t='x:v'><d/></c></r>");
  xmlNodePtr child = ToXmlNode(document->GetRootElement())->children;
  const Canonicalization form{xmlSecTransformInclC14NId, false, ""};
  EXPECT_EQ("<c xmlns:x=\"urn:x\" t=\"x:v\" xml:lang=\"de\"><d></d></c>", CanonicalizeSubtree(child, nullptr, form));
}

// Built trees can hold an unqualified element below a default namespace declaration that its
// serialisation puts it under; the canonical form must follow the serialisation, as libxml2's does.
TEST(ExclusiveCanonicalWriterTest, UnqualifiedBuiltElementFollowsItsSerialisation) {
  Ref<Document> document = XmlTest::Parse("<r xmlns='urn:d'><c/></r>");
  xmlNodePtr root = ToXmlNode(document->GetRootElement());
  xmlNodePtr plain = xmlNewDocNode(root->doc, nullptr, BAD_CAST "plain", nullptr);
  xmlAddChild(root->children, plain);  // no namespace of its own
  const Canonicalization form{xmlSecTransformExclC14NId, false, ""};
  EXPECT_EQ(CanonicalizeSubtreeWithLibXml2(root, nullptr, form), CanonicalizeSubtree(root, nullptr, form));
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
