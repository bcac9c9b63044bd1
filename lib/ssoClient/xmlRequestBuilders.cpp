#include "ssoClient/xmlRequestBuilders.h"

#include <cstdint>

#include <boost/lexical_cast.hpp>

#include "ssoClient/WireConstants.h"
#include "ssoClient/XmlUtils.h"
#include "tamber/Exception.h"
#include "tamber/Panic.h"
#include "tamber/StringUtil.h"
#include "tamber/system/DateTime.h"

namespace SsoClient {

using Tamber::Ref;
using Tamber::Xml::ElementNode;

namespace {

const char* BooleanText(bool value) { return value ? "true" : "false"; }

BuilderPtr WstTextElement(const char* localName, const std::string& text) {
  return TextElementBuilder(Wire::kWsTrust.prefix, localName, text);
}

BuilderPtr WsuTextElement(const char* localName, const Tamber::System::DateTime& date) {
  return TextElementBuilder(Wire::kWsu.prefix, localName, DateTimeFormatter(date));
}

// The root of every RST body, declaring the WS-Trust prefix itself.
boost::shared_ptr<XMLCompositeBuilder> RequestSecurityTokenBuilder(std::initializer_list<BuilderPtr> children) {
  return CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "RequestSecurityToken",
                                         {Wire::Declaration(Wire::kWsTrust)}),
                          children);
}

const char* KeyType(SamlToken::ConfirmationType confirmation) {
  switch (confirmation) {
    case SamlToken::CONFIRM_HOLDER_OF_KEY:
      return Wire::kKeyTypePublicKey;
    case SamlToken::CONFIRM_BEARER:
      return Wire::kKeyTypeBearer;
  }
  TAMBER_VERIFY_TEXT(false, "false");
  return nullptr;
}

// now + seconds on the microsecond clock; an end past the clock's range is refused rather than
// wrapped around.
Tamber::System::DateTime AddSecondsToDate(const Tamber::System::DateTime& date, long long seconds) {
  int64_t micros = 0;
  int64_t end = 0;
  if (__builtin_mul_overflow(static_cast<int64_t>(seconds), int64_t(1000000), &micros) ||
      __builtin_add_overflow(date.GetUtcTime(), micros, &end)) {
    throw Tamber::InvalidArgumentException("Token lifetime of " + boost::lexical_cast<std::string>(seconds) +
                                           " seconds ends beyond the range of the clock");
  }
  return Tamber::System::DateTimeFromUtc(end, false);
}

}  // namespace

// --- WS-Security header ---

BuilderPtr WsSecurityHeaderBuilder(int timestampMinutes) {
  return CompositeBuilder(ElementBuilder(Wire::kWsse.prefix, "Security", {Wire::Declaration(Wire::kWsse)}),
                          {WssuTimestampBuilder(timestampMinutes)});
}

BuilderPtr WssuTimestampBuilder(int timestampMinutes) {
  const Tamber::System::DateTime now = Tamber::System::GetUtcDateTime();
  const Tamber::System::DateTime expires = AddMinutesToDate(now, timestampMinutes);
  return CompositeBuilder(ElementBuilder(Wire::kWsu.prefix, "Timestamp", {Wire::Declaration(Wire::kWsu)}),
                          {WsuTextElement("Created", now), WsuTextElement("Expires", expires)});
}

BuilderPtr WsseUsernameTokenBuilder(const std::string& userName) {
  return CompositeBuilder(ElementBuilder(Wire::kWsse.prefix, "UsernameToken", {Wire::Declaration(Wire::kWsse)}),
                          {TextElementBuilder(Wire::kWsse.prefix, "Username", userName)});
}

BuilderPtr WsseUsernameTokenBuilder(const std::string& userName, const std::string& password) {
  return CompositeBuilder(WsseUsernameTokenBuilder(userName),
                          {TextElementBuilder(Wire::kWsse.prefix, "Password", {{"Type", Wire::kPasswordText}}, password)});
}

