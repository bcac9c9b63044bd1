#ifndef SSOCLIENT_SAMLCONSTANTS_H
#define SSOCLIENT_SAMLCONSTANTS_H

// Namespaces and names of the SAML 2.0 assertion as the STS writes it. Each text lives here only.

namespace SsoClient {
namespace Saml {

// Namespaces.
inline constexpr char SAML_NS[] = "urn:oasis:names:tc:SAML:2.0:assertion";
inline constexpr char DEL_NS[] = "urn:oasis:names:tc:SAML:2.0:conditions:delegation";
inline constexpr char RSAEXT_NS[] = "http://www.rsa.com/names/2009/12/std-ext/SAML2.0";
inline constexpr char DSIG_NS[] = "http://www.w3.org/2000/09/xmldsig#";
inline constexpr char XSI_NS[] = "http://www.w3.org/2001/XMLSchema-instance";
inline constexpr char XS_NS[] = "http://www.w3.org/2001/XMLSchema";

// Subject confirmation methods.
inline constexpr char CONFIRMATION_BEARER[] = "urn:oasis:names:tc:SAML:2.0:cm:bearer";
inline constexpr char CONFIRMATION_HOLDER_OF_KEY[] = "urn:oasis:names:tc:SAML:2.0:cm:holder-of-key";

// The only name-identifier format accepted for subjects and delegates.
inline constexpr char UPN_FORMAT[] = "http://schemas.xmlsoap.org/claims/UPN";

// Attribute names. The is-solution name is written by our own STS; a deployment changes it here.
inline constexpr char ATTRIBUTE_GROUP_IDENTITY[] = "http://rsa.com/schemas/attr-names/2009/01/GroupIdentity";
inline constexpr char ATTRIBUTE_IS_SOLUTION[] = "http://ssoclient.example/schemas/attr-names/2011/07/isSolution";
inline constexpr char ATTRIBUTE_GIVEN_NAME[] = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/givenname";
inline constexpr char ATTRIBUTE_SURNAME[] = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/surname";

// Local names of the typed elements that the reader tells apart by xsi:type.
inline constexpr char KEY_INFO_CONFIRMATION_DATA_TYPE[] = "KeyInfoConfirmationDataType";
inline constexpr char DELEGATION_RESTRICTION_TYPE[] = "DelegationRestrictionType";
inline constexpr char RENEW_RESTRICTION_TYPE[] = "RenewRestrictionType";

}  // namespace Saml
}  // namespace SsoClient

#endif
