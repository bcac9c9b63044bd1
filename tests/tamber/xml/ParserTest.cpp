#include "tamber/xml/Parser.h"

#include <cstdio>
#include <fstream>
#include <functional>
#include <string>

#include <gtest/gtest.h>

#include "tamber/xml/SafeParse.h"
#include "tamber/xml/XmlTestSupport.h"

using Tamber::Ref;
using Tamber::Xml::Document;
using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;
using Tamber::Xml::QName;
using Tamber::Xml::TextNode;
using Tamber::Xml::XMLParseException;
using XmlTest::Parse;

namespace {

std::string Repeat(const std::string& text, size_t count) {
  std::string result;
  result.reserve(text.size() * count);
  for (size_t i = 0; i < count; ++i) result += text;
  return result;
}

std::string Nested(int depth) { return Repeat("<a>", depth) + Repeat("</a>", depth); }

std::string WithAttributes(int count, const std::string& namePrefix, const std::string& value) {
  std::string text = "<a";
  for (int i = 0; i < count; ++i) text += " " + namePrefix + std::to_string(i) + "=\"" + value + "\"";
  return text + "/>";
}

// Elements nested `depth` deep, each declaring `perElement` prefixes.
std::string NamespacesInScope(int depth, int perElement) {
  std::string text;
  for (int i = 0; i < depth; ++i) {
    text += "<e";
    for (int j = 0; j < perElement; ++j) text += " xmlns:p" + std::to_string(i) + "_" + std::to_string(j) + "=\"urn:x\"";
    text += ">";
  }
  for (int i = 0; i < depth; ++i) text += "</e>";
  return text;
}

// Elements of one mebibyte of text each (libxml2 bounds a text node at ten), padded with blanks
// to a document of exactly `size` bytes.
std::string DocumentOfSize(size_t size) {
  const std::string piece = "<a>" + std::string(1 << 20, 'x') + "</a>";
  const size_t bodySize = size - std::string("<r></r>").size();
  std::string body;
  while (body.size() + piece.size() <= bodySize) body += piece;
  body.append(bodySize - body.size(), ' ');
  return "<r>" + body + "</r>";
}

std::string Utf16Le(const std::string& ascii) {
  std::string text = "\xFF\xFE";
  for (char c : ascii) {
    text += c;
    text += '\0';
  }
  return text;
}

// A file whose content must never show up anywhere.
class MarkerFile {
 public:
  MarkerFile() : _path(testing::TempDir() + "tamber-parser-marker.txt") { std::ofstream(_path) << kContent; }
  ~MarkerFile() { std::remove(_path.c_str()); }
  std::string Url() const { return "file://" + _path; }
  static constexpr const char* kContent = "MARKER-CONTENT-7f3e";

