#include "ssoClient/XmlUtils.h"

#include <climits>
#include <cstring>
#include <typeinfo>

#include <boost/make_shared.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "tamber/Exception.h"

namespace SsoClient {
namespace {

using Tamber::Ref;
using Tamber::Xml::Document;
using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;
using Tamber::Xml::QName;
using Tamber::Xml::TextNode;

Ref<Document> Parse(const std::string& text) {
  Ref<Document> doc;
  ParseXML(text, doc);
  return doc;
}

boost::shared_ptr<const NodeFilter> SkipFilter() { return boost::make_shared<SkipWsAndCommentsFilter>(); }

// A node that claims to be text without being a TextNode.
class FalseTextNode : public Node {
 public:
  int GetKind() const override { return TEXT; }
  Node* GetFirstChild() const override { return nullptr; }
  Node* GetNextSibling() const override { return nullptr; }
  Node* GetParent() const override { return nullptr; }
  Document* GetOwnerDocument() const override { return nullptr; }
  int GetLine() const override { return 0; }
  int GetColumn() const override { return 0; }
};

// A node whose first child is `child`.
class ParentOf : public FalseTextNode {
 public:
  explicit ParentOf(Node* child) : _child(child) {}
  int GetKind() const override { return ELEMENT; }
  Node* GetFirstChild() const override { return _child; }

