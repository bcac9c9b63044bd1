#include "TrustRequest.h"

#include "SoapRequest.h"
#include "ssoClient/WireConstants.h"
#include "tamber/Exception.h"
#include "tamber/StringUtil.h"

namespace DevSts {

namespace {

namespace Wire = SsoClient::Wire;

const char* const WST = Wire::kWsTrust.uri;

std::vector<std::string> ReadAudience(const xmlNode* participants) {
  std::vector<std::string> audience;
  for (const xmlNode* participant = participants ? participants->children : nullptr; participant != nullptr;
       participant = participant->next) {
    if (participant->type != XML_ELEMENT_NODE) continue;
    const xmlNode* reference = RequireChild(participant, "EndpointReference", Wire::kWsAddressing.uri);
    audience.push_back(TextOf(RequireChild(reference, "Address", Wire::kWsAddressing.uri)));
  }
  return audience;
}

std::vector<TokenIssuer::AdviceRecord> ReadAdvice(const xmlNode* adviceSet) {
  std::vector<TokenIssuer::AdviceRecord> advice;
  for (const xmlNode* item = adviceSet ? adviceSet->children : nullptr; item != nullptr; item = item->next) {
    if (item->type != XML_ELEMENT_NODE) continue;
    TokenIssuer::AdviceRecord record;
    record.source = AttributeOf(item, "AdviceSource");
    for (const xmlNode* attribute = item->children; attribute != nullptr; attribute = attribute->next) {
      if (attribute->type != XML_ELEMENT_NODE) continue;
      std::vector<std::string> values;
      for (const xmlNode* value = attribute->children; value != nullptr; value = value->next) {
        if (value->type == XML_ELEMENT_NODE) values.push_back(TextOf(value));
      }
      record.attributes.emplace_back(AttributeOf(attribute, "Name"), values);
    }
    advice.push_back(record);
  }
  return advice;
}

}  // namespace

void RequireRequestKind(const xmlNode* rst, const char* tokenType, const char* requestType) {
  if (!IsElement(rst, "RequestSecurityToken", WST)) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected a wst:RequestSecurityToken in the body, found ") +
                                              reinterpret_cast<const char*>(rst->name));
  }
  const std::string foundTokenType = TextOf(RequireChild(rst, "TokenType", WST));
  if (foundTokenType != tokenType) {
    throw StsFault(FAULT_INVALID_REQUEST,
                   std::string("Expected the token type ") + tokenType + ", found \"" + foundTokenType + "\"");
  }
  const std::string foundRequestType = TextOf(RequireChild(rst, "RequestType", WST));
  if (foundRequestType != requestType) {
    throw StsFault(FAULT_INVALID_REQUEST,
                   std::string("Expected the request type ") + requestType + ", found \"" + foundRequestType + "\"");
  }
}

int64_t ReadLifetime(const xmlNode* lifetime) {
  const int64_t seconds = (ReadUtcTime(lifetime, "Expires") - ReadUtcTime(lifetime, "Created")) / 1000000;
  if (seconds <= 0) throw StsFault(FAULT_INVALID_REQUEST, "Expected a wst:Lifetime that ends after it begins");
  return seconds;
}

SsoClient::Leg ReadBinaryExchange(const xmlNode* exchange) {
  try {
    return Tamber::StringUtil::Base64Decode(TextOf(exchange));
  } catch (const Tamber::Exception&) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected base64 in wst:BinaryExchange");
  }
}

TrustRequest ReadIssueRequest(const xmlNode* rst) {
  RequireRequestKind(rst, Wire::kTokenTypeSaml20, Wire::kRequestTypeIssue);
  TrustRequest request;
  request.keyType = TextOf(FindChild(rst, "KeyType", WST));
  if (request.keyType != Wire::kKeyTypeBearer && request.keyType != Wire::kKeyTypePublicKey) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected the key type ") + Wire::kKeyTypeBearer + " or " +
                                              Wire::kKeyTypePublicKey + ", found \"" + request.keyType + "\"");
  }
  if (const xmlNode* lifetime = FindChild(rst, "Lifetime", WST)) request.lifetimeSec = ReadLifetime(lifetime);
  request.renewable = AttributeOf(FindChild(rst, "Renewing", WST), "Allow") == "true";
  request.delegable = TextOf(FindChild(rst, "Delegatable", WST)) == "true";
  if (const xmlNode* delegateTo = FindChild(rst, "DelegateTo", WST)) {
    const xmlNode* usernameToken = RequireChild(delegateTo, "UsernameToken", Wire::kWsse.uri);
    request.delegateTo = TextOf(RequireChild(usernameToken, "Username", Wire::kWsse.uri));
  }
  request.audience = ReadAudience(FindChild(rst, "Participants", WST));
  request.advice = ReadAdvice(FindChild(rst, "AdviceSet", Wire::kRsaAdvice.uri));
  if (const xmlNode* exchange = FindChild(rst, "BinaryExchange", WST)) {
    request.binaryExchange = ReadBinaryExchange(exchange);
  }
  return request;
}

}  // namespace DevSts
