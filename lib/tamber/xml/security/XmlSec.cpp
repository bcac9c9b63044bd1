#include "tamber/xml/security/XmlSec.h"

#include <mutex>

#include <openssl/err.h>
#include <xmlsec/crypto.h>
#include <xmlsec/errors.h>
#include <xmlsec/openssl/evp.h>
#include <xmlsec/xmlsec.h>

#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

thread_local ScopedXmlSecErrorCapture* currentCapture = nullptr;

void OnXmlSecError(const char* /*file*/, int /*line*/, const char* function, const char* errorObject,
                   const char* errorSubject, int reason, const char* message) {
  if (currentCapture == nullptr) return;
  std::string text;
  for (xmlSecSize i = 0; xmlSecErrorsGetMsg(i) != nullptr; ++i) {
    if (xmlSecErrorsGetCode(i) == reason) {
      text = xmlSecErrorsGetMsg(i);
      break;
    }
  }
  if (text.empty()) text = "error " + std::to_string(reason);
  if (errorSubject != nullptr && *errorSubject != '\0') text = std::string(errorSubject) + ": " + text;
  else if (function != nullptr) text = std::string(function) + ": " + text;
  if (errorObject != nullptr && *errorObject != '\0' && std::string(errorObject) != "unknown") {
    text += " (" + std::string(errorObject) + ")";
  }
  std::string detail = message != nullptr ? message : "";
  detail.erase(0, detail.find_first_not_of(' '));
  detail.erase(detail.find_last_not_of(' ') + 1);
  if (!detail.empty()) text += "; " + detail;
  currentCapture->Record(text);
}

}  // namespace

void EnsureXmlSecInitialized() {
  static std::once_flag once;
  std::call_once(once, [] {
    EnsureLibXmlInitialized();
    xmlSecErrorsDefaultCallbackEnableOutput(0);
    xmlSecErrorsSetCallback(&OnXmlSecError);
    if (xmlSecInit() < 0 || xmlSecCheckVersion() != 1 || xmlSecCryptoAppInit(nullptr) < 0 || xmlSecCryptoInit() < 0) {
      throw XmlSecurityException("xmlsec cannot be initialised");
    }
    // The OpenSSL back end installs its own callback while initialising: ours comes last.
    xmlSecErrorsSetCallback(&OnXmlSecError);
    ERR_clear_error();
  });
}

ScopedXmlSecErrorCapture::ScopedXmlSecErrorCapture() : _outer(currentCapture) { currentCapture = this; }

ScopedXmlSecErrorCapture::~ScopedXmlSecErrorCapture() {
  currentCapture = _outer;
  // Keys and transforms leave OpenSSL errors behind even on success; none may linger.
  ERR_clear_error();
}

void ScopedXmlSecErrorCapture::Record(const std::string& error) {
  if (_firstXmlSecError.empty()) _firstXmlSecError = error;
}

std::string ScopedXmlSecErrorCapture::GetFirstError() const {
  if (!_firstXmlSecError.empty()) return _firstXmlSecError;
  if (_libXmlErrors.HasError()) return _libXmlErrors.GetFirstError();
  return "unknown error";
}

XmlSecKeyPtr CreateXmlSecKey(EVP_PKEY* key) {
  XmlSecKeyPtr xmlSecKey(xmlSecKeyCreate());
  if (!xmlSecKey || EVP_PKEY_up_ref(key) != 1) throw XmlSecurityException("Key cannot be prepared for xmlsec");
  xmlSecKeyDataPtr data = xmlSecOpenSSLEvpKeyAdopt(key);
  if (data == nullptr) {
    EVP_PKEY_free(key);
    throw XmlSecurityException("Key cannot be prepared for xmlsec");
  }
  if (xmlSecKeySetValue(xmlSecKey.get(), data) < 0) {
    xmlSecKeyDataDestroy(data);
    throw XmlSecurityException("Key cannot be prepared for xmlsec");
  }
  return xmlSecKey;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