 private:
  std::string _path;
};

struct Hostile {
  const char* name;
  std::function<std::string()> text;
  const char* message;
};

class HostileInputTest : public ::testing::TestWithParam<Hostile> {};

TEST_P(HostileInputTest, IsRefusedWithAMessageNamingLineAndProblem) {
  SCOPED_TRACE(GetParam().name);
  const std::string text = GetParam().text();
  testing::internal::CaptureStderr();
  try {
    Parse(text);
    ADD_FAILURE() << "no exception";
  } catch (const XMLParseException& e) {
    EXPECT_EQ(GetParam().message, std::string(e.what()));
    EXPECT_EQ(std::string::npos, std::string(e.what()).find(MarkerFile::kContent));
  }
  // Nothing of libxml2's own reporting reaches stderr.
  EXPECT_EQ("", testing::internal::GetCapturedStderr());
}

const MarkerFile marker;

INSTANTIATE_TEST_SUITE_P(
    Cases, HostileInputTest,
    ::testing::Values(
        Hostile{"doctype_internal_entity",
                [] { return "<?xml version=\"1.0\"?>\n<!DOCTYPE r [<!ENTITY e \"x\">]>\n<r>&e;</r>"; },
                "XML parse error at line 2, column 13: DOCTYPE is not allowed"},
        Hostile{"billion_laughs",
                [] {
                  std::string text = "<?xml version=\"1.0\"?>\n<!DOCTYPE lolz [\n<!ENTITY lol \"lol\">\n";
                  for (int i = 1; i < 10; ++i) {
                    const std::string previous = i == 1 ? "lol" : "lol" + std::to_string(i - 1);
                    text += "<!ENTITY lol" + std::to_string(i) + " \"" + Repeat("&" + previous + ";", 10) + "\">\n";
                  }
                  return text + "]>\n<lolz>&lol9;</lolz>";
                },
                "XML parse error at line 2, column 16: DOCTYPE is not allowed"},
        Hostile{"external_entity",
                [] { return "<!DOCTYPE r [<!ENTITY e SYSTEM \"" + marker.Url() + "\">]>\n<r>&e;</r>"; },
                "XML parse error at line 1, column 13: DOCTYPE is not allowed"},
        Hostile{"external_parameter_entity",
                [] { return "<!DOCTYPE r [<!ENTITY % p SYSTEM \"" + marker.Url() + "\"> %p;]><r/>"; },
                "XML parse error at line 1, column 13: DOCTYPE is not allowed"},
        Hostile{"external_dtd", [] { return "<!DOCTYPE r SYSTEM \"http://127.0.0.1:1/r.dtd\">\n<r/>"; },
                "XML parse error at line 1, column 46: DOCTYPE is not allowed"},
        Hostile{"dtd_attribute_default", [] { return "<!DOCTYPE r [<!ATTLIST r a CDATA \"injected\">]><r/>"; },
                "XML parse error at line 1, column 13: DOCTYPE is not allowed"},
        Hostile{"utf7_hiding_a_doctype",
                [] { return "<?xml version=\"1.0\" encoding=\"UTF-7\"?>+ADw-!DOCTYPE r+AD4-<r/>"; },
                "XML parse error at line 1, column 39: encoding 'UTF-7' is not allowed "
                "(UTF-8, UTF-16, ISO-8859-1 or US-ASCII expected)"},
        Hostile{"utf16_doctype", [] { return Utf16Le("<!DOCTYPE r>\n<r/>"); },
                "XML parse error at line 1, column 12: DOCTYPE is not allowed"},
        Hostile{"undeclared_entity", [] { return "<r>\n  &e;</r>"; },
                "XML parse error at line 2, column 6: Entity 'e' not defined"},
        Hostile{"nesting_300_deep", [] { return Nested(300); },
                "XML parse error at line 1, column 771: elements are nested deeper than 256 levels"},
        Hostile{"attributes_257", [] { return WithAttributes(257, "a", ""); },
                "XML parse error at line 1, column 1949: an element has more than 256 attributes"},
        Hostile{"attributes_50000", [] { return WithAttributes(50000, "a", ""); },
                "XML parse error at line 1, column 3755: an element has more than 256 attributes"},
        Hostile{"attributes_and_declarations_257",
                [] { return "<a xmlns:p=\"urn:p\"" + WithAttributes(256, "p:a", "").substr(2); },
                "XML parse error at line 1, column 2469: an element has more than 256 attributes"},
        Hostile{"namespace_declarations_50000", [] { return WithAttributes(50000, "xmlns:p", "urn:x"); },
                "XML parse error at line 1, column 7752: more than 256 namespace declarations are in scope"},
        Hostile{"namespace_declarations_in_scope_300", [] { return NamespacesInScope(100, 3); },
                "XML parse error at line 1, column 5388: more than 256 namespace declarations are in scope"},
        Hostile{"truncated", [] { return "<r>\n<b>text"; },
                "XML parse error at line 2, column 8: Premature end of data in tag b line 2"},
        Hostile{"invalid_utf8", [] { return "<r>\xC3\x28</r>"; },
                "XML parse error at line 1, column 4: Input is not proper UTF-8, indicate encoding ! "
                "Bytes: 0xC3 0x28 0x3C 0x2F"},
        Hostile{"nul_byte", [] { return std::string("<r>a\0b</r>", 10); },
                "XML parse error at line 1, column 5: Char 0x0 out of allowed range"},
        Hostile{"empty", [] { return ""; }, "XML parse error at line 1, column 1: Document is empty"},
        Hostile{"whitespace_only", [] { return " \n "; },
                "XML parse error at line 2, column 2: Start tag expected, '<' not found"},
        Hostile{"over_16_mib", [] { return DocumentOfSize(Tamber::Xml::kMaxDocumentBytes + 1); },
                "XML parse error at line 1, column 16776001: the document is larger than 16777216 bytes"},
        Hostile{"unbound_prefix", [] { return "<r><p:a/></r>"; },
                "XML parse error at line 1, column 8: Namespace prefix p on a is not defined"},
        Hostile{"duplicate_attribute", [] { return "<r x=\"1\" x=\"2\"/>"; },
                "XML parse error at line 1, column 15: Attribute x redefined"},
        Hostile{"duplicate_attribute_through_two_prefixes",
                [] { return "<r xmlns:a=\"u\" xmlns:b=\"u\" a:x=\"1\" b:x=\"2\"/>"; },
                "XML parse error at line 1, column 43: Namespaced Attribute x in 'u' redefined"},
        Hostile{"second_root", [] { return "<r/><s/>"; },
                "XML parse error at line 1, column 5: Extra content at the end of the document"},
        Hostile{"ebcdic", [] { return std::string("\x4C\x6F\xA7\x94\x93\x40\xA5\x85\x99\xA2\x89\x96\x95\x7E\x7F\xF1\x4B\xF0\x7F\x6F\x6E\x4C\x81\x61\x6E"); },
                "XML parse error at line 1, column 22: encoding 'EBCDIC-US' is not allowed "
                "(UTF-8, UTF-16, ISO-8859-1 or US-ASCII expected)"}),
    [](const ::testing::TestParamInfo<Hostile>& info) { return std::string(info.param.name); });

// --- Streams -----------------------------------------------------------------------------------

// An endless document: "<r>", then elements of one mebibyte of text, forever.
class EndlessReader : public Tamber::Reader {
 public:
  size_t Read(char* buffer, size_t size) override {
    static const std::string piece = "<a>" + std::string(1 << 20, 'x') + "</a>";
    for (size_t i = 0; i < size; ++i, ++_position) {
      buffer[i] = _position < 3 ? "<r>"[_position] : piece[(_position - 3) % piece.size()];
    }
    return size;
  }
  size_t GetPosition() const { return _position; }

