#include "ssoClient/SamlTokenImpl.h"

#include <climits>
#include <functional>
#include <thread>

#include <boost/make_shared.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlConstants.h"
#include "support/FixedClock.h"
#include "support/TestTokens.h"
#include "tamber/xml/Parser.h"
#include "tamber/xml/security/Canonicalizer.h"

namespace SsoClient {
namespace {

using Tamber::System::DateTime;
using TokenIssuer::DelegateRecord;
using TokenIssuer::TokenRecord;

const char NOW[] = "2027-06-01T10:00:00Z";
const int64_t SECOND = 1000000;

DateTime At(int64_t offsetSeconds) {
  return Tamber::System::DateTimeFromUtc(DateTime(NOW).GetUtcTime() + offsetSeconds * SECOND, false);
}

DelegateRecord DelegateAt(const std::string& upn, int64_t offsetSeconds) { return DelegateRecord{upn, At(offsetSeconds)}; }

class SamlTokenImplTest : public ::testing::Test {
 protected:
  static boost::shared_ptr<const SamlToken> Create(const TokenRecord& record) {
    return CreateSamlToken(TestSupport::IssueTestToken(record), TestSupport::TrustedCertificates());
  }

  TestSupport::FixedClock _clock{NOW};
};

// ---- Semantic checks, each in its own row ------------------------------------------------------

struct RejectedRecordCase {
  const char* label;
  std::function<void(TokenRecord&)> change;
  std::function<std::string(const TokenRecord&)> message;
};

std::function<std::string(const TokenRecord&)> Says(const std::string& message) {
  return [message](const TokenRecord&) { return message; };
}

class RejectedRecordTest : public SamlTokenImplTest, public ::testing::WithParamInterface<RejectedRecordCase> {};

TEST_P(RejectedRecordTest, RaisesParseExceptionWithExactMessage) {
  const RejectedRecordCase& c = GetParam();
  SCOPED_TRACE(c.label);
  TokenRecord record;
  c.change(record);
  try {
    Create(record);
    FAIL() << "accepted";
  } catch (const ParseException& e) {
    EXPECT_EQ(c.message(record), e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Checks, RejectedRecordTest,
    ::testing::Values(
        RejectedRecordCase{"version 1.1", [](TokenRecord& r) { r.version = "1.1"; }, Says("Invalid token version")},
        RejectedRecordCase{"version with spaces", [](TokenRecord& r) { r.version = " 2.0 "; },
                           Says("Invalid token version")},
        RejectedRecordCase{"ID without underscore", [](TokenRecord& r) { r.id = "a1b2"; }, Says("Invalid token ID")},
        RejectedRecordCase{"empty window",
                           [](TokenRecord& r) {
                             r.notBefore = At(0);
                             r.notOnOrAfter = At(0);
                           },
                           Says("Unsatisfiable token validity conditions: NotBefore must be less than NotOnOrAfter.")},
        RejectedRecordCase{"reversed window far in the future",
                           [](TokenRecord& r) {
                             r.notBefore = At(900000);
                             r.notOnOrAfter = At(800000);
                           },
                           Says("Unsatisfiable token validity conditions: NotBefore must be less than NotOnOrAfter.")},
        RejectedRecordCase{"starts 601 s ahead",
                           [](TokenRecord& r) {
                             r.notBefore = At(601);
                             r.notOnOrAfter = At(3600);
                           },
                           [](const TokenRecord& r) { return "Token start date is in the future: " + r.notBefore.ToString(); }},
        RejectedRecordCase{"expired 601 s ago",
                           [](TokenRecord& r) {
                             r.notBefore = At(-3600);
                             r.notOnOrAfter = At(-601);
                           },
                           [](const TokenRecord& r) { return "The token has expired at: " + r.notOnOrAfter.ToString(); }},
        RejectedRecordCase{"expiry plus tolerance is now",
                           [](TokenRecord& r) {
                             r.notBefore = At(-3600);
                             r.notOnOrAfter = At(-600);
                           },
                           [](const TokenRecord& r) { return "The token has expired at: " + r.notOnOrAfter.ToString(); }},
        RejectedRecordCase{"bearer confirmation ends a second early",
                           [](TokenRecord& r) { r.bearerNotOnOrAfter = At(3599); }, Says("Invalid token subject validity")},
        RejectedRecordCase{"delegate id without restriction",
                           [](TokenRecord& r) { r.delegateId = DelegateAt("svc@example.com", 0); },
                           Says("Token SubjectConfirmation contains delegate id, but no delegation restriction is present")},
        RejectedRecordCase{"delegate id names the first delegate",
                           [](TokenRecord& r) {
                             r.delegates = {DelegateAt("first@example.com", -60), DelegateAt("last@example.com", -30)};
                             r.delegateId = r.delegates.front();
                           },
                           Says("The SubjectConfirmation delegate id does not match the id of the last delegate")},
        RejectedRecordCase{"delegate id in another case",
                           [](TokenRecord& r) {
                             r.delegates = {DelegateAt("svc@example.com", -60)};
                             r.delegateId = DelegateAt("SVC@example.com", -60);
                           },
                           Says("The SubjectConfirmation delegate id does not match the id of the last delegate")},
        RejectedRecordCase{"delegate id of another format",
                           [](TokenRecord& r) {
                             r.delegates = {DelegateAt("svc@example.com", -60)};
                             r.delegateId = r.delegates.back();
                             r.delegateId->format = "urn:oasis:names:tc:SAML:1.1:nameid-format:emailAddress";
                           },
                           Says("The SubjectConfirmation delegate id does not match the id of the last delegate")},
        RejectedRecordCase{"restriction without delegate id",
                           [](TokenRecord& r) { r.delegates = {DelegateAt("svc@example.com", -60)}; },
                           Says("Token has delegation restriction, but no delegate id is present in the SubjectConfirmation")},
        RejectedRecordCase{"subject in e-mail format",
                           [](TokenRecord& r) {
                             r.subjectFormat = "urn:oasis:names:tc:SAML:1.1:nameid-format:emailAddress";
                           },
                           Says("Invalid or unsupported NameId format "
                                "'urn:oasis:names:tc:SAML:1.1:nameid-format:emailAddress'")},
        RejectedRecordCase{"subject without domain", [](TokenRecord& r) { r.subject = "alice"; },
                           Says("Failed to parse the UPN NameID: `alice'; name or domain part is missing.")},
        RejectedRecordCase{"delegate that is no UPN",
                           [](TokenRecord& r) {
                             r.delegates = {DelegateAt("svc", -60)};
                             r.delegateId = r.delegates.back();
                           },
                           Says("Failed to parse the UPN NameID: `svc'; name or domain part is missing.")}),
    [](const ::testing::TestParamInfo<RejectedRecordCase>& info) { return "Row" + std::to_string(info.index); });

// ---- The edges of the validity window ----------------------------------------------------------

TEST_F(SamlTokenImplTest, StartWithinToleranceIsAccepted) {
  TokenRecord record;
  record.notBefore = At(599);
  record.notOnOrAfter = At(3600);
  EXPECT_EQ(record.notBefore, Create(record)->GetStartDate());
}

TEST_F(SamlTokenImplTest, StartExactlyAtToleranceIsAccepted) {
  TokenRecord record;
  record.notBefore = At(600);
  record.notOnOrAfter = At(3600);
  EXPECT_NO_THROW(Create(record));
}

TEST_F(SamlTokenImplTest, ExpiryWithinToleranceIsAccepted) {
  TokenRecord record;
  record.notBefore = At(-3600);
  record.notOnOrAfter = At(-599);
  EXPECT_EQ(record.notOnOrAfter, Create(record)->GetEndDate());
}

TEST_F(SamlTokenImplTest, ExpiryOneMicrosecondAfterToleranceIsAccepted) {
  TokenRecord record;
  record.notBefore = At(-3600);
  record.notOnOrAfter = Tamber::System::DateTimeFromUtc(At(-600).GetUtcTime() + 1, false);
  EXPECT_NO_THROW(Create(record));
}

TEST_F(SamlTokenImplTest, ToleranceIsTheCallersChoice) {
  TokenRecord record;
  record.notBefore = At(-3600);
  record.notOnOrAfter = At(-5);
  const std::string xml = TestSupport::IssueTestToken(record);
  EXPECT_NO_THROW(CreateSamlToken(xml, TestSupport::TrustedCertificates(), 10));
  try {
    CreateSamlToken(xml, TestSupport::TrustedCertificates(), 0);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_EQ("The token has expired at: " + record.notOnOrAfter.ToString(), e.what());
  }
}

TEST_F(SamlTokenImplTest, HugeToleranceOpensTheWindowWithoutOverflow) {
  TokenRecord record;
  record.notBefore = DateTime("9000-01-01T00:00:00Z");
  record.notOnOrAfter = DateTime("9999-01-01T00:00:00Z");
  const std::string xml = TestSupport::IssueTestToken(record);
  EXPECT_NO_THROW(CreateSamlToken(xml, TestSupport::TrustedCertificates(), LLONG_MAX));
  record.notBefore = DateTime("0001-01-01T00:00:00Z");
  record.notOnOrAfter = DateTime("0001-01-02T00:00:00Z");
  EXPECT_NO_THROW(CreateSamlToken(TestSupport::IssueTestToken(record), TestSupport::TrustedCertificates(), LLONG_MAX));
}

TEST_F(SamlTokenImplTest, ClockIsReadOnceForBothEnds) {
  // A window of one microsecond around the fixed clock, without tolerance.
  TokenRecord record;
  record.notBefore = At(0);
  record.notOnOrAfter = Tamber::System::DateTimeFromUtc(At(0).GetUtcTime() + 1, false);
  EXPECT_NO_THROW(CreateSamlToken(TestSupport::IssueTestToken(record), TestSupport::TrustedCertificates(), 0));
}

TEST_F(SamlTokenImplTest, IdOfASingleUnderscoreIsAccepted) {
  TokenRecord record;
  record.id = "_";
  EXPECT_EQ("_", Create(record)->GetId());
}

// ---- What a valid token says ---------------------------------------------------------------------

TEST_F(SamlTokenImplTest, FullHolderOfKeyTokenGivesEveryValue) {
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.id = "_full";
  record.notBefore = At(-60);
  record.notOnOrAfter = At(7200);
  record.subject = "alice@sub.example.com";
  record.groups = {"EXAMPLE\\Users"};
  record.givenName = "Alice";
  record.surname = "Example";
  record.isSolution = true;
  record.audience = {"urn:b", "urn:a", "urn:b"};
  record.renewCount = 1;
  record.proxyCount = 3;
  record.delegates = {DelegateAt("first@example.com", -120), DelegateAt("last@example.com", -90)};
  record.delegateId = record.delegates.back();
  record.advice = {TokenIssuer::AdviceRecord{"urn:source", {TokenIssuer::AttributeRecord{"urn:n", {"v1", "v2"}}}}};
  const auto token = Create(record);

  EXPECT_EQ("_full", token->GetId());
  EXPECT_EQ(At(-60), token->GetStartDate());
  EXPECT_EQ(At(7200), token->GetEndDate());
  EXPECT_EQ("alice", token->GetSubject().name);
  EXPECT_EQ("sub.example.com", token->GetSubject().domain);
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  EXPECT_TRUE(token->IsSolution());
  EXPECT_EQ(SamlToken::CONFIRM_HOLDER_OF_KEY, token->GetConfirmationMethod());
  ASSERT_NE(nullptr, token->GetConfirmationCertificate());
  EXPECT_EQ(TestSupport::LoadTestKeyPair("client").certificate->GetDer(), token->GetConfirmationCertificate()->GetDer());
  std::set<std::string> audience;
  token->GetAudience(audience);
  EXPECT_EQ((std::set<std::string>{"urn:a", "urn:b"}), audience);
  std::vector<Delegate> chain;
  token->GetDelegationChain(chain);
  ASSERT_EQ(2u, chain.size());
  EXPECT_EQ(PrincipalId("first", "example.com"), chain[0].principal);
  EXPECT_EQ(At(-120), chain[0].delegationInstant);
  EXPECT_EQ(PrincipalId("last", "example.com"), chain[1].principal);
  std::vector<Advice> advice;
  token->GetAdvice(advice);
  ASSERT_EQ(1u, advice.size());
  EXPECT_EQ("urn:source", advice[0].source);
  ASSERT_EQ(1u, advice[0].attributes.size());
  EXPECT_EQ("urn:n", advice[0].attributes[0].name);
  EXPECT_EQ((std::vector<std::string>{"v1", "v2"}), advice[0].attributes[0].values);
}

TEST_F(SamlTokenImplTest, BearerTokenHasNoCertificateAndNoExtras) {
  const auto token = Create(TokenRecord());
  EXPECT_EQ(SamlToken::CONFIRM_BEARER, token->GetConfirmationMethod());
  EXPECT_EQ(nullptr, token->GetConfirmationCertificate());
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_FALSE(token->IsDelegable());
  std::set<std::string> audience{"stale"};
  token->GetAudience(audience);
  EXPECT_TRUE(audience.empty());
  std::vector<Advice> advice(1);
  token->GetAdvice(advice);
  EXPECT_TRUE(advice.empty());
  std::vector<Delegate> chain(1, Delegate{PrincipalId("stale", "entry"), DateTime()});
  token->GetDelegationChain(chain);
  EXPECT_TRUE(chain.empty());
}

TEST_F(SamlTokenImplTest, ZeroCountsAreNeitherRenewableNorDelegable) {
  TokenRecord record;
  record.renewCount = 0;
  record.proxyCount = 0;
  const auto token = Create(record);
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_FALSE(token->IsDelegable());
}

TEST_F(SamlTokenImplTest, HolderOfKeyTokenIsNotHeldToTheBearerSubjectValidity) {
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.bearerNotOnOrAfter = At(1);  // not written for holder-of-key tokens
  EXPECT_NO_THROW(Create(record));
}

// ---- Text and element forms ----------------------------------------------------------------------

TEST_F(SamlTokenImplTest, ToXmlOfATextTokenIsTheTextAsGiven) {
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.indent = true;
  const std::string xml = "<?xml version=\"1.0\"?>\n<!-- before -->\n" + TestSupport::IssueTestToken(record) + "\n";
  EXPECT_EQ(xml, CreateSamlToken(xml, TestSupport::TrustedCertificates())->ToXml());
}

std::string Canonical(const Tamber::Xml::ElementNode* element) {
  Tamber::Ref<Tamber::Xml::Security::Canonicalizer> canonicalizer;
  Tamber::Xml::Security::CreateCanonicalizer("http://www.w3.org/TR/2001/REC-xml-c14n-20010315", canonicalizer);
  Tamber::Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  canonicalizer->Canonicalize(element, writer.get());
  return writer->GetString();
}

TEST_F(SamlTokenImplTest, TokenFromAnElementInsideAnAnswerKeepsItsCanonicalForm) {
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.indent = true;
  const std::string answer =
      "<wst:RequestSecurityTokenResponse xmlns:wst='http://docs.oasis-open.org/ws-sx/ws-trust/200512'>"
      "<wst:RequestedSecurityToken><!-- the token -->" +
      TestSupport::IssueTestToken(record) + "</wst:RequestedSecurityToken></wst:RequestSecurityTokenResponse>";
  Tamber::Ref<Tamber::Xml::Document> document;
  ParseXML(answer, document);
  Tamber::Xml::ElementNode* assertion =
      document->GetRootElement()->FindChildElementByLocalName("RequestedSecurityToken")->FindChildElementByLocalName(
          "Assertion");
  const auto token = CreateSamlTokenFromDom(assertion, TestSupport::TrustedCertificates());
  EXPECT_EQ(Canonical(assertion), token->ToXml());
  // The canonical text names the namespace in scope from the answer, and is itself a valid token.
  EXPECT_NE(std::string::npos, token->ToXml().find("xmlns:wst="));
  EXPECT_EQ(record.id, CreateSamlToken(token->ToXml(), TestSupport::TrustedCertificates())->GetId());
}

TEST_F(SamlTokenImplTest, ElementFormChecksLikeTheTextForm) {
  TokenRecord record;
  record.version = "1.1";
  Tamber::Ref<Tamber::Xml::Document> document;
  ParseXML(TestSupport::IssueTestToken(record), document);
  try {
    CreateSamlTokenFromDom(document->GetRootElement(), TestSupport::TrustedCertificates(), 600);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Invalid token version", e.what());
  }
}

// ---- Trust ------------------------------------------------------------------------------------------

TEST_F(SamlTokenImplTest, SignerCertificateItselfMayBeTheTrustedOne) {
  const std::string xml = TestSupport::IssueTestToken(TokenRecord());
  EXPECT_NO_THROW(CreateSamlToken(xml, TestSupport::LoadTestCertificate("sts").get()));
  EXPECT_NO_THROW(CreateSamlToken(xml, CertificateList{TestSupport::LoadTestCertificate("client"),
                                                       TestSupport::LoadTestCertificate("sts")}));
}

TEST_F(SamlTokenImplTest, AnotherTrustedCertificateDoesNotVerify) {
  const std::string xml = TestSupport::IssueTestToken(TokenRecord());
  try {
    CreateSamlToken(xml, TestSupport::LoadTestCertificate("client").get());
    FAIL();
  } catch (const InvalidSignatureException& e) {
    EXPECT_STREQ("Failed to verify signature: token might have been tampered with.", e.what());
  }
}

TEST_F(SamlTokenImplTest, EmptyTrustListAcceptsNothing) {
  try {
    CreateSamlToken(TestSupport::IssueTestToken(TokenRecord()), CertificateList());
    FAIL();
  } catch (const InvalidSignatureException& e) {
    EXPECT_STREQ("Failed to verify signature: token might have been tampered with.", e.what());
  }
}

TEST_F(SamlTokenImplTest, NullTrustedCertificateIsACallerError) {
  try {
    CreateSamlToken(TestSupport::IssueTestToken(TokenRecord()), static_cast<const Tamber::Crypto::Certificate*>(nullptr));
    FAIL();
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : the trusted certificate must not be null", e.what());
  }
}

TEST_F(SamlTokenImplTest, NullElementIsACallerError) {
  try {
    CreateSamlTokenFromDom(nullptr, TestSupport::TrustedCertificates());
    FAIL();
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : the token element must not be null", e.what());
  }
}

TEST_F(SamlTokenImplTest, TextThatIsNotXmlRaisesTheParserException) {
  EXPECT_THROW(CreateSamlToken("<saml2:Assertion", TestSupport::TrustedCertificates()),
               Tamber::Xml::XMLParseException);
  EXPECT_THROW(CreateSamlToken("", TestSupport::TrustedCertificates()), Tamber::Xml::XMLParseException);
}

TEST_F(SamlTokenImplTest, TokensAreSharedAcrossThreads) {
  const auto token = Create(TestSupport::HolderOfKeyRecord());
  std::vector<std::thread> readers;
  for (int i = 0; i < 4; ++i) {
    readers.emplace_back([&token] {
      for (int j = 0; j < 100; ++j) {
        std::vector<PrincipalId> groups;
        token->GetGroups(groups);
        EXPECT_EQ("alice", token->GetSubject().name);
      }
    });
  }
  for (std::thread& reader : readers) reader.join();
}

// ---- Signature verification outcomes --------------------------------------------------------------

// A signature whose verification does what the test says.
class FakeSignature : public Tamber::Xml::Security::Signature {
 public:
  explicit FakeSignature(std::function<bool(std::vector<Tamber::Xml::ElementNode*>&)> verify)
      : _verify(std::move(verify)) {}
  const std::vector<Tamber::Ref<Tamber::Xml::Security::Reference>>& GetReferences() const override {
    return _references;
  }
  bool Verify(const Tamber::Xml::Security::KeyInfoResolver*,
              std::vector<Tamber::Xml::ElementNode*>& verifiedElements) const override {
    return _verify(verifiedElements);
  }
  Tamber::Xml::Security::Reference* AddReference(const std::string&, const std::string&) override { return nullptr; }
  void SetKeyInfo(Tamber::Xml::ElementNode*) override {}
  void Sign(const Tamber::Crypto::PrivateKey*) override {}
  Tamber::Xml::ElementNode* GetElement() const override { return nullptr; }

 private:
  std::function<bool(std::vector<Tamber::Xml::ElementNode*>&)> _verify;
  std::vector<Tamber::Ref<Tamber::Xml::Security::Reference>> _references;
};

class ValidateSignatureTest : public ::testing::Test {
 protected:
  ValidateSignatureTest() {
    ParseXML("<saml2:Assertion xmlns:saml2='urn:oasis:names:tc:SAML:2.0:assertion'><other/></saml2:Assertion>",
             _document);
  }

  // Runs ValidateSignature on the document's root with a signature that behaves as `verify`.
  std::string Failure(std::function<bool(std::vector<Tamber::Xml::ElementNode*>&)> verify) {
    Tamber::Ref<Tamber::Xml::Security::Signature> signature(new FakeSignature(std::move(verify)));
    try {
      ValidateSignature(signature.get(), nullptr, _document->GetRootElement());
    } catch (const InvalidSignatureException& e) {
      return std::string("InvalidSignatureException: ") + e.what();
    } catch (const ParseException& e) {
      return std::string("ParseException: ") + e.what();
    }
    return "accepted";
  }

  Tamber::Ref<Tamber::Xml::Document> _document;
};

TEST_F(ValidateSignatureTest, AcceptsWhatCoversTheAssertion) {
  Tamber::Xml::ElementNode* root = _document->GetRootElement();
  EXPECT_EQ("accepted", Failure([root](std::vector<Tamber::Xml::ElementNode*>& verified) {
              verified.assign(1, root);
              return true;
            }));
}

TEST_F(ValidateSignatureTest, RefusesAValidSignatureOverAnotherElement) {
  Tamber::Xml::ElementNode* other = _document->GetRootElement()->FindChildElementByLocalName("other");
  EXPECT_EQ("ParseException: Token's signature must cover the entire token",
            Failure([other](std::vector<Tamber::Xml::ElementNode*>& verified) {
              verified.assign(1, other);
              return true;
            }));
}

TEST_F(ValidateSignatureTest, TurnsEveryVerificationFailureIntoInvalidSignature) {
  EXPECT_EQ("InvalidSignatureException: Failed to verify signature: token might have been tampered with.",
            Failure([](std::vector<Tamber::Xml::ElementNode*>&) { return false; }));
  EXPECT_EQ("InvalidSignatureException: Signature verification error. cannot verify",
            Failure([](std::vector<Tamber::Xml::ElementNode*>&) -> bool {
              throw Tamber::Xml::Security::XmlSecurityException("cannot verify");
            }));
  EXPECT_EQ("InvalidSignatureException: Signature verification error. bad syntax",
            Failure([](std::vector<Tamber::Xml::ElementNode*>&) -> bool {
              throw Tamber::Xml::Security::SignatureSyntaxException("bad syntax");
            }));
  EXPECT_EQ("InvalidSignatureException: Signature verification error. unreadable certificate",
            Failure([](std::vector<Tamber::Xml::ElementNode*>&) -> bool {
              throw Tamber::Crypto::CryptoException("unreadable certificate");
            }));
}

}  // namespace
}  // namespace SsoClient
