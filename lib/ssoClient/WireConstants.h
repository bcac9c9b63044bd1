#ifndef SSOCLIENT_WIRECONSTANTS_H
#define SSOCLIENT_WIRECONSTANTS_H

// Namespaces, prefixes and URIs that requests put on the wire. Every text lives here once; the
// values derived from a namespace are spelled from it, so they cannot drift apart.

#include <string>
#include <utility>

#include "ssoClient/SamlConstants.h"

namespace SsoClient {
namespace Wire {

// A namespace as requests write it: a fixed prefix bound by an "xmlns:" attribute.
struct Namespace {
  const char* prefix;
  const char* uri;
};

// The "xmlns:prefix" attribute that binds `ns` on the element it is set on.
inline std::pair<const std::string, std::string> Declaration(const Namespace& ns) {
  return {std::string("xmlns:") + ns.prefix, ns.uri};
}

#define SSOCLIENT_WIRE_WST "http://docs.oasis-open.org/ws-sx/ws-trust/200512"
#define SSOCLIENT_WIRE_WSS_2004 "http://docs.oasis-open.org/wss/2004/01/"
#define SSOCLIENT_WIRE_WSS_SAML "http://docs.oasis-open.org/wss/"

// The prefix table of outgoing messages.
inline constexpr Namespace kSoapEnvelope{"soapenv", "http://schemas.xmlsoap.org/soap/envelope/"};
inline constexpr Namespace kWsTrust{"wst", SSOCLIENT_WIRE_WST};
inline constexpr Namespace kWsse{"wsse", SSOCLIENT_WIRE_WSS_2004 "oasis-200401-wss-wssecurity-secext-1.0.xsd"};
inline constexpr Namespace kWsse11{"wsse11", SSOCLIENT_WIRE_WSS_2004 "oasis-200401-wss-wssecurity-secext-1.1.xsd"};
inline constexpr Namespace kWsu{"wsu", SSOCLIENT_WIRE_WSS_2004 "oasis-200401-wss-wssecurity-utility-1.0.xsd"};
inline constexpr Namespace kWsAddressing{"wsa", "http://www.w3.org/2005/08/addressing"};
inline constexpr Namespace kSaml{"saml", Saml::SAML_NS};
inline constexpr Namespace kXmlSchema{"xs", Saml::XS_NS};
inline constexpr Namespace kXmlSchemaInstance{"xsi", Saml::XSI_NS};
inline constexpr Namespace kRsaAdvice{"rsa-advice", "http://www.rsa.com/names/2009/12/std-ext/WS-Trust1.4/advice"};
// Prefix of the XML-Signature elements of a signed request.
inline constexpr char kSignaturePrefix[] = "ds";

// Token profile identifiers.
inline constexpr char kPasswordText[] =
    SSOCLIENT_WIRE_WSS_2004 "oasis-200401-wss-username-token-profile-1.0#PasswordText";
inline constexpr char kBase64Binary[] =
    SSOCLIENT_WIRE_WSS_2004 "oasis-200401-wss-soap-message-security-1.0#Base64Binary";
inline constexpr char kX509v3[] = SSOCLIENT_WIRE_WSS_2004 "oasis-200401-wss-x509-token-profile-1.0#X509v3";
// "tokenprofile" here and "token-profile" below are both as the profile publishes them.
inline constexpr char kSamlV20TokenType[] = SSOCLIENT_WIRE_WSS_SAML "oasis-wss-saml-tokenprofile-1.1#SAMLV2.0";
inline constexpr char kSamlIdKeyIdentifier[] = SSOCLIENT_WIRE_WSS_SAML "oasis-wss-saml-token-profile-1.1#SAMLID";
inline constexpr char kSpnegoValueType[] = "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego";

// WS-Trust 1.3 values. The SAML 2.0 token type is the assertion namespace itself.
inline constexpr const char* kTokenTypeSaml20 = Saml::SAML_NS;
inline constexpr char kTokenTypeStatus[] = SSOCLIENT_WIRE_WST "/RSTR/Status";
inline constexpr char kRequestTypeIssue[] = SSOCLIENT_WIRE_WST "/Issue";
inline constexpr char kRequestTypeRenew[] = SSOCLIENT_WIRE_WST "/Renew";
inline constexpr char kRequestTypeValidate[] = SSOCLIENT_WIRE_WST "/Validate";
inline constexpr char kKeyTypePublicKey[] = SSOCLIENT_WIRE_WST "/PublicKey";
inline constexpr char kKeyTypeBearer[] = SSOCLIENT_WIRE_WST "/Bearer";
inline constexpr char kActionIssue[] = SSOCLIENT_WIRE_WST "/RST/Issue";
inline constexpr char kActionRenew[] = SSOCLIENT_WIRE_WST "/RST/Renew";
inline constexpr char kActionValidate[] = SSOCLIENT_WIRE_WST "/RST/Validate";
inline constexpr char kActionChallenge[] = SSOCLIENT_WIRE_WST "/RSTR/Issue";

#undef SSOCLIENT_WIRE_WST
#undef SSOCLIENT_WIRE_WSS_2004
#undef SSOCLIENT_WIRE_WSS_SAML

// Fixed ids of a signed request: the certificate token and the signature that wst:UseKey names.
inline constexpr char kHolderOfKeyCertificateId[] = "holderOfKeyCertificate";
inline constexpr char kHolderOfKeyProofSignatureId[] = "holderOfKeyProofSignature";

}  // namespace Wire
}  // namespace SsoClient

#endif