 private:
  Node* _child;
};

// ---- SkipWsAndCommentsFilter

struct FilterCase {
  const char* label;
  const char* content;  // the only content of the root element
  int kind;
  bool accepted;
};

class SkipWsAndCommentsFilterTest : public testing::TestWithParam<FilterCase> {};

TEST_P(SkipWsAndCommentsFilterTest, AcceptsFirstChild) {
  const FilterCase& row = GetParam();
  SCOPED_TRACE(row.label);
  Ref<Document> doc = Parse(std::string("<r>") + row.content + "</r>");
  Node* child = doc->GetRootElement()->GetFirstChild();
  ASSERT_NE(nullptr, child);
  ASSERT_EQ(row.kind, child->GetKind());
  EXPECT_EQ(row.accepted, SkipWsAndCommentsFilter().Accept(child));
}

INSTANTIATE_TEST_SUITE_P(
    Table, SkipWsAndCommentsFilterTest,
    testing::Values(FilterCase{"non-breaking space", "&#160;", Node::TEXT, true},
                    FilterCase{"word between blanks", " \t a \n", Node::TEXT, true},
                    FilterCase{"em space", "&#x2003;", Node::TEXT, true},
                    FilterCase{"blanks only", " \t\n ", Node::TEXT, false},
                    FilterCase{"carriage returns", "&#13;&#13; ", Node::TEXT, false},
                    FilterCase{"single space", " ", Node::TEXT, false},
                    FilterCase{"comment", "<!-- note -->", Node::COMMENT, false},
                    FilterCase{"element", "<e/>", Node::ELEMENT, true},
                    FilterCase{"processing instruction", "<?pi data?>", Node::PROCESSING_INSTRUCTION, true},
                    FilterCase{"blank CDATA section", "<![CDATA[ ]]>", Node::CDATA_SECTION, true}));

TEST(SkipWsAndCommentsFilterTest, RejectsEmptyText) {
  Ref<TextNode> empty;
  Tamber::Xml::CreateTextNode("", empty);
  EXPECT_FALSE(SkipWsAndCommentsFilter().Accept(empty.get()));
}

TEST(SkipWsAndCommentsFilterTest, TextKindOnOtherNodeIsTypeMismatch) {
  FalseTextNode node;
  EXPECT_THROW(SkipWsAndCommentsFilter().Accept(&node), Tamber::TypeMismatchException);
}

// ---- NodeFilterIterator

const char WALK[] =
    "<r>\n"
    "  <!-- leading -->\n"
    "  <a/>\n"
    "  text\n"
    "  <b/>  <!-- trailing --> \n"
    "</r>";

std::string LocalName(const NodeFilterIterator& it) {
  ElementNode* element = IteratorToElement(it);
  return element == nullptr ? std::string() : element->GetLocalName();
}

TEST(NodeFilterIteratorTest, WalksAcceptedChildrenToEnd) {
  Ref<Document> doc = Parse(WALK);
  NodeFilterIterator it = NodeFilterIterator(doc->GetRootElement(), SkipFilter()).GetChild();
  EXPECT_EQ("a", LocalName(it));
  it.MoveToSibling();
  ASSERT_FALSE(it.AtEnd());
  ASSERT_EQ(Node::TEXT, it.GetNode()->GetKind());
  EXPECT_EQ("\n  text\n  ", GetText(Tamber::DynamicCast<TextNode>(it.GetNode())));
  EXPECT_EQ("b", LocalName(it.MoveToSibling()));
  EXPECT_TRUE(it.MoveToSibling().AtEnd());
}

TEST(NodeFilterIteratorTest, ElementWithOnlyBlanksAndCommentsHasNoChild) {
  for (const char* text : {"<r/>", "<r></r>", "<r> <!-- a --> \n\t<!-- b --></r>"}) {
    SCOPED_TRACE(text);
    Ref<Document> doc = Parse(text);
    EXPECT_TRUE(NodeFilterIterator(doc->GetRootElement(), SkipFilter()).GetChild().AtEnd());
  }
}

TEST(NodeFilterIteratorTest, GetChildLeavesIteratorUnchanged) {
  Ref<Document> doc = Parse(WALK);
  const NodeFilterIterator root(doc->GetRootElement(), SkipFilter());
  const NodeFilterIterator child = root.GetChild();
  EXPECT_EQ(doc->GetRootElement(), root.GetNode());
  EXPECT_EQ("a", LocalName(child));
}

TEST(NodeFilterIteratorTest, StartNodeIsNotFiltered) {
  Ref<Document> doc = Parse(WALK);
  Node* blank = doc->GetRootElement()->GetFirstChild();
  ASSERT_EQ(Node::TEXT, blank->GetKind());
  NodeFilterIterator it(blank, SkipFilter());
  EXPECT_EQ(blank, it.GetNode());
  EXPECT_EQ(nullptr, IteratorToElement(it));
  EXPECT_EQ("a", LocalName(it.MoveToSibling()));
}

TEST(NodeFilterIteratorTest, CopiesMoveIndependently) {
  Ref<Document> doc = Parse(WALK);
  NodeFilterIterator first = NodeFilterIterator(doc->GetRootElement(), SkipFilter()).GetChild();
  NodeFilterIterator second = first;
  second.MoveToSibling().MoveToSibling();
  EXPECT_EQ("a", LocalName(first));
  EXPECT_EQ("b", LocalName(second));
  first = second;
  EXPECT_EQ("b", LocalName(first));
}

TEST(NodeFilterIteratorTest, MovesAtEndStayAtEnd) {
  NodeFilterIterator it(nullptr, SkipFilter());
  EXPECT_TRUE(it.MoveToSibling().AtEnd());
  EXPECT_TRUE(it.MoveToChild().AtEnd());
  EXPECT_TRUE(it.GetChild().AtEnd());
  EXPECT_EQ(nullptr, IteratorToElement(it));
}

// ---- ParseXML

TEST(ParseXMLTest, ReplacesDocument) {
  Ref<Document> doc = Parse("<first/>");
  ParseXML("<second xmlns='urn:x'/>", doc);
  ASSERT_TRUE(doc);
  EXPECT_EQ("second", doc->GetRootElement()->GetLocalName());
  EXPECT_EQ("urn:x", doc->GetRootElement()->GetNamespaceURI());
}

TEST(ParseXMLTest, ParseErrorPassesThroughAndKeepsDocument) {
  for (const char* text : {"<a>", "", "<a></b>", "<!DOCTYPE a [<!ENTITY e 'x'>]><a>&e;</a>"}) {
    SCOPED_TRACE(text);
    Ref<Document> doc = Parse("<kept/>");
    Document* before = doc.get();
    try {
      ParseXML(text, doc);
      ADD_FAILURE() << "no exception";
    } catch (const Tamber::Xml::XMLParseException& e) {
      EXPECT_EQ(typeid(Tamber::Xml::XMLParseException), typeid(e));
    }
    EXPECT_EQ(before, doc.get());
  }
}

// Hands out its text a byte at a time, then optionally fails.
class TrickleReader : public Tamber::Reader {
 public:
  TrickleReader(const std::string& text, bool failAtEnd) : _text(text), _failAtEnd(failAtEnd) {}
  size_t Read(char* buffer, size_t size) override {
    if (_position == _text.size()) {
      if (_failAtEnd) throw Tamber::IOException("connection reset");
      return 0;
    }
    if (size == 0) return 0;
    buffer[0] = _text[_position++];
    return 1;
  }

