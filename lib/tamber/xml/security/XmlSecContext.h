#ifndef TAMBER_XML_SECURITY_XMLSECCONTEXT_H
#define TAMBER_XML_SECURITY_XMLSECCONTEXT_H

#include <openssl/evp.h>

#include "tamber/xml/security/XmlSec.h"

namespace Tamber {
namespace Xml {
namespace Security {

// An xmlsec signature context restricted to what the layer accepts, whatever xmlsec would allow by
// default: same-document references only, the accepted algorithms only, X.509 key data only, and
// `key` as the one key (xmlsec never looks one up from ds:KeyInfo: no keys manager, no system
// trust store).
DSigContextPtr CreateRestrictedContext(EVP_PKEY* key);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
