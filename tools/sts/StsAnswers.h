#ifndef TOOLS_STS_STSANSWERS_H
#define TOOLS_STS_STSANSWERS_H

// The WS-Trust answers of an STS, in SOAP 1.1 envelopes: what the development STS sends and what
// scripted tests answer with.

#include <string>

#include "ssoClient/NegotiationHandler.h"

namespace DevSts {

std::string IssueAnswer(const std::string& assertion);
std::string RenewAnswer(const std::string& assertion);
std::string ValidateAnswer(bool valid);
// An intermediate SPNEGO answer: a bare response with the context id and the STS's leg.
std::string SPNegoLegAnswer(const std::string& contextId, const SsoClient::Leg& leg);
// The final SPNEGO answer: a collection with the context id, the leg when not empty, and the token.
std::string SPNegoFinalAnswer(const std::string& contextId, const SsoClient::Leg& leg, const std::string& assertion);
// A SOAP fault; `faultcode` may use the prefixes "wst" and "wsse", which the answer binds to
// WS-Trust 1.3 and WS-Security 1.0. `faultstring` is plain text.
std::string FaultAnswer(const std::string& faultcode, const std::string& faultstring);

}  // namespace DevSts

#endif
