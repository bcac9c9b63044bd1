#ifndef SSOCLIENT_PRINCIPALID_H
#define SSOCLIENT_PRINCIPALID_H

#include <cassert>
#include <string>

#include "ssoClient/Export.h"

namespace SsoClient {

// The identity of a user, solution or group: a name within a domain. Both parts are non-empty.
struct SSOCLIENT_API PrincipalId {
  std::string name;    // "alice" of alice@example.com
  std::string domain;  // "example.com"

  // Both parts must be non-empty (asserted in debug builds).
  PrincipalId(const std::string& name, const std::string& domain) : name(name), domain(domain) {
    assert(!name.empty());
    assert(!domain.empty());
  }

  // Equal when names and domains are equal ignoring ASCII case.
  bool operator==(const PrincipalId& other) const;
  bool operator!=(const PrincipalId& other) const { return !(*this == other); }
  // "{Name: <name>; Domain:<domain>}".
  std::string ToString() const;
};

// A group identity written "DOMAIN\group" as a PrincipalId (name: the text after the first
// backslash, domain: the text before it). Raises ParseException when the domain or the name is
// missing.
SSOCLIENT_API PrincipalId ParseGroupIdentity(const std::string& value);

}  // namespace SsoClient

#endif
