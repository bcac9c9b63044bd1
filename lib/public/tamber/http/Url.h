#ifndef TAMBER_HTTP_URL_H
#define TAMBER_HTTP_URL_H

#include <string>

#include "tamber/Export.h"

namespace Tamber {
namespace Http {

// Splits an absolute http or https URL, strictly:
//   scheme  "http" or "https" in any case, followed by "://";
//   host    a DNS name or IPv4 address (letters, digits, '.', '-') or an IPv6 literal in
//           brackets ("[::1]"; given back without the brackets, no zone id);
//   port    optional, 1 to 65535 in decimal; 80 for http and 443 for https when absent;
//   path    what follows the authority, query included ("/sts?tenant=a"); "/" when empty.
// User information ("user:password@"), fragments ("#..."), spaces, control characters and
// characters outside RFC 3986 raise InvalidArgumentException saying what was expected and what
// was found. The out-parameters are written only on success. The message never repeats user
// information, since it may hold a password.
TAMBER_API void ParseHttpURL(const std::string& url, bool& isSecure, std::string& host, int& port,
                             std::string& path);

}  // namespace Http
}  // namespace Tamber

#endif
