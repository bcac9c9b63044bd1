#ifndef TAMBER_HTTP_HTTPEXCEPTION_H
#define TAMBER_HTTP_HTTPEXCEPTION_H

#include "tamber/Exception.h"

namespace Tamber {
namespace Http {

// An HTTP exchange failed on its way: the connection, the TLS handshake (an untrusted or
// mismatching server certificate included), sending, receiving, an answer over the size limit,
// a cancelled request. The message names the host and port and says what failed.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, HttpException, Exception);
// No response arrived within the time a caller was willing to wait.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, HttpTimeoutException, HttpException);

}  // namespace Http
}  // namespace Tamber

#endif
