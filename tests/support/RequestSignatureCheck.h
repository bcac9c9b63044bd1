#ifndef TESTS_SUPPORT_REQUESTSIGNATURECHECK_H
#define TESTS_SUPPORT_REQUESTSIGNATURECHECK_H

// Verifies signed SOAP requests as the STS sees them: from their text, parsed afresh, by
// libxmlsec directly and by the xmlsec1 command-line tool in a process of its own. Neither goes
// through the library's own signature code, so a fault there cannot hide itself.

#include <string>
#include <vector>

namespace TestSupport {

struct RequestSignatureResult {
  // Cryptographically valid: every reference digest and the signature value match.
  bool valid = false;
  // The URIs of the ds:Reference elements, in order, with whether each digest matched.
  std::vector<std::string> referenceUris;
  std::vector<bool> referenceValid;
  // Set when verification could not be carried out at all (parse error, no signature, ...).
  std::string error;
};

// Verifies the ds:Signature that is a direct child of soapenv:Header/wsse:Security with the
// public key of the PEM certificate `certificatePem` (the key information of the request is not
// consulted: the caller says whose key must have signed). wsu:Id attributes are registered as
// IDs; only same-document references are followed.
RequestSignatureResult VerifyRequestSignature(const std::string& requestXml, const std::string& certificatePem);

struct ToolResult {
  int exitCode = -1;
  std::string output;
};

// Runs `xmlsec1 --verify` on `requestXml` with the public key of the PEM certificate file
// `certificatePemPath`, registering wsu:Id of soapenv:Body and wsu:Timestamp and starting at the
// signature whose Id is "holderOfKeyProofSignature".
ToolResult VerifyRequestWithXmlSecTool(const std::string& requestXml, const std::string& certificatePemPath);

}  // namespace TestSupport

#endif