BuilderPtr WssuLifetimeBuilder(long long lifetimeSeconds) {
  const Tamber::System::DateTime now = Tamber::System::GetUtcDateTime();
  const Tamber::System::DateTime expires = AddSecondsToDate(now, lifetimeSeconds);
  return CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "Lifetime", {Wire::Declaration(Wire::kWsu)}),
                          {WsuTextElement("Created", now), WsuTextElement("Expires", expires)});
}

// --- WS-Trust bodies ---

boost::shared_ptr<XMLCompositeBuilder> CommonAcquireSecurityTokenBuilder(SamlToken::ConfirmationType confirmation,
                                                                         const TokenSpec& spec) {
  const char* keyType = KeyType(confirmation);
  boost::shared_ptr<XMLCompositeBuilder> rst = RequestSecurityTokenBuilder({
      WstTextElement("TokenType", Wire::kTokenTypeSaml20),
      WstTextElement("RequestType", Wire::kRequestTypeIssue),
      WstTextElement("KeyType", keyType),
      WssuLifetimeBuilder(spec.tokenLifetimeSec),
      WstRenewingBuilder(spec.renewable),
      WstTextElement("Delegatable", BooleanText(spec.delegable)),
  });
  if (spec.delegateTo) {
    rst->Add(WstDelegateToBuilder(*spec.delegateTo));
  }
  if (!spec.audienceRestriction.empty()) {
    rst->Add(WstParticipantsBuilders(spec.audienceRestriction));
  }
  if (!spec.advice.empty()) {
    rst->Add(RsaAdviceSetBuilder(spec.advice));
  }
  return rst;
}

BuilderPtr AcquireSecurityTokenBuilder(SamlToken::ConfirmationType confirmation, const TokenSpec& spec) {
  boost::shared_ptr<XMLCompositeBuilder> rst = CommonAcquireSecurityTokenBuilder(confirmation, spec);
  if (confirmation == SamlToken::CONFIRM_HOLDER_OF_KEY && !spec.delegateTo) {
    rst->Add(ElementBuilder(Wire::kWsTrust.prefix, "UseKey", {{"Sig", Wire::kHolderOfKeyProofSignatureId}}));
  }
  return rst;
}

BuilderPtr ExchangeSecurityTokenBuilder(SamlToken::ConfirmationType confirmation, const TokenSpec& spec) {
  return CommonAcquireSecurityTokenBuilder(confirmation, spec);
}

BuilderPtr RenewSecurityTokenBuilder(const SamlToken& token, long long lifetimeSeconds) {
  TAMBER_VERIFY_TEXT(token.GetConfirmationMethod() == SamlToken::CONFIRM_HOLDER_OF_KEY,
                     "token.GetConfirmationMethod() == SamlToken::CONFIRM_HOLDER_OF_KEY");
  BuilderPtr renewTarget =
      CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "RenewTarget"), {InsertSamlTokenBuilder(token)});
  return RequestSecurityTokenBuilder({
      WstTextElement("TokenType", Wire::kTokenTypeSaml20),
      WstTextElement("RequestType", Wire::kRequestTypeRenew),
      WssuLifetimeBuilder(lifetimeSeconds),
      renewTarget,
  });
}

BuilderPtr ValidateSecurityTokenBuilder(const SamlToken& token) {
  BuilderPtr validateTarget =
      CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "ValidateTarget"), {InsertSamlTokenBuilder(token)});
  return RequestSecurityTokenBuilder({
      WstTextElement("TokenType", Wire::kTokenTypeStatus),
      WstTextElement("RequestType", Wire::kRequestTypeValidate),
      validateTarget,
  });
}

BuilderPtr WstRenewingBuilder(bool renewable) {
  return ElementBuilder(Wire::kWsTrust.prefix, "Renewing", {{"Allow", BooleanText(renewable)}, {"OK", "false"}});
}

BuilderPtr WstDelegateToBuilder(const std::string& delegateTo) {
  return CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "DelegateTo"), {WsseUsernameTokenBuilder(delegateTo)});
}

BuilderPtr WstParticipantsBuilders(const std::set<std::string>& participants) {
  boost::shared_ptr<XMLCompositeBuilder> result = CompositeBuilder(
      ElementBuilder(Wire::kWsTrust.prefix, "Participants", {Wire::Declaration(Wire::kWsAddressing)}), {});
  for (const std::string& participant : participants) {
    result->Add(WstParticipantBuilder(participant));
  }
  return result;
}

