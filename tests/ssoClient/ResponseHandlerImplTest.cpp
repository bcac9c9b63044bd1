#include "ssoClient/ResponseHandlerImpl.h"

#include <regex>
#include <string>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "ssoClient/XmlUtils.h"
#include "tamber/Exception.h"
#include "tamber/Stream.h"

namespace SsoClient {
namespace {

using Tamber::Ref;

const std::string kSoapNs = "http://schemas.xmlsoap.org/soap/envelope/";
const std::string kWstNs = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
const std::string kWsseNs = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
const std::string kSamlNs = "urn:oasis:names:tc:SAML:2.0:assertion";

std::string Envelope(const std::string& body) {
  return "<soapenv:Envelope xmlns:soapenv=\"" + kSoapNs + "\" xmlns:wst=\"" + kWstNs + "\" xmlns:wsse=\"" + kWsseNs +
         "\"><soapenv:Body>" + body + "</soapenv:Body></soapenv:Envelope>";
}

std::string Fault(const std::string& code, const char* reason = nullptr) {
  return "<soapenv:Fault>" + code + (reason != nullptr ? std::string("<faultstring>") + reason + "</faultstring>" : "") +
         "<detail/></soapenv:Fault>";
}

std::string FaultCode(const std::string& text) { return "<faultcode>" + text + "</faultcode>"; }

const std::string kAssertion = "<saml:Assertion xmlns:saml=\"" + kSamlNs +
                               "\" ID=\"_a1\" Version=\"2.0\"><saml:Issuer>sts</saml:Issuer></saml:Assertion>";
// The assertion as inclusive canonicalisation writes it inside Envelope(): every namespace in
// scope is declared on it, in prefix order.
const std::string kCanonicalAssertion = "<saml:Assertion xmlns:saml=\"" + kSamlNs + "\" xmlns:soapenv=\"" + kSoapNs +
                                        "\" xmlns:wsse=\"" + kWsseNs + "\" xmlns:wst=\"" + kWstNs +
                                        "\" ID=\"_a1\" Version=\"2.0\"><saml:Issuer>sts</saml:Issuer></saml:Assertion>";

std::string Rstr(const std::string& content, const std::string& attributes = "") {
  return "<wst:RequestSecurityTokenResponse" + attributes + ">" + content + "</wst:RequestSecurityTokenResponse>";
}

std::string Collection(const std::string& content) {
  return "<wst:RequestSecurityTokenResponseCollection>" + content + "</wst:RequestSecurityTokenResponseCollection>";
}

std::string Issued(const std::string& assertion = kAssertion) {
  return "<wst:RequestedSecurityToken>" + assertion + "</wst:RequestedSecurityToken>";
}

std::string Status(const std::string& code) { return "<wst:Status><wst:Code>" + code + "</wst:Code></wst:Status>"; }

const std::string kTokenType = "<wst:TokenType>" + kSamlNs + "</wst:TokenType>";
const std::string kBinaryExchange = "<wst:BinaryExchange ValueType=\"http://schemas.xmlsoap.org/ws/2005/02/trust/spnego\" "
                                    "EncodingType=\"x\">AQID/w==</wst:BinaryExchange>";
const std::vector<unsigned char> kLeg = {1, 2, 3, 255};

Ref<Tamber::Reader> ReaderOf(const std::string& text) {
  Ref<Tamber::Reader> reader;
  Tamber::CreateStringReader(text, reader);
  return reader;
}

// The message the hardened parser gives for `text`.
std::string ParserMessage(const std::string& text) {
  Ref<Tamber::Xml::Document> document;
  try {
    ParseXML(text, document);
  } catch (const Tamber::Xml::XMLParseException& e) {
    return e.what();
  }
  return "parsed";
}

enum Operation { ISSUE, VALIDATE, RENEW, SPNEGO };
const char* const kOperationNames[] = {"issue", "validate", "renew", "spnego"};

// Runs one operation of the handler; out-parameters start with sentinel values so that a test
// sees whether they were written.
struct Outcome {
  std::string token = "untouched";
  bool valid = false;
  SPNegoResponse spnego{"untouched", {9}, "untouched"};
};

void Handle(Operation operation, const std::string& body, Outcome& outcome) {
  const ResponseHandlerImpl handler;
  Ref<Tamber::Reader> reader = ReaderOf(body);
  switch (operation) {
    case ISSUE:
      handler.HandleAcquireTokenResponse(reader.get(), outcome.token);
      break;
    case VALIDATE:
      outcome.valid = handler.HandleValidateSubjectResponse(reader.get());
      break;
    case RENEW:
      handler.HandleRenewTokenResponse(reader.get(), outcome.token);
      break;
    case SPNEGO:
      handler.HandleSPNegoResponse(reader.get(), outcome.spnego);
      break;
  }
}

struct FailureRow {
  const char* name;
  std::vector<Operation> operations;
  std::string body;
  const std::type_info* exception;
  std::string message;
};

void PrintTo(const FailureRow& row, std::ostream* out) { *out << row.name; }

class ResponseHandlerFailures : public testing::TestWithParam<FailureRow> {};

TEST_P(ResponseHandlerFailures, RaiseTheExactClassAndMessageAndWriteNothing) {
  const FailureRow& row = GetParam();
  for (Operation operation : row.operations) {
    SCOPED_TRACE(kOperationNames[operation]);
    Outcome outcome;
    try {
      Handle(operation, row.body, outcome);
      ADD_FAILURE() << "accepted";
    } catch (const Tamber::Exception& e) {
      EXPECT_EQ(row.exception->name(), std::string(typeid(e).name()));
      EXPECT_EQ(row.message, e.what());
    }
    EXPECT_EQ("untouched", outcome.token);
    EXPECT_EQ("untouched", outcome.spnego.contextId);
    EXPECT_EQ(std::vector<unsigned char>{9}, outcome.spnego.leg);
    EXPECT_EQ("untouched", outcome.spnego.token);
  }
}

const std::vector<Operation> kAll = {ISSUE, VALIDATE, RENEW, SPNEGO};
const std::type_info* const kSso = &typeid(SsoException);
const std::type_info* const kCredentials = &typeid(InvalidCredentialsException);
const char kFormat[] = "Unexpected XML format";

std::vector<FailureRow> FailureRows() {
  const std::string notXml = "this is not XML";
  const std::string truncated = Envelope(Collection(Rstr(Issued()))).substr(0, 120);
  const std::string doctype = "<!DOCTYPE x [<!ENTITY e \"boom\">]>" + Envelope("&e;");
  return {
      // Not XML at all.
      {"NotXml", kAll, notXml, kSso, "Response is not well-formed XML: " + ParserMessage(notXml)},
      {"Empty", kAll, "", kSso, "Response is not well-formed XML: " + ParserMessage("")},
      {"Truncated", kAll, truncated, kSso, "Response is not well-formed XML: " + ParserMessage(truncated)},
      {"Doctype", kAll, doctype, kSso, "Response is not well-formed XML: " + ParserMessage(doctype)},
      // Faults, recognised before the operation's own answer is looked for.
      {"FailedAuthentication", kAll, Envelope(Fault(FaultCode("wst:FailedAuthentication"))), kCredentials,
       "Authentication failed"},
      {"FailedAuthenticationWithReason", kAll,
       Envelope(Fault(FaultCode("wst:FailedAuthentication"), " Bad user name or password \n")), kCredentials,
       "Authentication failed:  Bad user name or password \n"},
      {"EmptyReason", {ISSUE}, Envelope(Fault(FaultCode("wst:FailedAuthentication"), "")), kCredentials,
       "Authentication failed"},
      {"ReasonNotText", {ISSUE},
       Envelope("<soapenv:Fault>" + FaultCode("wst:FailedAuthentication") +
                "<faultstring><b>x</b></faultstring></soapenv:Fault>"),
       kCredentials, "Authentication failed"},
      {"WstInvalidSecurityToken", {ISSUE, RENEW}, Envelope(Fault(FaultCode("wst:InvalidSecurityToken"), "expired")),
       kCredentials, "Authentication failed: expired"},
      {"WsseInvalidSecurityToken", {VALIDATE}, Envelope(Fault(FaultCode("wsse:InvalidSecurityToken"))), kCredentials,
       "Authentication failed"},
      {"CodePrefixDeclaredOnFaultcode", {ISSUE},
       Envelope(Fault("<faultcode xmlns:t=\"" + kWstNs + "\">t:FailedAuthentication</faultcode>")), kCredentials,
       "Authentication failed"},
      {"FaultInOtherNamespaces", {SPNEGO},
       Envelope("<f:Fault xmlns:f=\"urn:other\"><f:faultcode>wst:FailedAuthentication</f:faultcode></f:Fault>"),
       kCredentials, "Authentication failed"},
      {"WsseFailedAuthentication", kAll, Envelope(Fault(FaultCode("wsse:FailedAuthentication"), "no")), kSso,
       "Unexpected SOAP fault: wsse:FailedAuthentication; request failed."},
      {"UnprefixedFailedAuthentication", {ISSUE}, Envelope(Fault(FaultCode("FailedAuthentication"))), kSso,
       "Unexpected SOAP fault: FailedAuthentication; request failed."},
      {"ServerFault", {VALIDATE}, Envelope(Fault(FaultCode("soapenv:Server"), "Internal error")), kSso,
       "Unexpected SOAP fault: soapenv:Server; request failed."},
      {"CodeWithWhiteSpace", {ISSUE}, Envelope(Fault(FaultCode("wst:FailedAuthentication "))), kSso,
       "Unexpected SOAP fault: wst:FailedAuthentication ; request failed."},
      {"CaseDiffers", {ISSUE}, Envelope(Fault(FaultCode("wst:failedAuthentication"))), kSso,
       "Unexpected SOAP fault: wst:failedAuthentication; request failed."},
      {"NoFaultcode", kAll, Envelope(Fault("", "reason")), kSso, "Invalid SOAP response: missing faultcode."},
      {"EmptyFaultcode", {RENEW}, Envelope(Fault("<faultcode/>")), kSso, "Invalid SOAP response: missing faultcode."},
      {"FaultcodeStartsWithElement", {ISSUE}, Envelope(Fault(FaultCode("<x/>wst:FailedAuthentication"))), kSso,
       "Invalid SOAP response: missing faultcode."},
      // No body.
      {"NoBody", kAll, "<soapenv:Envelope xmlns:soapenv=\"" + kSoapNs + "\"><soapenv:Header/></soapenv:Envelope>",
       kSso, "Unexpected response format: missing SAOP Body."},
      {"BodyNotChildOfRoot", {ISSUE}, "<a><b><Body/></b></a>", kSso, "Unexpected response format: missing SAOP Body."},
      // Issue.
      {"IssueBareResponse", {ISSUE}, Envelope(Rstr(Issued())), kSso, kFormat},
      {"IssueNoResponse", {ISSUE}, Envelope(Collection("")), kSso, kFormat},
      {"IssueNoRequestedToken", {ISSUE}, Envelope(Collection(Rstr(kTokenType))), kSso, kFormat},
      {"IssueNoAssertion", {ISSUE}, Envelope(Collection(Rstr(Issued("<saml:Other xmlns:saml=\"" + kSamlNs + "\"/>")))),
       kSso, kFormat},
      {"IssueEmptyBody", {ISSUE, VALIDATE, RENEW, SPNEGO}, Envelope(""), kSso, kFormat},
      // Renew.
      {"RenewInCollection", {RENEW}, Envelope(Collection(Rstr(Issued()))), kSso, kFormat},
      {"RenewNoAssertion", {RENEW}, Envelope(Rstr(Issued(""))), kSso, kFormat},
      // Validate.
      {"ValidateNoStatus", {VALIDATE}, Envelope(Rstr("")), kSso, kFormat},
      {"ValidateNoCode", {VALIDATE}, Envelope(Rstr("<wst:Status/>")), kSso, kFormat},
      {"ValidateEmptyCode", {VALIDATE}, Envelope(Rstr(Status(""))), kSso, kFormat},
      {"ValidateCodeWithWhiteSpace", {VALIDATE}, Envelope(Rstr(Status(" " + kWstNs + "/status/valid\n"))), kSso,
       kFormat},
      {"ValidateOtherCode", {VALIDATE}, Envelope(Rstr(Status(kWstNs + "/status/unknown"))), kSso, kFormat},
      {"ValidateOtherNamespace", {VALIDATE},
       Envelope(Rstr(Status("http://schemas.xmlsoap.org/ws/2005/02/trust/status/valid"))), kSso, kFormat},
      {"ValidateCodeStartsWithElement", {VALIDATE}, Envelope(Rstr(Status("<x/>" + kWstNs + "/status/valid"))), kSso,
       kFormat},
      {"ValidateInCollection", {VALIDATE}, Envelope(Collection(Rstr(Status(kWstNs + "/status/valid")))), kSso,
       kFormat},
      // SPNEGO.
      {"SpnegoNeitherForm", {SPNEGO}, Envelope("<wst:Other/>"), kSso, kFormat},
      {"SpnegoEmptyCollection", {SPNEGO}, Envelope(Collection("")), kSso, kFormat},
      {"SpnegoNoContext", {SPNEGO}, Envelope(Rstr(kBinaryExchange)), kSso, kFormat},
      {"SpnegoQualifiedContext", {SPNEGO}, Envelope(Rstr(kBinaryExchange, " wst:Context=\"c\"")), kSso, kFormat},
      {"SpnegoBareWithoutLeg", {SPNEGO}, Envelope(Rstr("", " Context=\"c\"")), kSso, kFormat},
      {"SpnegoBareWithEmptyLeg", {SPNEGO}, Envelope(Rstr("<wst:BinaryExchange/>", " Context=\"c\"")), kSso, kFormat},
      {"SpnegoBadBase64", {SPNEGO}, Envelope(Rstr("<wst:BinaryExchange>AQ*D</wst:BinaryExchange>", " Context=\"c\"")),
       kSso, "Base64 format exception"},
      {"SpnegoFinalWithoutToken", {SPNEGO}, Envelope(Collection(Rstr(kTokenType + kBinaryExchange, " Context=\"c\""))),
       kSso, kFormat},
      {"SpnegoFinalWithoutTokenType", {SPNEGO}, Envelope(Collection(Rstr(Issued(), " Context=\"c\""))), kSso,
       "Invalid token type:  (expected: urn:oasis:names:tc:SAML:2.0:assertion"},
      {"SpnegoFinalWithOtherTokenType", {SPNEGO},
       Envelope(Collection(Rstr("<wst:TokenType>urn:oasis:names:tc:SAML:1.0:assertion</wst:TokenType>" + Issued(),
                                " Context=\"c\""))),
       kSso, "Invalid token type: urn:oasis:names:tc:SAML:1.0:assertion (expected: urn:oasis:names:tc:SAML:2.0:assertion"},
      {"SpnegoFinalWithBadLeg", {SPNEGO},
       Envelope(Collection(Rstr(kTokenType + "<wst:BinaryExchange>!</wst:BinaryExchange>" + Issued(), " Context=\"c\""))),
       kSso, "Base64 format exception"},
  };
}

INSTANTIATE_TEST_SUITE_P(Answers, ResponseHandlerFailures, testing::ValuesIn(FailureRows()),
                         [](const testing::TestParamInfo<FailureRow>& info) { return info.param.name; });

TEST(ResponseHandler, ReportsAnUnboundFaultcodePrefixAsParseException) {
  for (Operation operation : kAll) {
    SCOPED_TRACE(kOperationNames[operation]);
    Outcome outcome;
    try {
      Handle(operation, Envelope(Fault(FaultCode("zz:FailedAuthentication"))), outcome);
      ADD_FAILURE() << "accepted";
    } catch (const ParseException& e) {
      EXPECT_TRUE(std::regex_match(e.what(), std::regex("Element faultcodeat 1,[0-9]+ uses undefined prefix: `zz'")))
          << e.what();
    }
    EXPECT_EQ("untouched", outcome.token);
  }
}

TEST(ResponseHandler, ExtractsTheIssuedAssertionInCanonicalForm) {
  Outcome outcome;
  Handle(ISSUE, Envelope(Collection(Rstr(kTokenType + Issued()))), outcome);
  EXPECT_EQ(kCanonicalAssertion, outcome.token);
  // The text stands on its own.
  Ref<Tamber::Xml::Document> document;
  ParseXML(outcome.token, document);
  EXPECT_EQ(kSamlNs, document->GetRootElement()->GetNamespaceURI());
}

TEST(ResponseHandler, ExtractsTheRenewedAssertionFromABareResponse) {
  Outcome outcome;
  Handle(RENEW, Envelope(Rstr(Issued())), outcome);
  EXPECT_EQ(kCanonicalAssertion, outcome.token);
}

TEST(ResponseHandler, LooksUpAnswersByLocalNameOnly) {
  // Other prefixes, other namespaces, and a root that is not called Envelope.
  const std::string body =
      "<x:Root xmlns:x=\"urn:any\"><y:Body xmlns:y=\"urn:other\"><a:RequestSecurityTokenResponseCollection "
      "xmlns:a=\"urn:a\"><b:RequestSecurityTokenResponse xmlns:b=\"urn:b\"><RequestedSecurityToken>" +
      kAssertion + "</RequestedSecurityToken></b:RequestSecurityTokenResponse></a:RequestSecurityTokenResponseCollection>"
                   "</y:Body></x:Root>";
  Outcome outcome;
  Handle(ISSUE, body, outcome);
  EXPECT_EQ(0u, outcome.token.find("<saml:Assertion xmlns:a=\"urn:a\" xmlns:b=\"urn:b\" xmlns:saml=\"" + kSamlNs +
                                   "\" xmlns:x=\"urn:any\" xmlns:y=\"urn:other\" ID=\"_a1\""))
      << outcome.token;
}

TEST(ResponseHandler, ReadsTheValidationVerdict) {
  Outcome outcome;
  Handle(VALIDATE, Envelope(Rstr(Status(kWstNs + "/status/valid"))), outcome);
  EXPECT_TRUE(outcome.valid);
  outcome.valid = true;
  Handle(VALIDATE, Envelope(Rstr("<wst:TokenType>t</wst:TokenType>" + Status(kWstNs + "/status/invalid"))), outcome);
  EXPECT_FALSE(outcome.valid);
}

TEST(ResponseHandler, ReadsAnIntermediateSpnegoLeg) {
  Outcome outcome;
  Handle(SPNEGO, Envelope(Rstr(kBinaryExchange, " Context=\"ctx-1\"")), outcome);
  EXPECT_EQ("ctx-1", outcome.spnego.contextId);
  EXPECT_EQ(kLeg, outcome.spnego.leg);
  EXPECT_EQ("", outcome.spnego.token);
}

TEST(ResponseHandler, PrefersABareSpnegoResponseToACollection) {
  Outcome outcome;
  Handle(SPNEGO, Envelope(Collection(Rstr(kTokenType + Issued(), " Context=\"final\"")) +
                       Rstr(kBinaryExchange, " Context=\"bare\"")),
      outcome);
  EXPECT_EQ("bare", outcome.spnego.contextId);
  EXPECT_EQ("", outcome.spnego.token);
}

TEST(ResponseHandler, ReadsTheFinalSpnegoAnswerWithOrWithoutALeg) {
  Outcome withLeg;
  Handle(SPNEGO, Envelope(Collection(Rstr(kTokenType + kBinaryExchange + Issued(), " Context=\"ctx-2\""))), withLeg);
  EXPECT_EQ("ctx-2", withLeg.spnego.contextId);
  EXPECT_EQ(kLeg, withLeg.spnego.leg);
  EXPECT_EQ(kCanonicalAssertion, withLeg.spnego.token);

  Outcome withoutLeg;
  Handle(SPNEGO, Envelope(Collection(Rstr(Issued() + kTokenType, " Context=\"\""))), withoutLeg);
  EXPECT_EQ("", withoutLeg.spnego.contextId);
  EXPECT_TRUE(withoutLeg.spnego.leg.empty());
  EXPECT_EQ(kCanonicalAssertion, withoutLeg.spnego.token);
}

// A stream that fails after its first bytes.
class FailingReader : public Tamber::Reader {
 public:
  size_t Read(char* buffer, size_t size) override {
    if (_sent) throw Tamber::IOException("connection reset while reading");
    _sent = true;
    const std::string start = "<soapenv:Envelope";
    const size_t count = std::min(size, start.size());
    start.copy(buffer, count);
    return count;
  }

 private:
  bool _sent = false;
};

TEST(ResponseHandler, PassesReadFailuresOnUnchanged) {
  Ref<Tamber::Reader> reader(new FailingReader());
  std::string token = "untouched";
  try {
    ResponseHandlerImpl().HandleAcquireTokenResponse(reader.get(), token);
    FAIL() << "accepted";
  } catch (const Tamber::IOException& e) {
    EXPECT_EQ(typeid(Tamber::IOException), typeid(e));
    EXPECT_STREQ("connection reset while reading", e.what());
  }
  EXPECT_EQ("untouched", token);
}

TEST(CheckForSoapFault, ReturnsWhenThereIsNoFault) {
  Ref<Tamber::Xml::ElementNode> root;
  ParseResponseDocument(ReaderOf(Envelope(Rstr(""))).get(), root);
  CheckForSoapFault(root.get());
  ParseResponseDocument(ReaderOf("<just-a-root/>").get(), root);
  CheckForSoapFault(root.get());
}

TEST(CanonicalizeToString, GivesTheEmptyTextForNull) { EXPECT_EQ("", CanonicalizeToString(nullptr)); }

}  // namespace
}  // namespace SsoClient
