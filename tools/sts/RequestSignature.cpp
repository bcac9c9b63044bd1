#include "RequestSignature.h"

#include <memory>
#include <string>

#include <libxml/valid.h>
#include <xmlsec/app.h>
#include <xmlsec/crypto.h>
#include <xmlsec/xmldsig.h>

#include "ssoClient/WireConstants.h"
#include "tamber/xml/TreeWalk.h"
#include "tamber/xml/security/Ids.h"
#include "tamber/xml/security/XmlSec.h"

namespace DevSts {

namespace {

struct ContextDeleter {
  void operator()(xmlSecDSigCtx* context) const { xmlSecDSigCtxDestroy(context); }
};

const xmlChar* Chars(const char* text) { return reinterpret_cast<const xmlChar*>(text); }

}  // namespace

bool RegisterWsuIds(xmlDoc* document) {
  bool registered = true;
  Tamber::Xml::ForEachInSubtree(xmlDocGetRootElement(document), [&](xmlNode* node) {
    if (!registered || node->type != XML_ELEMENT_NODE) return;
    for (xmlAttr* attribute = node->properties; attribute != nullptr && registered; attribute = attribute->next) {
      if (attribute->ns != nullptr && xmlStrEqual(attribute->ns->href, Chars(SsoClient::Wire::kWsu.uri)) &&
          xmlStrEqual(attribute->name, Chars("Id"))) {
        const std::string value = Tamber::Xml::Security::GetAttributeValue(attribute);
        // An empty value is refused too: xmlAddID takes none.
        registered = xmlAddID(nullptr, document, Chars(value.c_str()), attribute) != nullptr;
      }
    }
  });
  return registered;
}

SignatureCheck VerifySignatureElement(xmlNode* signature, const std::vector<unsigned char>& certificateDer) {
  Tamber::Xml::Security::EnsureXmlSecInitialized();
  SignatureCheck result;
  std::unique_ptr<xmlSecDSigCtx, ContextDeleter> context(xmlSecDSigCtxCreate(nullptr));
  if (!context) {
    result.error = "xmlsec cannot create a signature context";
    return result;
  }
  context->enabledReferenceUris = xmlSecTransformUriTypeSameDocument;
  context->signKey = xmlSecCryptoAppKeyLoadMemory(certificateDer.data(), static_cast<xmlSecSize>(certificateDer.size()),
                                                  xmlSecKeyDataFormatCertDer, nullptr, nullptr, nullptr);
  if (context->signKey == nullptr) {
    result.error = "the certificate could not be loaded";
    return result;
  }
  if (xmlSecDSigCtxVerify(context.get(), signature) < 0) {
    result.error = "xmlsec could not carry out the verification";
    return result;
  }
  for (xmlSecSize i = 0; i < xmlSecPtrListGetSize(&context->signedInfoReferences); ++i) {
    auto* reference = static_cast<xmlSecDSigReferenceCtx*>(xmlSecPtrListGetItem(&context->signedInfoReferences, i));
    result.referenceUris.push_back(reference->uri == nullptr ? "" : reinterpret_cast<const char*>(reference->uri));
    result.referenceValid.push_back(reference->status == xmlSecDSigStatusSucceeded);
  }
  result.valid = context->status == xmlSecDSigStatusSucceeded;
  return result;
}

}  // namespace DevSts
