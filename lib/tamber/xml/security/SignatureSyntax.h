#ifndef TAMBER_XML_SECURITY_SIGNATURESYNTAX_H
#define TAMBER_XML_SECURITY_SIGNATURESYNTAX_H

// The strict reading of a ds:Signature before any cryptography: what it uses must be on the
// accepted lists, or SignatureSyntaxException names what was found.

#include <cstddef>
#include <string>
#include <vector>

#include <libxml/tree.h>
#include <xmlsec/transforms.h>

#include "tamber/crypto/Certificate.h"
#include "tamber/xml/security/Algorithms.h"

namespace Tamber {
namespace Xml {
namespace Security {

constexpr size_t kMaxReferences = 4;
constexpr size_t kMaxTransforms = 4;

struct ReferenceDescription {
  std::string uri;                           // "" or "#id"
  // In order; a canonicalisation can only be the last (what follows it would need a node set).
  std::vector<xmlSecTransformId> transforms;
  std::string inclusivePrefixes;  // of an exclusive canonicalisation transform
  xmlSecTransformId digestMethod;
  std::vector<unsigned char> digestValue;
};

struct SignatureDescription {
  xmlNodePtr signedInfo;
  xmlSecTransformId canonicalizationMethod;
  std::string inclusivePrefixes;  // of an exclusive canonicalisation method
  SignatureMethod signatureMethod;
  std::vector<ReferenceDescription> references;
  std::vector<unsigned char> signatureValue;
  // The certificates of ds:KeyInfo/ds:X509Data, in document order; empty without any.
  std::vector<Ref<const Crypto::Certificate>> keyInfoCertificates;
};

// Reads `signature`, which must be a ds:Signature; raises SignatureSyntaxException.
SignatureDescription ReadSignature(xmlNodePtr signature);

// True for "" and "#" followed by an XML name (no XPointer).
bool IsSameDocumentUri(const std::string& uri);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
