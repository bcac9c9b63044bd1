#ifndef SSOCLIENT_XMLREQUESTBUILDERS_H
#define SSOCLIENT_XMLREQUESTBUILDERS_H

// The WS-Security header elements, the WS-Trust request bodies and the advice they carry.
// Factories that read the clock fix their times when called, not when built.

#include <set>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"
#include "ssoClient/xmlCommonBuilders.h"

namespace SsoClient {

// --- WS-Security header ---

// wsse:Security holding a wsu:Timestamp; further header children are added by wrapping the
// result in a composite, so that they follow the timestamp.
BuilderPtr WsSecurityHeaderBuilder(int timestampMinutes);
// wsu:Timestamp with wsu:Created (now) and wsu:Expires (now plus `timestampMinutes`).
BuilderPtr WssuTimestampBuilder(int timestampMinutes);
// wsse:UsernameToken with wsse:Username only.
BuilderPtr WsseUsernameTokenBuilder(const std::string& userName);
// wsse:UsernameToken with wsse:Username and the clear-text wsse:Password.
BuilderPtr WsseUsernameTokenBuilder(const std::string& userName, const std::string& password);
// wst:Lifetime with wsu:Created (now) and wsu:Expires (now plus `lifetimeSeconds`). A lifetime
// whose end lies outside the clock's range raises Tamber::InvalidArgumentException.
BuilderPtr WssuLifetimeBuilder(long long lifetimeSeconds);

// --- WS-Trust bodies ---

// The issue RST without wst:UseKey, open for further children.
boost::shared_ptr<XMLCompositeBuilder> CommonAcquireSecurityTokenBuilder(SamlToken::ConfirmationType confirmation,
                                                                         const TokenSpec& spec);
// The issue RST, with wst:UseKey when holder-of-key proof is wanted and nobody is delegated to.
BuilderPtr AcquireSecurityTokenBuilder(SamlToken::ConfirmationType confirmation, const TokenSpec& spec);
// The issue RST for a token exchange: the request is signed with the presented token instead.
BuilderPtr ExchangeSecurityTokenBuilder(SamlToken::ConfirmationType confirmation, const TokenSpec& spec);
// The renew RST of a holder-of-key `token`.
BuilderPtr RenewSecurityTokenBuilder(const SamlToken& token, long long lifetimeSeconds);
// The validate RST of `token`.
BuilderPtr ValidateSecurityTokenBuilder(const SamlToken& token);

BuilderPtr WstRenewingBuilder(bool renewable);
BuilderPtr WstDelegateToBuilder(const std::string& delegateTo);
BuilderPtr WstParticipantsBuilders(const std::set<std::string>& participants);
BuilderPtr WstParticipantBuilder(const std::string& address);
BuilderPtr WsaEndpointAddressReferenceBuilder(const std::string& address);
// wst:BinaryExchange carrying one base64-encoded SPNEGO leg.
BuilderPtr WstSPNegoBinExchangeBuilder(const std::vector<unsigned char>& leg);

// The body of the first SPNEGO leg: the full issue RST with the leg and a fresh Context id.
// Each build reads the clock and makes a new context id.
class XMLBodyBuilderInitialSPNego final : public XMLBaseBuilder {
 public:
  XMLBodyBuilderInitialSPNego(SamlToken::ConfirmationType confirmation, const TokenSpec& spec,
                              const std::vector<unsigned char>& leg);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  SamlToken::ConfirmationType _confirmation;
  TokenSpec _spec;
  std::vector<unsigned char> _leg;
};

// The body of a continued SPNEGO leg: a wst:RequestSecurityTokenResponse in the STS's context.
class XMLBodyBuilderContinuedSPNego final : public XMLBaseBuilder {
 public:
  XMLBodyBuilderContinuedSPNego(const std::string& contextId, const std::vector<unsigned char>& leg);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  std::string _contextId;
  std::vector<unsigned char> _leg;
};

// --- Advice ---

BuilderPtr RsaAdviceSetBuilder(const std::vector<Advice>& advice);
BuilderPtr RsaAdviceBuilder(const Advice& advice);
BuilderPtr RsaAttributeBuilder(const AdviceAttribute& attribute);

}  // namespace SsoClient

#endif
