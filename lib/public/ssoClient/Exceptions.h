#ifndef SSOCLIENT_EXCEPTIONS_H
#define SSOCLIENT_EXCEPTIONS_H

#include <string>

#include "ssoClient/Export.h"
#include "tamber/Exception.h"

namespace SsoClient {

// Every failure of the library without a narrower class: an unexpected SOAP fault, an answer of
// unexpected form or not well-formed, an issued assertion that fails to parse.
TAMBER_DECLARE_EXCEPTION(SSOCLIENT_API, SsoException, Tamber::Exception);
// Common base of every rejected token; catch it to catch both classes below.
TAMBER_DECLARE_EXCEPTION(SSOCLIENT_API, InvalidTokenException, SsoException);
// A token whose signature does not verify, or whose verification raised an XML-security error.
TAMBER_DECLARE_EXCEPTION(SSOCLIENT_API, InvalidSignatureException, InvalidTokenException);
// XML that does not have the expected shape, and every other rejection of a token (version, id,
// validity window, confirmation, delegation rules, signature coverage, subject and attributes).
TAMBER_DECLARE_EXCEPTION(SSOCLIENT_API, ParseException, InvalidTokenException);
// The request failed on its way: connection or transport failure, an HTTP error status, an
// SPNEGO answer without context id.
TAMBER_DECLARE_EXCEPTION(SSOCLIENT_API, CommunicationException, SsoException);
// The STS refused the request with an authentication fault.
TAMBER_DECLARE_EXCEPTION(SSOCLIENT_API, InvalidCredentialsException, SsoException);

}  // namespace SsoClient

#endif