BuilderPtr WstParticipantBuilder(const std::string& address) {
  return CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "Participant"),
                          {WsaEndpointAddressReferenceBuilder(address)});
}

BuilderPtr WsaEndpointAddressReferenceBuilder(const std::string& address) {
  return CompositeBuilder(ElementBuilder(Wire::kWsAddressing.prefix, "EndpointReference"),
                          {TextElementBuilder(Wire::kWsAddressing.prefix, "Address", address)});
}

BuilderPtr WstSPNegoBinExchangeBuilder(const std::vector<unsigned char>& leg) {
  return TextElementBuilder(Wire::kWsTrust.prefix, "BinaryExchange",
                            {{"EncodingType", Wire::kBase64Binary}, {"ValueType", Wire::kSpnegoValueType}},
                            Tamber::StringUtil::Base64Encode(leg));
}

XMLBodyBuilderInitialSPNego::XMLBodyBuilderInitialSPNego(SamlToken::ConfirmationType confirmation,
                                                         const TokenSpec& spec, const std::vector<unsigned char>& leg)
    : _confirmation(confirmation), _spec(spec), _leg(leg) {}

void XMLBodyBuilderInitialSPNego::build(Ref<ElementNode>& out) const {
  CompositeBuilder(AcquireSecurityTokenBuilder(_confirmation, _spec), {WstSPNegoBinExchangeBuilder(_leg)})->build(out);
  out->SetAttribute("Context", "urn:uuid:" + Tamber::StringUtil::GenerateUuid());
}

XMLBodyBuilderContinuedSPNego::XMLBodyBuilderContinuedSPNego(const std::string& contextId,
                                                             const std::vector<unsigned char>& leg)
    : _contextId(contextId), _leg(leg) {}

void XMLBodyBuilderContinuedSPNego::build(Ref<ElementNode>& out) const {
  // No declaration of its own: the enclosing soapenv:Body binds the WS-Trust prefix.
  CompositeBuilder(ElementBuilder(Wire::kWsTrust.prefix, "RequestSecurityTokenResponse"),
                   {WstSPNegoBinExchangeBuilder(_leg)})
      ->build(out);
  out->SetAttribute("Context", _contextId);
}

// --- Advice ---

BuilderPtr RsaAdviceSetBuilder(const std::vector<Advice>& advice) {
  boost::shared_ptr<XMLCompositeBuilder> result =
      CompositeBuilder(ElementBuilder(Wire::kRsaAdvice.prefix, "AdviceSet",
                                      {Wire::Declaration(Wire::kRsaAdvice), Wire::Declaration(Wire::kSaml),
                                       Wire::Declaration(Wire::kXmlSchema), Wire::Declaration(Wire::kXmlSchemaInstance)}),
                       {});
  for (const Advice& entry : advice) {
    result->Add(RsaAdviceBuilder(entry));
  }
  return result;
}

BuilderPtr RsaAdviceBuilder(const Advice& advice) {
  boost::shared_ptr<XMLCompositeBuilder> result =
      CompositeBuilder(ElementBuilder(Wire::kRsaAdvice.prefix, "Advice", {{"AdviceSource", advice.source}}), {});
  for (const AdviceAttribute& attribute : advice.attributes) {
    result->Add(RsaAttributeBuilder(attribute));
  }
  return result;
}

BuilderPtr RsaAttributeBuilder(const AdviceAttribute& attribute) {
  boost::shared_ptr<XMLCompositeBuilder> result =
      CompositeBuilder(ElementBuilder(Wire::kRsaAdvice.prefix, "Attribute", {{"Name", attribute.name}}), {});
  const std::string typeAttribute = std::string(Wire::kXmlSchemaInstance.prefix) + ":type";
  const std::string stringType = std::string(Wire::kXmlSchema.prefix) + ":string";
  for (const std::string& value : attribute.values) {
    result->Add(TextElementBuilder(Wire::kRsaAdvice.prefix, "AttributeValue", {{typeAttribute, stringType}}, value));
  }
  return result;
}

}  // namespace SsoClient
