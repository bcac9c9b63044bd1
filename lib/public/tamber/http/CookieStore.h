#ifndef TAMBER_HTTP_COOKIESTORE_H
#define TAMBER_HTTP_COOKIESTORE_H

#include <string>

#include "tamber/Ref.h"

namespace Tamber {
namespace Http {

// The cookies and the open connections of one user agent. A store serves exactly one user
// agent, so that separate agents share neither cookies nor connections; it lives as long as
// that agent keeps it.
class TAMBER_API CookieStore : public Object {
 public:
  // The name given at creation, for diagnostics only; it may be empty.
  virtual const std::string& GetName() const = 0;
};

// A new, empty store.
TAMBER_API void CreateCookieStore(const std::string& name, Ref<CookieStore>& store);

}  // namespace Http
}  // namespace Tamber

#endif
