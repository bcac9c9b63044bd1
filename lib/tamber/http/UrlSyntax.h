#ifndef TAMBER_HTTP_URLSYNTAX_H
#define TAMBER_HTTP_URLSYNTAX_H

// The pieces of URL syntax that the HTTP client checks in more than one place.

#include <string>

namespace Tamber {
namespace Http {

// A DNS name or IPv4 address (letters, digits, '.', '-', '_', no empty label but an optional
// final dot), or an IPv6 address without brackets.
bool IsValidHost(const std::string& host);
bool IsIpv6Address(const std::string& host);
// A port in 1..65535.
bool IsValidPort(int port);

// The position of the first character of `target` (a path with an optional query) that a URL
// may not hold there, or npos when every character is allowed.
std::string::size_type FindInvalidTargetCharacter(const std::string& target);

// "host" or "[ipv6]", as a URL or a message writes it.
std::string HostForUrl(const std::string& host);
// "host:port" with brackets around an IPv6 host, for URLs and messages.
std::string Endpoint(const std::string& host, int port);
// A character for a message: quoted when printable, else its hex code ("0x0a").
std::string DescribeCharacter(char c);

}  // namespace Http
}  // namespace Tamber

#endif
