#include "support/RequestSignatureCheck.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include <libxml/parser.h>
#include <libxml/tree.h>

#include "SoapRequest.h"
#include "ssoClient/SamlConstants.h"
#include "ssoClient/WireConstants.h"
#include "tamber/StringUtil.h"

namespace TestSupport {

namespace {

namespace Wire = SsoClient::Wire;

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
  RequestSignatureResult result;
  const DevSts::XmlDocument doc(
      xmlReadMemory(requestXml.data(), static_cast<int>(requestXml.size()), nullptr, nullptr, XML_PARSE_NONET));
  if (!doc) {
    result.error = "the request is not well-formed XML";
    return result;
  }
  if (!DevSts::RegisterWsuIds(doc.get())) {
    result.error = "a wsu:Id value is used twice";
    return result;
  }
  const xmlNode* header = DevSts::FindChild(xmlDocGetRootElement(doc.get()), "Header", Wire::kSoapEnvelope.uri);
  const xmlNode* security = DevSts::FindChild(header, "Security", Wire::kWsse.uri);
  xmlNode* signature = DevSts::FindChild(security, "Signature", SsoClient::Saml::DSIG_NS);
  if (signature == nullptr) {
    result.error = "no ds:Signature in soapenv:Header/wsse:Security";
    return result;
  }
  return DevSts::VerifySignatureElement(signature, certificate.GetDer());
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
