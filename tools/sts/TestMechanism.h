#ifndef TOOLS_STS_TESTMECHANISM_H
#define TOOLS_STS_TESTMECHANISM_H

// The STS's test GSS mechanism, two legs: the client names the user; the STS answers a random
// challenge; the client proves the password with an HMAC-SHA256 of the challenge keyed with it;
// the STS answers with the token.

#include <string>

#include "ssoClient/NegotiationHandler.h"

namespace DevSts {

// The client's first leg for `user`.
SsoClient::Leg MechanismFirstLeg(const std::string& user);
// The user named by a first leg; StsFault wst:InvalidRequest when it is not one.
std::string MechanismUserOf(const SsoClient::Leg& firstLeg);
// A fresh challenge.
SsoClient::Leg MechanismChallenge();
// The proof of `password` for `challenge`.
SsoClient::Leg MechanismProof(const std::string& password, const SsoClient::Leg& challenge);
// Compares proofs in constant time.
bool MechanismProofMatches(const SsoClient::Leg& expected, const SsoClient::Leg& found);

}  // namespace DevSts

#endif
