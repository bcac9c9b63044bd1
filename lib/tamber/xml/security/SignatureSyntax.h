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
  std::vector<xmlSecTransformId> transforms;  // in order
  xmlSecTransformId digestMethod;
};

struct SignatureDescription {
  xmlSecTransformId canonicalizationMethod;
  SignatureMethod signatureMethod;
  std::vector<ReferenceDescription> references;
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
