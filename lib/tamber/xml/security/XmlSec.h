#ifndef TAMBER_XML_SECURITY_XMLSEC_H
#define TAMBER_XML_SECURITY_XMLSEC_H

// Process-wide set-up of xmlsec, which builds signature templates. Internal to the layer.

namespace Tamber {
namespace Xml {
namespace Security {

// Initialises xmlsec with its OpenSSL back end once per process, thread-safely, with an error
// callback that prints nothing (failures reach callers as exceptions). Never undone
// (xmlSecShutdown is not called): other code of the host process may use xmlsec too.
void EnsureXmlSecInitialized();

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
