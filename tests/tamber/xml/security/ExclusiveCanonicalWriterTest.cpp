// The signer's own exclusive canonicalisation against libxml2's on the same subtrees: namespaces
// inherited, redeclared and undeclared, attribute order, escaping, comments, an excluded subtree.

#include <gtest/gtest.h>

#include <string>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/XmlTestSupport.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/ExclusiveCanonicalWriter.h"
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
  ASSERT_TRUE(WriteExclusiveCanonicalForm(root, excluded, row.withComments, written));
  EXPECT_EQ(CanonicalizeSubtree(root, excluded, Canonicalization{algorithm, row.withComments, ""}), written);
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
        Case{"empty elements written as start and end tags", "<r><a/><b></b><c x='1'/></r>", "r", nullptr, false}),
    [](const testing::TestParamInfo<Case>& info) { return "Row" + std::to_string(info.index); });

TEST(ExclusiveCanonicalWriterTest, LeavesNamespaceUrisThatNeedEscapingToLibXml2) {
  Ref<Document> document = XmlTest::Parse("<p:r xmlns:p='urn:a&amp;b'><p:c/></p:r>");
  xmlNodePtr root = ToXmlNode(document->GetRootElement());
  std::string written;
  EXPECT_FALSE(WriteExclusiveCanonicalForm(root, nullptr, false, written));

  const Canonicalization form{xmlSecTransformExclC14NId, false, ""};
  EXPECT_EQ(CanonicalizeSubtree(root, nullptr, form), CanonicalizeBuiltSubtree(root, nullptr, form));
}

TEST(ExclusiveCanonicalWriterTest, InclusivePrefixesAndInclusiveFormsGoToLibXml2) {
  Ref<Document> document =
      XmlTest::Parse("<r xmlns:x='urn:x' xmlns:y='urn:y'><c t='x:v' xml:lang='de'><d/></c></r>");
  xmlNodePtr child = ToXmlNode(document->GetRootElement())->children;
  for (const Canonicalization& form : {Canonicalization{xmlSecTransformExclC14NId, false, "x"},
                                       Canonicalization{xmlSecTransformInclC14NId, false, ""}}) {
    EXPECT_EQ(CanonicalizeSubtree(child, nullptr, form), CanonicalizeBuiltSubtree(child, nullptr, form));
  }
  EXPECT_EQ("<c xmlns:x=\"urn:x\" t=\"x:v\" xml:lang=\"de\"><d></d></c>",
            CanonicalizeBuiltSubtree(child, nullptr, Canonicalization{xmlSecTransformExclC14NId, false, "x"}));
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
