#include "ssoClient/xmlSoapBuilders.h"

#include <vector>

#include "ssoClient/SignatureAlgorithms.h"
#include "ssoClient/Verify.h"
#include "ssoClient/WireConstants.h"
#include "tamber/StringUtil.h"
#include "tamber/xml/QName.h"

namespace SsoClient {

using Tamber::Ref;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;

BuilderPtr SoapBuilder(BuilderPtr header, BuilderPtr body) {
  const char* soapenv = Wire::kSoapEnvelope.prefix;
  BuilderPtr soapHeader = CompositeBuilder(ElementBuilder(soapenv, "Header"), {std::move(header)});
  BuilderPtr soapBody =
      CompositeBuilder(ElementBuilder(soapenv, "Body", {Wire::Declaration(Wire::kWsTrust)}), {std::move(body)});
  return CompositeBuilder(ElementBuilder(soapenv, "Envelope", {Wire::Declaration(Wire::kSoapEnvelope)}),
                          {soapHeader, soapBody});
}

XMLSignedSoapBuilder::XMLSignedSoapBuilder(BuilderPtr headerBuilder, BuilderPtr bodyBuilder,
                                           const Tamber::Crypto::PrivateKey* key, BuilderPtr keyInfoBuilder) {
  SSOCLIENT_VERIFY_NOT_NULL(headerBuilder);
  _headerBuilder = std::move(headerBuilder);
  _bodyBuilder = std::move(bodyBuilder);
  _key = key;
  _keyInfoBuilder = std::move(keyInfoBuilder);
}

void XMLSignedSoapBuilder::build(Ref<ElementNode>& out) const {
  SoapBuilder(_headerBuilder, _bodyBuilder)->build(out);
  SignSoapMessage(_key.get(), _keyInfoBuilder, out.get());
}

BuilderPtr CertRefSignedSoapBuilder(const BuilderPtr& header, const BuilderPtr& body,
                                    const Tamber::Crypto::PrivateKey* key,
                                    const Tamber::Crypto::Certificate* certificate) {
  TAMBER_VERIFY_TEXT(header != nullptr, "headerBuilder != __null");
  BuilderPtr headerWithCertificate =
      CompositeBuilder(header, {WsseX509v3BinarySecTokenBuilder(Wire::kHolderOfKeyCertificateId, certificate)});
  return BuilderPtr(new XMLSignedSoapBuilder(headerWithCertificate, body, key,
                                             WsseX509v3BSTReferenceBuilder(Wire::kHolderOfKeyCertificateId)));
}

BuilderPtr SamlRefSignedSoapBuilder(const BuilderPtr& header, const BuilderPtr& body,
                                    const Tamber::Crypto::PrivateKey* key, const std::string& id) {
  return BuilderPtr(new XMLSignedSoapBuilder(header, body, key, WsseSamlKeyIdReferenceBuilder(id)));
}

BuilderPtr WsseX509v3BinarySecTokenBuilder(const std::string& id, const Tamber::Crypto::Certificate* certificate) {
  const std::vector<unsigned char>& der = certificate->GetDer();
  std::string text(Tamber::Base64_EncodedLength(der.size()), '\0');
  text.resize(Tamber::Base64_Encode(der.data(), der.size(), &text[0], text.size()));
  // No xmlns:wsse of its own: it always stands inside wsse:Security.
  return TextElementBuilder(Wire::kWsse.prefix, "BinarySecurityToken",
                            {Wire::Declaration(Wire::kWsu),
                             {"EncodingType", Wire::kBase64Binary},
                             {"ValueType", Wire::kX509v3},
                             {std::string(Wire::kWsu.prefix) + ":Id", id}},
                            text);
}

BuilderPtr WsseX509v3BSTReferenceBuilder(const std::string& id) {
  return CompositeBuilder(
      ElementBuilder(Wire::kWsse.prefix, "SecurityTokenReference", {Wire::Declaration(Wire::kWsse)}),
      {ElementBuilder(Wire::kWsse.prefix, "Reference", {{"URI", "#" + id}, {"ValueType", Wire::kX509v3}})});
}

BuilderPtr WsseSamlKeyIdReferenceBuilder(const std::string& id) {
  return CompositeBuilder(
      ElementBuilder(Wire::kWsse.prefix, "SecurityTokenReference",
                     {Wire::Declaration(Wire::kWsse),
                      Wire::Declaration(Wire::kWsse11),
                      {std::string(Wire::kWsse11.prefix) + ":TokenType", Wire::kSamlV20TokenType}}),
      {TextElementBuilder(Wire::kWsse.prefix, "KeyIdentifier", {{"ValueType", Wire::kSamlIdKeyIdentifier}}, id)});
}

void SignSoapMessage(const Tamber::Crypto::PrivateKey* key, BuilderPtr keyInfoBuilder, ElementNode* envelope) {
  ElementNode* soapBody = envelope->FindChildElement(QName(Wire::kSoapEnvelope.uri, "Body"));
  SSOCLIENT_VERIFY_NOT_NULL(soapBody);
  ElementNode* soapHeader = envelope->FindChildElement(QName(Wire::kSoapEnvelope.uri, "Header"));
  SSOCLIENT_VERIFY_NOT_NULL(soapHeader);
  ElementNode* wsseSecurity = soapHeader->FindChildElement(QName(Wire::kWsse.uri, "Security"));
  SSOCLIENT_VERIFY_NOT_NULL(wsseSecurity);
  ElementNode* timestamp = wsseSecurity->FindChildElement(QName(Wire::kWsu.uri, "Timestamp"));

  Ref<Tamber::Xml::Security::Signature> signature;
  Tamber::Xml::Security::CreateBlankSignature(envelope, Algorithms::EXCLUSIVE_C14N, Algorithms::RSA_SHA256,
                                              Wire::kSignaturePrefix, signature);
  AddElementToSignature(signature.get(), soapBody);
  AddElementToSignature(signature.get(), timestamp);
  if (keyInfoBuilder) {
    Ref<ElementNode> keyInfo;
    keyInfoBuilder->build(keyInfo);
    signature->SetKeyInfo(keyInfo.get());
  }
  signature->Sign(key);

  ElementNode* signatureElement = signature->GetElement();
  signatureElement->SetAttribute("Id", Wire::kHolderOfKeyProofSignatureId);
  wsseSecurity->AppendChild(signatureElement);
}

void AddElementToSignature(Tamber::Xml::Security::Signature* signature, ElementNode* element) {
  if (element == nullptr) {
    return;
  }
  const std::string id = CreateWssuId(element);
  signature->AddReference("#" + id, Algorithms::SHA256)->AddTransform(Algorithms::EXCLUSIVE_C14N);
}

std::string CreateWssuId(ElementNode* element) {
  std::string id;
  if (element->GetAttribute(QName(Wire::kWsu.uri, "Id"), id)) {
    return id;
  }
  id = element->GetLocalName() + Tamber::StringUtil::GenerateUuid();
  ElementDefineAttribute(element, Wire::Declaration(Wire::kWsu));
  ElementDefineAttribute(element, {std::string(Wire::kWsu.prefix) + ":Id", id});
  return id;
}

}  // namespace SsoClient
