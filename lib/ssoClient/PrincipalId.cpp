#include "ssoClient/PrincipalId.h"

#include "ssoClient/Exceptions.h"
#include "tamber/StringUtil.h"

namespace SsoClient {

using Tamber::StringUtil::ToUpper;

bool PrincipalId::operator==(const PrincipalId& other) const {
  if (this == &other) return true;
  return ToUpper(name) == ToUpper(other.name) && ToUpper(domain) == ToUpper(other.domain);
}

std::string PrincipalId::ToString() const { return "{Name: " + name + "; Domain:" + domain + "}"; }

PrincipalId ParseGroupIdentity(const std::string& value) {
  const std::string::size_type backslash = value.find('\\');
  if (backslash == std::string::npos || backslash == 0 || backslash + 1 == value.size()) {
    throw ParseException("Failed to parse Group Identity value: `" + value + "'; domain or group missing");
  }
  return PrincipalId(value.substr(backslash + 1), value.substr(0, backslash));
}

}  // namespace SsoClient
