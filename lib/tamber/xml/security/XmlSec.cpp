#include "tamber/xml/security/XmlSec.h"

#include <mutex>

#include <openssl/err.h>
#include <xmlsec/crypto.h>
#include <xmlsec/errors.h>
#include <xmlsec/xmlsec.h>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

void IgnoreXmlSecError(const char*, int, const char*, const char*, const char*, int, const char*) {}

}  // namespace

void EnsureXmlSecInitialized() {
  static std::once_flag once;
  std::call_once(once, [] {
    EnsureLibXmlInitialized();
    xmlSecErrorsDefaultCallbackEnableOutput(0);
    if (xmlSecInit() < 0 || xmlSecCheckVersion() != 1 || xmlSecCryptoAppInit(nullptr) < 0 || xmlSecCryptoInit() < 0) {
      throw XmlSecurityException("xmlsec cannot be initialised");
    }
    // The OpenSSL back end installs its own callback while initialising: ours comes last.
    xmlSecErrorsSetCallback(&IgnoreXmlSecError);
    ERR_clear_error();
  });
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
