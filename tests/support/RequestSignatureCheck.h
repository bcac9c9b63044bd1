#ifndef TESTS_SUPPORT_REQUESTSIGNATURECHECK_H
#define TESTS_SUPPORT_REQUESTSIGNATURECHECK_H

// Verifies signed SOAP requests as the STS sees them: from their text, parsed afresh, by
// libxmlsec directly and by the xmlsec1 command-line tool in a process of its own. Neither goes
// through the library's own signature code, so a fault there cannot hide itself.

#include <string>
#include <vector>

#include "RequestSignature.h"
#include "tamber/crypto/Certificate.h"

namespace TestSupport {

// Whether the signature verified, its reference URIs in order with their digest outcome, and an
// error when verification could not be carried out at all (parse error, no signature, ...).
using RequestSignatureResult = DevSts::SignatureCheck;

// Verifies the ds:Signature that is a direct child of soapenv:Header/wsse:Security with the
// public key of `certificate` (the key information of the request is not consulted: the caller
// says whose key must have signed). wsu:Id attributes are registered as IDs; only same-document
// references are followed.
RequestSignatureResult VerifyRequestSignature(const std::string& requestXml,
                                              const Tamber::Crypto::Certificate& certificate);

// `requestXml` with one byte changed: the first character of the first text inside the first
// element whose start tag begins "<" + `qualifiedName`, flipped in its lowest bit ('2' becomes
// '3', 'u' becomes 't'). Raises std::invalid_argument when there is no such text.
std::string AlterFirstTextByteOf(const std::string& requestXml, const std::string& qualifiedName);

struct ToolResult {
  int exitCode = -1;
  std::string output;
};

// Runs `xmlsec1 --verify` on `requestXml` with the public key of `certificate`, registering the
// wsu:Id of soapenv:Body and wsu:Timestamp and starting at the signature whose Id is
// "holderOfKeyProofSignature". Exit code 0 means verified.
ToolResult VerifyRequestWithXmlSecTool(const std::string& requestXml, const Tamber::Crypto::Certificate& certificate);

}  // namespace TestSupport

#endif
