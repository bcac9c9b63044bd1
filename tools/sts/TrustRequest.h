#ifndef TOOLS_STS_TRUSTREQUEST_H
#define TOOLS_STS_TRUSTREQUEST_H

// What a wst:RequestSecurityToken asks for, read from its element.

#include <cstdint>
#include <string>
#include <vector>

#include <boost/optional.hpp>
#include <libxml/tree.h>

#include "TokenIssuer.h"
#include "ssoClient/NegotiationHandler.h"

namespace DevSts {

struct TrustRequest {
  std::string keyType;                   // the WS-Trust key type URI
  boost::optional<int64_t> lifetimeSec;  // from wst:Lifetime
  std::vector<std::string> audience;     // wst:Participants
  bool delegable = false;
  bool renewable = false;
  boost::optional<std::string> delegateTo;
  std::vector<TokenIssuer::AdviceRecord> advice;
  // wst:BinaryExchange, decoded; set for a negotiation.
  boost::optional<SsoClient::Leg> binaryExchange;
};

// Refuses with wst:InvalidRequest unless `rst` is a wst:RequestSecurityToken with this token
// type and request type.
void RequireRequestKind(const xmlNode* rst, const char* tokenType, const char* requestType);

// Reads an Issue request (SAML 2.0 token type, Issue request type).
TrustRequest ReadIssueRequest(const xmlNode* rst);

// The requested lifetime of a wst:Lifetime element, in seconds.
int64_t ReadLifetime(const xmlNode* lifetime);

// The base64 content of a wst:BinaryExchange element.
SsoClient::Leg ReadBinaryExchange(const xmlNode* exchange);

}  // namespace DevSts

#endif
