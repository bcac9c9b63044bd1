#ifndef SSOCLIENT_XMLSOAPBUILDERS_H
#define SSOCLIENT_XMLSOAPBUILDERS_H

// The SOAP 1.1 envelope of every request, and the XML signature that proves possession of the
// caller's key: by referencing its certificate, or a holder-of-key SAML token in the header.

#include <string>

#include "ssoClient/xmlCommonBuilders.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/security/Signature.h"

namespace SsoClient {

// soapenv:Envelope holding soapenv:Header (with the element `header` builds) and soapenv:Body
// (with the element `body` builds).
BuilderPtr SoapBuilder(BuilderPtr header, BuilderPtr body);

// Builds the envelope anew and signs it at every build, so each build has new ids and signature.
class XMLSignedSoapBuilder final : public XMLBaseBuilder {
 public:
  XMLSignedSoapBuilder(BuilderPtr headerBuilder, BuilderPtr bodyBuilder, const Tamber::Crypto::PrivateKey* key,
                       BuilderPtr keyInfoBuilder);
  void build(Tamber::Ref<Tamber::Xml::ElementNode>& out) const override;

 private:
  BuilderPtr _headerBuilder;
  BuilderPtr _bodyBuilder;
  Tamber::Ref<const Tamber::Crypto::PrivateKey> _key;
  BuilderPtr _keyInfoBuilder;
};

// Signed with `key`; `certificate` travels as a wsse:BinarySecurityToken that the signature's
// key information references.
BuilderPtr CertRefSignedSoapBuilder(const BuilderPtr& header, const BuilderPtr& body,
                                    const Tamber::Crypto::PrivateKey* key,
                                    const Tamber::Crypto::Certificate* certificate);
// Signed with `key`, whose holder-of-key assertion (ID `id`) the header already carries.
BuilderPtr SamlRefSignedSoapBuilder(const BuilderPtr& header, const BuilderPtr& body,
                                    const Tamber::Crypto::PrivateKey* key, const std::string& id);

BuilderPtr WsseX509v3BinarySecTokenBuilder(const std::string& id, const Tamber::Crypto::Certificate* certificate);
BuilderPtr WsseX509v3BSTReferenceBuilder(const std::string& id);
BuilderPtr WsseSamlKeyIdReferenceBuilder(const std::string& id);

// Signs the built `envelope` in place: references to soapenv:Body and (when present)
// wsu:Timestamp, key information from `keyInfoBuilder` (left out when empty), and the
// ds:Signature appended to wsse:Security.
void SignSoapMessage(const Tamber::Crypto::PrivateKey* key, BuilderPtr keyInfoBuilder,
                     Tamber::Xml::ElementNode* envelope);
// Adds a reference to `element` (by its wsu:Id, given one if needed); a null element adds none.
void AddElementToSignature(Tamber::Xml::Security::Signature* signature, Tamber::Xml::ElementNode* element);
// The element's wsu:Id: the one it carries, or a new "<localName><uuid>" set on it.
std::string CreateWssuId(Tamber::Xml::ElementNode* element);

}  // namespace SsoClient

#endif