 private:
  size_t _position = 0;
};

TEST(XMLParser, StopsReadingOnceTheInputPassesTheBound) {
  Ref<EndlessReader> reader(new EndlessReader());
  EXPECT_THROW(XmlTest::ParseReader(reader.get()), XMLParseException);
  EXPECT_EQ(Tamber::Xml::kMaxDocumentBytes + 1, reader->GetPosition());
}

class FailingReader : public Tamber::Reader {
 public:
  size_t Read(char* buffer, size_t size) override {
    if (_calls++ > 0) throw Tamber::IOException("connection reset");
    const std::string start = "<r><a>";
    const size_t count = std::min(size, start.size());
    start.copy(buffer, count);
    return count;
  }

 private:
  int _calls = 0;
};

TEST(XMLParser, ReaderFailurePassesThroughUnchanged) {
  Ref<FailingReader> reader(new FailingReader());
  try {
    XmlTest::ParseReader(reader.get());
    FAIL() << "no exception";
  } catch (const XMLParseException& e) {
    FAIL() << e.what();
  } catch (const Tamber::IOException& e) {
    EXPECT_STREQ("connection reset", e.what());
  }
}

TEST(XMLParser, RefusesANullReaderAndAForeignHandler) {
  Ref<Tamber::Xml::DocumentHandler> handler;
  Tamber::Xml::CreateXMLDocumentHandler(handler);
  Ref<Tamber::Xml::XMLParser> parser;
  Tamber::Xml::CreateXMLParser(handler.get(), parser);
  Ref<Tamber::Object> result;
  EXPECT_THROW(parser->Parse(nullptr, result), Tamber::InvalidArgumentException);
  EXPECT_EQ(nullptr, result.get());

  class OtherHandler : public Tamber::Xml::DocumentHandler {};
  Ref<Tamber::Xml::DocumentHandler> other(new OtherHandler());
  Ref<Tamber::Xml::XMLParser> refused;
  try {
    Tamber::Xml::CreateXMLParser(other.get(), refused);
    FAIL() << "no exception";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : the parser needs a handler made by CreateXMLDocumentHandler", e.what());
  }
  EXPECT_EQ(nullptr, refused.get());
}

TEST(XMLParser, ResultIsLeftAloneOnFailure) {
  Ref<Tamber::Xml::DocumentHandler> handler;
  Tamber::Xml::CreateXMLDocumentHandler(handler);
  Ref<Tamber::Xml::XMLParser> parser;
  Tamber::Xml::CreateXMLParser(handler.get(), parser);
  Ref<Tamber::Object> result(Parse("<old/>"));
  Ref<Tamber::Reader> reader;
  Tamber::CreateStringReader("<new>", reader);
  EXPECT_THROW(parser->Parse(reader.get(), result), XMLParseException);
  EXPECT_EQ("old", Tamber::DynamicCast<Document>(result.get())->GetRootElement()->GetLocalName());
}

// --- Accepted documents ------------------------------------------------------------------------

TEST(XMLParser, AcceptsTheBoundsThemselves) {
  EXPECT_NE(nullptr, Parse(Nested(256))->GetRootElement());
  EXPECT_NE(nullptr, Parse(WithAttributes(256, "a", ""))->GetRootElement());
  EXPECT_NE(nullptr, Parse(NamespacesInScope(128, 2))->GetRootElement());
  EXPECT_NE(nullptr, Parse(DocumentOfSize(Tamber::Xml::kMaxDocumentBytes))->GetRootElement());
}

TEST(XMLParser, AcceptsDeclarationBomCommentsAndWhitespace) {
  Ref<Document> document = Parse(
      "\xEF\xBB\xBF<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!-- before -->\n"
      "<r>\n  <!-- inside -->\n  <a/>\n</r>");
  Node* first = document->GetFirstChild();
  ASSERT_NE(nullptr, first);
  EXPECT_EQ(Node::COMMENT, first->GetKind());
  ElementNode* root = document->GetRootElement();
  EXPECT_EQ(first->GetNextSibling(), root);

  std::vector<int> kinds;
  for (Node* node = root->GetFirstChild(); node != nullptr; node = node->GetNextSibling()) {
    kinds.push_back(node->GetKind());
  }
  EXPECT_EQ((std::vector<int>{Node::TEXT, Node::COMMENT, Node::TEXT, Node::ELEMENT, Node::TEXT}), kinds);
  EXPECT_EQ("\n  ", Tamber::DynamicCast<TextNode>(root->GetFirstChild())->GetText());
}

TEST(XMLParser, ResolvesNamespaces) {
  Ref<Document> document = Parse(
      "<s:Envelope xmlns:s=\"urn:s\" xmlns=\"urn:d\"><s:Body><Item xmlns:x=\"urn:x\" x:id=\"7\" plain=\"p\"/>"
      "</s:Body></s:Envelope>");
  ElementNode* envelope = document->GetRootElement();
  EXPECT_EQ("urn:s", envelope->GetNamespaceURI());
  ElementNode* body = envelope->FindChildElement(QName("urn:s", "Body"));
  ASSERT_NE(nullptr, body);
  ElementNode* item = body->FindChildElement(QName("urn:d", "Item"));
  ASSERT_NE(nullptr, item);
  EXPECT_EQ("", item->GetPrefix());
  std::string value;
  EXPECT_TRUE(item->GetAttribute(QName("urn:x", "id"), value));
  EXPECT_EQ("7", value);
  EXPECT_TRUE(item->GetAttribute(QName("", "plain"), value));
  EXPECT_FALSE(item->GetAttribute(QName("urn:d", "plain"), value));
  EXPECT_EQ((std::vector<std::string>{"x:id", "plain", "xmlns:x"}), item->GetAttributeNames());
}

TEST(XMLParser, XIncludeStaysAPlainElement) {
  Ref<Document> document = Parse("<r xmlns:xi=\"http://www.w3.org/2001/XInclude\"><xi:include href=\"" +
                                 marker.Url() + "\" parse=\"text\"/></r>");
  Node* include = document->GetRootElement()->GetFirstChild();
  ASSERT_EQ(Node::ELEMENT, include->GetKind());
  EXPECT_EQ("include", Tamber::DynamicCast<ElementNode>(include)->GetLocalName());
  EXPECT_EQ(nullptr, include->GetFirstChild());
  EXPECT_EQ(nullptr, include->GetNextSibling());
}

TEST(XMLParser, KeepsProcessingInstructionsAndCdataAsTheirOwnNodes) {
  Ref<Document> document = Parse("<r><?pi data?><![CDATA[<not-markup/> & ]]></r>");
  Node* pi = document->GetRootElement()->GetFirstChild();
  EXPECT_EQ(Node::PROCESSING_INSTRUCTION, pi->GetKind());
  Node* cdata = pi->GetNextSibling();
  EXPECT_EQ(Node::CDATA_SECTION, cdata->GetKind());
  EXPECT_EQ("<not-markup/> & ", Tamber::DynamicCast<TextNode>(cdata)->GetText());
}

TEST(XMLParser, DecodesUtf16AndLatin1IntoUtf8) {
  Ref<Document> utf16 = Parse(Utf16Le("<r>\xE9</r>").replace(8, 2, std::string("\xE9\x00", 2)));
  EXPECT_EQ("\xC3\xA9", Tamber::DynamicCast<TextNode>(utf16->GetRootElement()->GetFirstChild())->GetText());
  Ref<Document> latin1 = Parse("<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?><r>\xE9</r>");
  EXPECT_EQ("\xC3\xA9", Tamber::DynamicCast<TextNode>(latin1->GetRootElement()->GetFirstChild())->GetText());
}

TEST(XMLParser, LinesPastTheRangeOfLibXml2AreKept) {
  Ref<Document> document = Parse("<r>" + std::string(70000, '\n') + "<a/></r>");
  EXPECT_EQ(70001, document->GetRootElement()->FindChildElementByLocalName("a")->GetLine());
}

}  // namespace