 private:
  std::string _text;
  bool _failAtEnd;
  size_t _position = 0;
};

TEST(ParseXMLTest, ReadsWholeStream) {
  Ref<Tamber::Reader> reader(new TrickleReader("<r><a>x</a><b/></r>", false));
  Ref<Document> doc;
  ParseXML(reader.get(), doc);
  ASSERT_TRUE(doc);
  EXPECT_EQ("b",
            LocalName(NodeFilterIterator(doc->GetRootElement(), SkipFilter()).GetChild().MoveToSibling()));
}

TEST(ParseXMLTest, ReaderFailurePassesThroughAndKeepsDocument) {
  Ref<Tamber::Reader> reader(new TrickleReader("<r/>", true));
  Ref<Document> doc = Parse("<kept/>");
  Document* before = doc.get();
  EXPECT_THROW(ParseXML(reader.get(), doc), Tamber::IOException);
  EXPECT_EQ(before, doc.get());
}

// ---- GetTextNode, GetText

TEST(GetTextNodeTest, LooksAtFirstChildOnly) {
  Ref<Document> doc = Parse("<r><t> a b </t><e><x/>late text</e><n/></r>");
  NodeFilterIterator it = NodeFilterIterator(doc->GetRootElement(), SkipFilter()).GetChild();
  EXPECT_EQ(" a b ", GetText(GetTextNode(it.GetNode())));
  EXPECT_EQ(nullptr, GetTextNode(it.MoveToSibling().GetNode()));
  EXPECT_EQ(nullptr, GetTextNode(it.MoveToSibling().GetNode()));
}

TEST(GetTextNodeTest, NullInputs) {
  EXPECT_EQ(nullptr, GetTextNode(nullptr));
  EXPECT_EQ("", GetText(nullptr));
}

TEST(GetTextNodeTest, TextKindOnOtherNodeIsTypeMismatch) {
  FalseTextNode child;
  ParentOf parent(&child);
  EXPECT_THROW(GetTextNode(&parent), Tamber::TypeMismatchException);
}

// ---- ResolveQName

const char SCOPES[] =
    "<r xmlns='urn:default' xmlns:xs='urn:xs'>\n"
    "  <a xmlns:own='urn:own'>\n"
    "    <b xmlns:self='urn:self'/>\n"
    "  </a>\n"
    "</r>";

ElementNode* FindB(const Ref<Document>& doc) {
  return doc->GetRootElement()->FindChildElementByLocalName("a")->FindChildElementByLocalName("b");
}

struct ResolveCase {
  const char* name;
  const char* defaultNamespace;
  const char* expectedNamespace;
  const char* expectedLocalName;
};

class ResolveQNameTest : public testing::TestWithParam<ResolveCase> {};

TEST_P(ResolveQNameTest, Resolves) {
  const ResolveCase& row = GetParam();
  SCOPED_TRACE(row.name);
  Ref<Document> doc = Parse(SCOPES);
  QName result;
  ResolveQName(FindB(doc), row.name, row.defaultNamespace, result);
  EXPECT_EQ(QName(row.expectedNamespace, row.expectedLocalName), result);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ResolveQNameTest,
    testing::Values(
        // Unprefixed names take the namespace the caller gives, not the in-scope default.
        ResolveCase{"ID", "", "", "ID"}, ResolveCase{"string", "urn:given", "urn:given", "string"},
        ResolveCase{"xs:string", "", "urn:xs", "string"},
        ResolveCase{"own:thing", "urn:given", "urn:own", "thing"}, ResolveCase{"self:x", "", "urn:self", "x"},
        ResolveCase{"xs:a:b", "", "urn:xs", "a:b"}));

class ResolveQNameFailureTest : public testing::TestWithParam<std::pair<const char*, const char*>> {};

TEST_P(ResolveQNameFailureTest, NamesElementPositionAndPrefix) {
  const std::string name = GetParam().first;
  const std::string prefix = GetParam().second;
  SCOPED_TRACE(name);
  Ref<Document> doc = Parse(SCOPES);
  ElementNode* b = FindB(doc);
  ASSERT_EQ(3, b->GetLine());
  QName result("urn:kept", "kept");
  try {
    ResolveQName(b, name, "urn:default", result);
    FAIL() << "no exception";
  } catch (const ParseException& e) {
    EXPECT_EQ("Element bat 3," + std::to_string(b->GetColumn()) + " uses undefined prefix: `" + prefix + "'",
              e.what());
  }
  EXPECT_EQ(QName("urn:kept", "kept"), result);
}

INSTANTIATE_TEST_SUITE_P(Table, ResolveQNameFailureTest,
                         testing::Values(std::make_pair("zz:string", "zz"), std::make_pair("XS:string", "XS"),
                                         // An empty prefix is no way to name the default namespace.
                                         std::make_pair(":string", "")));

// ---- DateTimeFormatter, AddMinutesToDate

using Tamber::System::DateTime;

TEST(DateTimeFormatterTest, WritesMessageForm) {
  const std::pair<const char*, const char*> rows[] = {
      {"2009-03-05T07:08:09.004Z", "2009-03-05T07:08:09.004Z"},
      {"2009-03-05T07:08:09.004999Z", "2009-03-05T07:08:09.004Z"},
      {"2024-12-31T23:59:59Z", "2024-12-31T23:59:59.000Z"},
      {"2009-03-05T08:08:09+01:00", "2009-03-05T07:08:09.000Z"},
      {"0999-01-02T03:04:05.5Z", "0999-01-02T03:04:05.500Z"},
      {"0001-01-01T00:00:00Z", "0001-01-01T00:00:00.000Z"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.first);
    EXPECT_EQ(row.second, DateTimeFormatter(DateTime(row.first)));
  }
}

struct ShiftCase {
  const char* date;
  int minutes;
  const char* expected;
};

class AddMinutesToDateTest : public testing::TestWithParam<ShiftCase> {};

TEST_P(AddMinutesToDateTest, Shifts) {
  const ShiftCase& row = GetParam();
  SCOPED_TRACE(std::string(row.date) + " " + std::to_string(row.minutes));
  EXPECT_EQ(DateTime(row.expected), AddMinutesToDate(DateTime(row.date), row.minutes));
}

INSTANTIATE_TEST_SUITE_P(
    Table, AddMinutesToDateTest,
    testing::Values(ShiftCase{"2009-03-05T07:08:09.004Z", 0, "2009-03-05T07:08:09.004Z"},
                    ShiftCase{"2009-03-05T07:08:09.004Z", 10, "2009-03-05T07:18:09.004Z"},
                    ShiftCase{"2009-03-05T07:08:09.004Z", -10, "2009-03-05T06:58:09.004Z"},
                    ShiftCase{"2009-12-31T23:55:00Z", 10, "2010-01-01T00:05:00Z"},
                    ShiftCase{"2008-03-01T00:05:00Z", -10, "2008-02-29T23:55:00Z"},
                    ShiftCase{"2009-03-05T07:08:09Z", 1440, "2009-03-06T07:08:09Z"}));

TEST(AddMinutesToDateExtremesTest, ProductDoesNotOverflow) {
  const int64_t minuteMicros = 60000000;
  const DateTime epoch("1970-01-01T00:00:00Z");
  EXPECT_EQ(int64_t{INT_MAX} * minuteMicros, AddMinutesToDate(epoch, INT_MAX).GetUtcTime());

  const DateTime late("9999-12-31T23:59:59Z");
  EXPECT_EQ(late.GetUtcTime() + int64_t{INT_MIN} * minuteMicros,
            AddMinutesToDate(late, INT_MIN).GetUtcTime());
}

TEST(AddMinutesToDateExtremesTest, OutOfRangeResultIsRefused) {
  EXPECT_THROW(AddMinutesToDate(DateTime("1970-01-01T00:00:00Z"), INT_MIN), Tamber::InvalidArgumentException);
  EXPECT_THROW(AddMinutesToDate(DateTime("9999-12-31T23:59:59Z"), 1), Tamber::InvalidArgumentException);
}

}  // namespace
}  // namespace SsoClient
