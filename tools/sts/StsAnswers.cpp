#include "StsAnswers.h"

#include "ssoClient/WireConstants.h"
#include "tamber/StringUtil.h"

namespace DevSts {

namespace {

namespace Wire = SsoClient::Wire;

const std::string WST = Wire::kWsTrust.uri;

std::string EscapeText(const std::string& text) {
  std::string escaped;
  for (const char c : text) {
    switch (c) {
      case '&': escaped += "&amp;"; break;
      case '<': escaped += "&lt;"; break;
      case '>': escaped += "&gt;"; break;
      default: escaped += c;
    }
  }
  return escaped;
}

std::string Envelope(const std::string& body) {
  return std::string("<soapenv:Envelope xmlns:soapenv=\"") + Wire::kSoapEnvelope.uri + "\"><soapenv:Body>" + body +
         "</soapenv:Body></soapenv:Envelope>";
}

std::string RequestedToken(const std::string& assertion) {
  return "<wst:RequestedSecurityToken>" + assertion + "</wst:RequestedSecurityToken>";
}

std::string TokenType() { return std::string("<wst:TokenType>") + Wire::kTokenTypeSaml20 + "</wst:TokenType>"; }

std::string BinaryExchange(const SsoClient::Leg& leg) {
  return std::string("<wst:BinaryExchange ValueType=\"") + Wire::kSpnegoValueType + "\" EncodingType=\"" +
         Wire::kBase64Binary + "\">" + Tamber::StringUtil::Base64Encode(leg) + "</wst:BinaryExchange>";
}

}  // namespace

std::string IssueAnswer(const std::string& assertion) {
  return Envelope("<wst:RequestSecurityTokenResponseCollection xmlns:wst=\"" + WST +
                  "\"><wst:RequestSecurityTokenResponse>" + TokenType() + RequestedToken(assertion) +
                  "</wst:RequestSecurityTokenResponse></wst:RequestSecurityTokenResponseCollection>");
}

std::string RenewAnswer(const std::string& assertion) {
  return Envelope("<wst:RequestSecurityTokenResponse xmlns:wst=\"" + WST + "\">" + TokenType() +
                  RequestedToken(assertion) + "</wst:RequestSecurityTokenResponse>");
}

std::string ValidateAnswer(bool valid) {
  return Envelope("<wst:RequestSecurityTokenResponse xmlns:wst=\"" + WST + "\"><wst:TokenType>" +
                  Wire::kTokenTypeStatus + "</wst:TokenType><wst:Status><wst:Code>" + WST +
                  (valid ? "/status/valid" : "/status/invalid") +
                  "</wst:Code></wst:Status></wst:RequestSecurityTokenResponse>");
}

std::string SPNegoLegAnswer(const std::string& contextId, const SsoClient::Leg& leg) {
  return Envelope("<wst:RequestSecurityTokenResponse xmlns:wst=\"" + WST + "\" Context=\"" + contextId + "\">" +
                  BinaryExchange(leg) + "</wst:RequestSecurityTokenResponse>");
}

std::string SPNegoFinalAnswer(const std::string& contextId, const SsoClient::Leg& leg, const std::string& assertion) {
  return Envelope("<wst:RequestSecurityTokenResponseCollection xmlns:wst=\"" + WST +
                  "\"><wst:RequestSecurityTokenResponse Context=\"" + contextId + "\">" + TokenType() +
                  (leg.empty() ? std::string() : BinaryExchange(leg)) + RequestedToken(assertion) +
                  "</wst:RequestSecurityTokenResponse></wst:RequestSecurityTokenResponseCollection>");
}

std::string FaultAnswer(const std::string& faultcode, const std::string& faultstring) {
  return Envelope("<soapenv:Fault xmlns:wst=\"" + WST + "\" xmlns:wsse=\"" + Wire::kWsse.uri + "\"><faultcode>" +
                  EscapeText(faultcode) + "</faultcode><faultstring>" + EscapeText(faultstring) +
                  "</faultstring></soapenv:Fault>");
}

}  // namespace DevSts
