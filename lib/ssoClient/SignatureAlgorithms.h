#ifndef SSOCLIENT_SIGNATUREALGORITHMS_H
#define SSOCLIENT_SIGNATUREALGORITHMS_H

// Identifiers of the canonicalisation, signature, digest and transform algorithms that go on
// the wire. Each text lives here only.

namespace SsoClient {
namespace Algorithms {

// Canonical XML 1.0 as the canonicaliser is asked for it: the recommendation's URI and "#".
inline constexpr char C14N_CANONICALIZER_ID[] = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#";
inline constexpr char EXCLUSIVE_C14N[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
inline constexpr char RSA_SHA256[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
inline constexpr char ECDSA_SHA256[] = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
inline constexpr char SHA256[] = "http://www.w3.org/2001/04/xmlenc#sha256";
inline constexpr char ENVELOPED_SIGNATURE[] = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";

}  // namespace Algorithms
}  // namespace SsoClient

#endif
