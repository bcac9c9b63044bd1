#include "tamber/http/Url.h"

#include <cctype>

#include "tamber/Exception.h"
#include "tamber/StringUtil.h"
#include "tamber/http/UrlSyntax.h"

namespace Tamber {
namespace Http {

namespace {

[[noreturn]] void Refuse(const std::string& reason) { throw InvalidArgumentException("Invalid URL: " + reason); }

// The port text after the colon of the authority: 1 to 5 digits worth 1..65535.
int ParsePort(const std::string& text) {
  if (text.empty() || text.size() > 5 || text.find_first_not_of("0123456789") != std::string::npos ||
      !IsValidPort(std::stoi(text))) {
    Refuse("bad port \"" + text + "\" (expected a number from 1 to 65535)");
  }
  return std::stoi(text);
}

}  // namespace

void ParseHttpURL(const std::string& url, bool& isSecure, std::string& host, int& port, std::string& path) {
  const std::string::size_type schemeEnd = url.find("://");
  if (schemeEnd == std::string::npos) Refuse("expected an absolute URL starting with http:// or https://");
  const std::string scheme = StringUtil::ToLower(url.substr(0, schemeEnd));
  if (scheme != "http" && scheme != "https") {
    Refuse("unsupported scheme \"" + url.substr(0, schemeEnd) + "\" (expected http or https)");
  }
  const bool secure = scheme == "https";

  const std::string::size_type authorityStart = schemeEnd + 3;
  const std::string::size_type authorityEnd = url.find_first_of("/?#", authorityStart);
  const std::string authority = url.substr(authorityStart, authorityEnd - authorityStart);
  const std::string target = authorityEnd == std::string::npos ? "" : url.substr(authorityEnd);

  if (authority.find('@') != std::string::npos) Refuse("user information before the host is not allowed");
  if (authority.empty()) Refuse("the host is missing");

  std::string parsedHost;
  std::string::size_type hostEnd;
  if (authority[0] == '[') {
    hostEnd = authority.find(']');
    if (hostEnd == std::string::npos) Refuse("unterminated IPv6 address \"" + authority + "\"");
    parsedHost = authority.substr(1, hostEnd - 1);
    if (!IsIpv6Address(parsedHost)) Refuse("bad IPv6 address \"" + parsedHost + "\"");
    ++hostEnd;
  } else {
    hostEnd = authority.find(':');
    parsedHost = authority.substr(0, hostEnd);
    if (parsedHost.empty()) Refuse("the host is missing");
    if (!IsValidHost(parsedHost)) Refuse("bad host name \"" + parsedHost + "\"");
  }

  int parsedPort = secure ? 443 : 80;
  if (hostEnd < authority.size()) {
    if (authority[hostEnd] != ':') Refuse("unexpected text \"" + authority.substr(hostEnd) + "\" after the host");
    parsedPort = ParsePort(authority.substr(hostEnd + 1));
  }

  if (target.find('#') != std::string::npos) Refuse("fragments (\"#...\") are not allowed");
  const std::string::size_type bad = FindInvalidTargetCharacter(target);
  if (bad != std::string::npos) {
    if (target[bad] == '%') Refuse("bad percent-encoding at position " + std::to_string(authorityEnd + bad));
    Refuse("character " + DescribeCharacter(target[bad]) + " is not allowed in the path (position " +
           std::to_string(authorityEnd + bad) + ")");
  }

  isSecure = secure;
  host = parsedHost;
  port = parsedPort;
  path = target.empty() || target[0] == '?' ? "/" + target : target;
}

}  // namespace Http
}  // namespace Tamber
