#include "tamber/xml/security/IsolatedCopy.h"

#include <gtest/gtest.h>
#include <libxml/c14n.h>

#include <string>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/XmlTestSupport.h"
#include "tamber/xml/security/Canonicalizer.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {
namespace {

const char kDocument[] =
    "<env:Envelope xmlns:env=\"urn:env\" xmlns:unused=\"urn:unused\" xml:lang=\"en\" xml:space=\"preserve\">"
    "<env:Body xmlns:a=\"urn:a\" xmlns=\"urn:default\" xml:lang=\"de\">"
    "<a:Item z=\"2\" xmlns:b=\"urn:b\" b:attr=\"1\"><!-- c --><a:Child xmlns:unused=\"urn:shadowed\">x</a:Child>"
    "<Plain env:flag=\"1\"/><a:Inner/></a:Item>"
    "</env:Body></env:Envelope>";

struct Form {
  const char* uri;
  int mode;
  bool inheritXmlAttributes;
};

class IsolatedCopyTest : public testing::TestWithParam<Form> {};

TEST_P(IsolatedCopyTest, CanonicalizesLikeTheOriginalInPlace) {
  SCOPED_TRACE(GetParam().uri);
  Ref<Document> document = XmlTest::Parse(kDocument);
  ElementNode* item = document->GetRootElement()
                          ->FindChildElement(QName("urn:env", "Body"))
                          ->FindChildElement(QName("urn:a", "Item"));
  Ref<Canonicalizer> canonicalizer;
  CreateCanonicalizer(GetParam().uri, canonicalizer);
  Ref<StringWriter> inPlace;
  CreateStringWriter(inPlace);
  canonicalizer->Canonicalize(item, inPlace.get());

  xmlNodePtr inner = ToXmlNode(item->FindChildElement(QName("urn:a", "Inner")));
  IsolatedCopy copy(ToXmlNode(item), inner, GetParam().inheritXmlAttributes);
  xmlChar* text = nullptr;
  int length = xmlC14NDocDumpMemory(copy.GetRoot()->doc, nullptr, GetParam().mode, nullptr, 0, &text);
  ASSERT_GT(length, 0);
  EXPECT_EQ(inPlace->GetString(), std::string(reinterpret_cast<char*>(text), static_cast<size_t>(length)));
  xmlFree(text);
  EXPECT_STREQ("Inner", reinterpret_cast<const char*>(copy.GetInner()->name));
  EXPECT_NE(inner, copy.GetInner());
}

INSTANTIATE_TEST_SUITE_P(Table, IsolatedCopyTest,
                         testing::Values(Form{"http://www.w3.org/TR/2001/REC-xml-c14n-20010315", XML_C14N_1_0, true},
                                         Form{"http://www.w3.org/2001/10/xml-exc-c14n#", XML_C14N_EXCLUSIVE_1_0, false}),
                         [](const testing::TestParamInfo<Form>& info) { return "Row" + std::to_string(info.index); });

TEST(IsolatedCopyErrorTest, RefusesAnInnerNodeOutsideTheElement) {
  Ref<Document> document = XmlTest::Parse(kDocument);
  xmlNodePtr body = ToXmlNode(document->GetRootElement()->FindChildElement(QName("urn:env", "Body")));
  try {
    IsolatedCopy copy(body->children, body, false);
    FAIL() << "copied";
  } catch (const XmlSecurityException& e) {
    EXPECT_STREQ("ds:Signature is not inside the signed element", e.what());
  }
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
