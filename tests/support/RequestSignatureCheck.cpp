#include "support/RequestSignatureCheck.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <memory>
#include <stdexcept>

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/valid.h>
#include <xmlsec/app.h>
#include <xmlsec/crypto.h>
#include <xmlsec/xmldsig.h>
#include <xmlsec/xmltree.h>

#include "ssoClient/SamlConstants.h"
#include "ssoClient/WireConstants.h"
#include "tamber/StringUtil.h"
#include "tamber/xml/security/XmlSec.h"

namespace TestSupport {

namespace {

namespace Wire = SsoClient::Wire;

struct Deleter {
  void operator()(xmlDoc* doc) const { xmlFreeDoc(doc); }
  void operator()(xmlSecDSigCtx* context) const { xmlSecDSigCtxDestroy(context); }
};

const xmlChar* Chars(const char* text) { return reinterpret_cast<const xmlChar*>(text); }

xmlNodePtr FindChild(xmlNodePtr parent, const char* localName, const char* ns) {
  return parent == nullptr ? nullptr : xmlSecFindChild(parent, Chars(localName), Chars(ns));
}

// The STS knows which attributes are IDs from the WS-Security schema; libxml2 has to be told.
void RegisterWsuIds(xmlDocPtr doc, xmlNodePtr node) {
  for (; node != nullptr; node = node->next) {
    if (node->type != XML_ELEMENT_NODE) continue;
    for (xmlAttrPtr attribute = node->properties; attribute != nullptr; attribute = attribute->next) {
      if (attribute->ns != nullptr && xmlStrEqual(attribute->ns->href, Chars(Wire::kWsu.uri)) &&
          xmlStrEqual(attribute->name, Chars("Id"))) {
        xmlChar* value = xmlNodeListGetString(doc, attribute->children, 1);
        xmlAddID(nullptr, doc, value, attribute);
        xmlFree(value);
      }
    }
    RegisterWsuIds(doc, node->children);
  }
}

std::string ToPem(const Tamber::Crypto::Certificate& certificate) {
  const std::string base64 = Tamber::StringUtil::Base64Encode(certificate.GetDer());
  std::string pem = "-----BEGIN CERTIFICATE-----\n";
  for (size_t i = 0; i < base64.size(); i += 64) pem += base64.substr(i, 64) + "\n";
  return pem + "-----END CERTIFICATE-----\n";
}

// A new file under /tmp holding `content`; its path, or empty on failure.
std::string WriteTemporaryFile(const std::string& content) {
  char path[] = "/tmp/ssoclient-request-XXXXXX";
  const int fd = mkstemp(path);
  if (fd < 0) return "";
  close(fd);
  std::ofstream(path, std::ios::binary) << content;
  return path;
}

}  // namespace

RequestSignatureResult VerifyRequestSignature(const std::string& requestXml,
                                              const Tamber::Crypto::Certificate& certificate) {
  Tamber::Xml::Security::EnsureXmlSecInitialized();
  RequestSignatureResult result;
  std::unique_ptr<xmlDoc, Deleter> doc(
      xmlReadMemory(requestXml.data(), static_cast<int>(requestXml.size()), nullptr, nullptr, XML_PARSE_NONET));
  if (!doc) {
    result.error = "the request is not well-formed XML";
    return result;
  }
  RegisterWsuIds(doc.get(), xmlDocGetRootElement(doc.get()));
  xmlNodePtr header = FindChild(xmlDocGetRootElement(doc.get()), "Header", Wire::kSoapEnvelope.uri);
  xmlNodePtr security = FindChild(header, "Security", Wire::kWsse.uri);
  xmlNodePtr signature = FindChild(security, "Signature", SsoClient::Saml::DSIG_NS);
  if (signature == nullptr) {
    result.error = "no ds:Signature in soapenv:Header/wsse:Security";
    return result;
  }
  std::unique_ptr<xmlSecDSigCtx, Deleter> context(xmlSecDSigCtxCreate(nullptr));
  context->enabledReferenceUris = xmlSecTransformUriTypeSameDocument;
  const std::vector<unsigned char>& der = certificate.GetDer();
  context->signKey = xmlSecCryptoAppKeyLoadMemory(der.data(), static_cast<xmlSecSize>(der.size()),
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

std::string AlterFirstTextByteOf(const std::string& requestXml, const std::string& qualifiedName) {
  const size_t start = requestXml.find("<" + qualifiedName);
  size_t text = start == std::string::npos ? std::string::npos : requestXml.find('>', start);
  while (text != std::string::npos && text + 1 < requestXml.size() && requestXml[text + 1] == '<') {
    text = requestXml.find('>', text + 1);
  }
  if (text == std::string::npos || text + 1 >= requestXml.size()) {
    throw std::invalid_argument("no text inside <" + qualifiedName + ">");
  }
  std::string altered = requestXml;
  altered[text + 1] = static_cast<char>(altered[text + 1] ^ 0x01);
  return altered;
}

ToolResult VerifyRequestWithXmlSecTool(const std::string& requestXml, const Tamber::Crypto::Certificate& certificate) {
  ToolResult result;
  const std::string path = WriteTemporaryFile(requestXml);
  const std::string certificatePemPath = WriteTemporaryFile(ToPem(certificate));
  if (path.empty() || certificatePemPath.empty()) {
    if (!path.empty()) unlink(path.c_str());
    if (!certificatePemPath.empty()) unlink(certificatePemPath.c_str());
    result.output = "cannot create a temporary file";
    return result;
  }

  const std::string command = std::string("xmlsec1 --verify --enabled-reference-uris same-doc") +
                              " --id-attr:Id '" + Wire::kSoapEnvelope.uri + ":Body'" +
                              " --id-attr:Id '" + Wire::kWsu.uri + ":Timestamp'" +
                              " --id-attr:Id '" + SsoClient::Saml::DSIG_NS + ":Signature'" +
                              " --node-id " + Wire::kHolderOfKeyProofSignatureId +
                              " --pubkey-cert-pem '" + certificatePemPath + "' '" + path + "' 2>&1";
  FILE* pipe = popen(command.c_str(), "r");
  if (pipe != nullptr) {
    char buffer[4096];
    size_t count;
    while ((count = fread(buffer, 1, sizeof buffer, pipe)) > 0) result.output.append(buffer, count);
    const int status = pclose(pipe);
    result.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  unlink(path.c_str());
  unlink(certificatePemPath.c_str());
  return result;
}

}  // namespace TestSupport
