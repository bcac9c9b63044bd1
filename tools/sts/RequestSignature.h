#ifndef TOOLS_STS_REQUESTSIGNATURE_H
#define TOOLS_STS_REQUESTSIGNATURE_H

// Verification of the XML signature of a SOAP request with libxmlsec, on a libxml2 document: the
// STS's own check, and the independent check of the library's signing in the tests.

#include <string>
#include <vector>

#include <libxml/tree.h>

namespace DevSts {

struct SignatureCheck {
  // Cryptographically valid: every reference digest and the signature value match.
  bool valid = false;
  // The URIs of the ds:Reference elements, in order, with whether each digest matched.
  std::vector<std::string> referenceUris;
  std::vector<bool> referenceValid;
  // Set when verification could not be carried out at all.
  std::string error;
};

// Makes every wsu:Id attribute of `document` an XML ID, so that "#id" references resolve to it
// (libxml2 knows no schema that says so). False when a value is used twice: a reference would
// then be ambiguous.
bool RegisterWsuIds(xmlDoc* document);

// Verifies the ds:Signature element `signature` with the public key of the DER certificate
// `certificateDer` (its ds:KeyInfo is not consulted: the caller says whose key must have
// signed). Only same-document references are followed.
SignatureCheck VerifySignatureElement(xmlNode* signature, const std::vector<unsigned char>& certificateDer);

}  // namespace DevSts

#endif
