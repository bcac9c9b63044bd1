#ifndef SSOCLIENT_DESCRIPTIONS_H
#define SSOCLIENT_DESCRIPTIONS_H

// One-line descriptions of token specifications and tokens for the service's log messages.
// Log readers parse these lines: keep their texts as they are.

#include <string>
#include <vector>

#include <boost/function.hpp>

#include "ssoClient/PrincipalId.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"

namespace SsoClient {

// "TokenSpec [tokenLifetimeSec=..., delegable=..., delegateTo=..., renewable=...,
// confirmationType=...,audienceRestriction=..., advice=[...]".
std::string WriteTokenSpec(const TokenSpec& spec);

// "SamlToken [subject=..., groups=[...], delegationChain=[...], startTime=..., expirationTime=...,
// renewable=..., delegable=..., isSolution=...,confirmationType=...]". Leaves out the token's id,
// audience, advice, certificate and XML.
std::string CreateRedactedDescription(const SamlToken& token);

// "<principal> at <delegation instant>".
std::string WriteDelegate(const Delegate* delegate);
// "Advice [source=..., attributes=[...]]".
std::string WriteAdvice(const Advice* advice);
// "[source=<name>, attributes=[<values>]]".
std::string WriteAdviceAttribute(const AdviceAttribute* attribute);

// The writer's descriptions of `items`, in order, joined with ", "; an empty description adds
// neither text nor separator. Instantiated for Delegate, PrincipalId, Advice and AdviceAttribute.
template <class T>
std::string AsString(const std::vector<T>& items, boost::function<std::string(const T*)> writer);

}  // namespace SsoClient

#endif
