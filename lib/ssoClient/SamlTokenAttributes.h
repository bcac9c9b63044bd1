#ifndef SSOCLIENT_SAMLTOKENATTRIBUTES_H
#define SSOCLIENT_SAMLTOKENATTRIBUTES_H

// What a token says about its subject: the principal of a UPN name identifier, the delegates,
// and the SAML attributes recognised by name. Failures raise ParseException.

#include <string>

#include "ssoClient/PrincipalId.h"
#include "ssoClient/SamlAssertion.h"
#include "ssoClient/SamlToken.h"

namespace SsoClient {

// The principal of a UPN name identifier, split at its last "@".
PrincipalId ParseSamlNameId(const NameIDType& nameId);
Delegate ParseToDelegate(const DelegateType& delegate);

bool SamlAttributeIsGroupIdentity(const AttributeType& attribute);
bool SamlAttributeIsSolution(const AttributeType& attribute);
bool SamlAttributeIsGivenName(const AttributeType& attribute);
bool SamlAttributeIsSurName(const AttributeType& attribute);

// The first value, or the empty string when there is none.
std::string ParsePrincipalNameAttribute(const AttributeType& attribute);
// Exactly one value; true when it is "true" in any letter case.
bool ParseIsSolutionAttribute(const AttributeType& attribute);

}  // namespace SsoClient

#endif
