#include "ssoClient/SamlTokenImpl.h"

// Tokens an attacker could hand a relying party, from tests/data/tokens (see generate.sh there),
// and the trusted tokens they are twins of.

#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "support/FixedClock.h"
#include "support/LoopbackListener.h"
#include "support/TestTokens.h"
#include "tamber/xml/Dom.h"

namespace SsoClient {
namespace {

enum Verdict { ACCEPTED, PARSE_ERROR, SIGNATURE_ERROR, NOT_XML };

struct VectorCase {
  const char* file;
  Verdict verdict;
  std::string message;  // the exact message of a refusal
};

std::ostream& operator<<(std::ostream& out, const VectorCase& c) { return out << c.file; }

// Runs `xml` through the relying party's entry point and names the outcome.
void ExpectVerdict(const std::string& xml, Verdict verdict, const std::string& message) {
  try {
    const auto token = CreateSamlToken(xml, TestSupport::TrustedCertificates());
    EXPECT_EQ(ACCEPTED, verdict) << "accepted a token that should fail with: " << message;
    EXPECT_EQ(PrincipalId("alice", "example.com"), token->GetSubject());
  } catch (const ParseException& e) {
    EXPECT_EQ(PARSE_ERROR, verdict) << e.what();
    EXPECT_EQ(message, e.what());
  } catch (const InvalidSignatureException& e) {
    EXPECT_EQ(SIGNATURE_ERROR, verdict) << e.what();
    EXPECT_EQ(message, e.what());
  } catch (const Tamber::Xml::XMLParseException& e) {
    EXPECT_EQ(NOT_XML, verdict) << e.what();
    EXPECT_EQ(message, e.what());
  }
}

class TokenVectorTest : public ::testing::TestWithParam<VectorCase> {
 protected:
  TestSupport::FixedClock _clock{TestSupport::TOKEN_VECTORS_CLOCK};
};

TEST_P(TokenVectorTest, HasItsVerdict) {
  const VectorCase& c = GetParam();
  SCOPED_TRACE(c.file);
  ExpectVerdict(TestSupport::ReadTestData(std::string("tokens/") + c.file), c.verdict, c.message);
}

const char TAMPERED[] = "Failed to verify signature: token might have been tampered with.";
const char NOT_COVERED[] = "Token's signature must cover the entire token";
const char DOCTYPE[] = "XML parse error at line 1, column 27: DOCTYPE is not allowed";
const char NOT_TEXT[] = "Element 'NameID' must only have textual content (but has extra children or is empty).";

INSTANTIATE_TEST_SUITE_P(
    Trusted, TokenVectorTest,
    ::testing::Values(VectorCase{"valid-bearer.xml", ACCEPTED, ""},
                      VectorCase{"valid-holder-of-key.xml", ACCEPTED, ""},
                      VectorCase{"valid-delegated.xml", ACCEPTED, ""},
                      VectorCase{"valid-ec-signer.xml", ACCEPTED, ""},
                      VectorCase{"valid-indented.xml", ACCEPTED, ""},
                      VectorCase{"valid-with-comments.xml", ACCEPTED, ""},
                      VectorCase{"valid-with-xml-declaration.xml", ACCEPTED, ""},
                      VectorCase{"valid-with-utf8-bom.xml", ACCEPTED, ""},
                      VectorCase{"valid-xmlsec1-rsa.xml", ACCEPTED, ""},
                      VectorCase{"valid-xmlsec1-ec.xml", ACCEPTED, ""},
                      VectorCase{"valid-xmlsec1-holder-of-key.xml", ACCEPTED, ""}));

INSTANTIATE_TEST_SUITE_P(
    Signer, TokenVectorTest,
    ::testing::Values(VectorCase{"untrusted-signer.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"expired-signer.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"keyinfo-certificate-swapped.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"keyvalue-attacker-key.xml", SIGNATURE_ERROR, TAMPERED}));

INSTANTIATE_TEST_SUITE_P(
    Tampered, TokenVectorTest,
    ::testing::Values(VectorCase{"tampered-group.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"tampered-not-on-or-after.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"tampered-subject.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"prefix-rebound-in-attribute-value.xml", SIGNATURE_ERROR, TAMPERED},
                      VectorCase{"signature-removed.xml", PARSE_ERROR,
                                 "Signature syntax error: Expected ds:Signature, found saml2:Subject"},
                      VectorCase{"comment-split-nameid.xml", PARSE_ERROR, NOT_TEXT},
                      VectorCase{"cdata-in-nameid.xml", PARSE_ERROR, NOT_TEXT}));

INSTANTIATE_TEST_SUITE_P(
    Wrapping, TokenVectorTest,
    ::testing::Values(VectorCase{"assertion-wrapped-in-renew-condition.xml", SIGNATURE_ERROR,
                                 "Signature verification error. ID \"_holder-of-key-token\" of the signed element is not "
                                 "unique in the document"},
                      VectorCase{"second-assertion-in-renew-condition.xml", SIGNATURE_ERROR,
                                 "Signature verification error. ID \"_holder-of-key-token\" of the signed element is not "
                                 "unique in the document"},
                      VectorCase{"reference-uri-other-id.xml", PARSE_ERROR, NOT_COVERED},
                      VectorCase{"reference-uri-other-id-copied-to-token.xml", SIGNATURE_ERROR,
                                 "Signature verification error. ID \"_audience\" of the signed element is not unique "
                                 "in the document"}));

INSTANTIATE_TEST_SUITE_P(
    Algorithms, TokenVectorTest,
    ::testing::Values(VectorCase{"signature-rsa-sha1.xml", PARSE_ERROR,
                                 "Signature syntax error: Signature method "
                                 "\"http://www.w3.org/2000/09/xmldsig#rsa-sha1\" is not accepted"},
                      VectorCase{"signature-hmac-sha256.xml", PARSE_ERROR,
                                 "Signature syntax error: Signature method "
                                 "\"http://www.w3.org/2001/04/xmldsig-more#hmac-sha256\" is not accepted"},
                      VectorCase{"digest-sha1.xml", PARSE_ERROR,
                                 "Signature syntax error: Digest method \"http://www.w3.org/2000/09/xmldsig#sha1\" is "
                                 "not accepted"},
                      VectorCase{"digest-md5.xml", PARSE_ERROR,
                                 "Signature syntax error: Digest method \"http://www.w3.org/2001/04/xmldsig-more#md5\" "
                                 "is not accepted"},
                      VectorCase{"transform-xpath.xml", PARSE_ERROR,
                                 "Signature syntax error: Transform \"http://www.w3.org/TR/1999/REC-xpath-19991116\" "
                                 "is not accepted"},
                      VectorCase{"signature-with-object.xml", PARSE_ERROR, "Signature syntax error: ds:Object is not accepted"},
                      VectorCase{"reference-uri-file.xml", PARSE_ERROR,
                                 "Signature syntax error: Reference URI \"file:///etc/hostname\" is not accepted; "
                                 "expected \"\" or \"#id\""}));

INSTANTIATE_TEST_SUITE_P(
    Parser, TokenVectorTest,
    ::testing::Values(VectorCase{"doctype-internal-entity.xml", NOT_XML, DOCTYPE},
                      VectorCase{"doctype-external-entity.xml", NOT_XML, DOCTYPE},
                      VectorCase{"dtd-attribute-default.xml", NOT_XML, DOCTYPE},
                      VectorCase{"utf7-hidden-doctype.xml", NOT_XML,
                                 "XML parse error at line 2, column 1: encoding 'UTF-7' is not allowed (UTF-8, UTF-16, "
                                 "ISO-8859-1 or US-ASCII expected)"},
                      VectorCase{"nul-byte.xml", NOT_XML, "XML parse error at line 21, column 97: Char 0x0 out of allowed range"},
                      VectorCase{"invalid-utf8.xml", NOT_XML,
                                 "XML parse error at line 21, column 97: Input is not proper UTF-8, indicate encoding ! "
                                 "Bytes: 0xC3 0x28 0x40 0x65"}));

// ---- Generated at run time ---------------------------------------------------------------------

class GeneratedVectorTest : public ::testing::Test {
 protected:
  TestSupport::FixedClock _clock{TestSupport::TOKEN_VECTORS_CLOCK};
};

TEST_F(GeneratedVectorTest, ElementWithFiftyThousandAttributesIsRefused) {
  std::string attributes;
  for (int i = 0; i < 50000; ++i) attributes += " a" + std::to_string(i) + "=\"\"";
  std::string token = TestSupport::ReadTestData("tokens/valid-bearer.xml");
  token.insert(token.find(" ID=\""), attributes);
  ExpectVerdict(token, NOT_XML, "XML parse error at line 1, column 7752: an element has more than 256 attributes");
}

TEST_F(GeneratedVectorTest, RemoteReferenceIsRefusedWithoutAnyConnection) {
  TestSupport::LoopbackListener listener;
  std::string token = TestSupport::ReadTestData("tokens/reference-uri-remote-http.xml");
  const std::string port = std::to_string(listener.GetPort());
  token.replace(token.find("@PORT@"), 6, port);
  ExpectVerdict(token, PARSE_ERROR,
                "Signature syntax error: Reference URI \"http://127.0.0.1:" + port +
                    "/token\" is not accepted; expected \"\" or \"#id\"");
  EXPECT_EQ(0, listener.CountConnections());
}

// Every refusal reaches a handler for the common base class.
TEST_F(GeneratedVectorTest, EveryTokenFailureIsAnInvalidTokenException) {
  for (const char* file : {"tampered-subject.xml", "comment-split-nameid.xml", "signature-rsa-sha1.xml"}) {
    SCOPED_TRACE(file);
    EXPECT_THROW(CreateSamlToken(TestSupport::ReadTestData(std::string("tokens/") + file),
                                 TestSupport::TrustedCertificates()),
                 InvalidTokenException);
  }
}

}  // namespace
}  // namespace SsoClient
