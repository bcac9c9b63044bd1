#include "tamber/http/UrlSyntax.h"

#include <arpa/inet.h>

#include <cstdio>
#include <cstring>

namespace Tamber {
namespace Http {

namespace {

bool IsAsciiAlnum(char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9'); }

bool IsHexDigit(char c) { return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F'); }

// RFC 3986: unreserved, sub-delims, ':' and '@' (pchar without pct-encoding), '/' and '?'.
bool IsTargetCharacter(char c) {
  return IsAsciiAlnum(c) || (c != '\0' && std::strchr("-._~!$&'()*+,;=:@/?", c) != nullptr);
}

bool IsDnsNameOrIpv4(const std::string& host) {
  if (host.empty() || host.size() > 253) return false;
  // Digits and dots alone must form a dotted quad: resolvers read "1.2.3" or "010.1.1.1" in
  // surprising ways.
  if (host.find_first_not_of("0123456789.") == std::string::npos) {
    in_addr address;
    return inet_pton(AF_INET, host.c_str(), &address) == 1;
  }
  size_t labelLength = 0;
  for (size_t i = 0; i < host.size(); ++i) {
    const char c = host[i];
    if (c == '.') {
      // An empty label is refused, but a single final dot ("example.com.") is a valid name.
      if (labelLength == 0) return false;
      labelLength = 0;
    } else if (IsAsciiAlnum(c) || c == '-' || c == '_') {
      ++labelLength;
    } else {
      return false;
    }
  }
  return true;
}

}  // namespace

bool IsIpv6Address(const std::string& host) {
  in6_addr address;
  return inet_pton(AF_INET6, host.c_str(), &address) == 1;
}

bool IsValidHost(const std::string& host) { return IsDnsNameOrIpv4(host) || IsIpv6Address(host); }

bool IsValidPort(int port) { return port >= 1 && port <= 65535; }

std::string::size_type FindInvalidTargetCharacter(const std::string& target) {
  for (std::string::size_type i = 0; i < target.size(); ++i) {
    if (target[i] == '%') {
      if (i + 2 >= target.size() || !IsHexDigit(target[i + 1]) || !IsHexDigit(target[i + 2])) return i;
      i += 2;
    } else if (!IsTargetCharacter(target[i])) {
      return i;
    }
  }
  return std::string::npos;
}

std::string HostForUrl(const std::string& host) {
  return host.find(':') != std::string::npos ? "[" + host + "]" : host;
}

std::string Endpoint(const std::string& host, int port) { return HostForUrl(host) + ":" + std::to_string(port); }

std::string DescribeCharacter(char c) {
  const unsigned char byte = static_cast<unsigned char>(c);
  if (byte > 0x20 && byte < 0x7f) return std::string("'") + c + "'";
  char hex[8];
  std::snprintf(hex, sizeof hex, "0x%02x", byte);
  return hex;
}

}  // namespace Http
}  // namespace Tamber
