#ifndef TAMBER_XML_SECURITY_XMLSEC_H
#define TAMBER_XML_SECURITY_XMLSEC_H

// Process-wide set-up of xmlsec and the capture of its errors. Internal to the layer.

#include <memory>
#include <string>

#include <openssl/evp.h>
#include <xmlsec/keys.h>
#include <xmlsec/xmldsig.h>

#include "tamber/xml/LibXml.h"

namespace Tamber {
namespace Xml {
namespace Security {

// Initialises xmlsec with its OpenSSL back end once per process, thread-safely, with an error
// callback that prints nothing. Never undone (xmlSecShutdown is not called): other code of the
// host process may use xmlsec too.
void EnsureXmlSecInitialized();

// Collects the errors xmlsec and libxml2 report on this thread while it lives, so that they can
// become the text of an exception instead of lines on stderr.
class ScopedXmlSecErrorCapture {
 public:
  ScopedXmlSecErrorCapture();
  ~ScopedXmlSecErrorCapture();
  ScopedXmlSecErrorCapture(const ScopedXmlSecErrorCapture&) = delete;
  ScopedXmlSecErrorCapture& operator=(const ScopedXmlSecErrorCapture&) = delete;

  // The first error reported since construction, or "unknown error".
  std::string GetFirstError() const;

  // Called by the xmlsec error callback.
  void Record(const std::string& error);

 private:
  std::string _firstXmlSecError;
  ScopedXmlSecErrorCapture* _outer;
  ScopedXmlErrorCapture _libXmlErrors;
};

struct XmlSecDeleter {
  void operator()(xmlSecDSigCtx* context) const { xmlSecDSigCtxDestroy(context); }
  void operator()(xmlSecKey* key) const { xmlSecKeyDestroy(key); }
};
using DSigContextPtr = std::unique_ptr<xmlSecDSigCtx, XmlSecDeleter>;
using XmlSecKeyPtr = std::unique_ptr<xmlSecKey, XmlSecDeleter>;

// An xmlsec key over `key` (public or private), which it shares (reference counted).
XmlSecKeyPtr CreateXmlSecKey(EVP_PKEY* key);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
