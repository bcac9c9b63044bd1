#ifndef SSOCLIENT_TOKENSPEC_H
#define SSOCLIENT_TOKENSPEC_H

#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include "ssoClient/Export.h"
#include "ssoClient/SamlToken.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace SsoClient {

// The caller's key material for holder-of-key tokens and signed requests. Either reference may
// be null; a copy shares both objects.
struct SSOCLIENT_API HolderOfKeyConfig {
  // Signs requests; never logged.
  Tamber::Ref<const Tamber::Crypto::PrivateKey> privateKey;
  // The certificate matching `privateKey`, sent or referenced in signed requests.
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
};

// The token that is asked for. Callers are expected to fill every field; the defaults ask for a
// ten-minute, non-delegable, non-renewable token without audience restriction or advice, with
// the confirmation the service's key material allows. Copies are deep.
struct SSOCLIENT_API TokenSpec {
  // A fixed underlying type, so that any int cast to it is a valid value (see BEARER).
  enum Confirmation : int {
    // Holder-of-key when the service has key material, bearer otherwise.
    CONFIRMATION_DEFAULT = 0,
    // Bearer; every value other than CONFIRMATION_DEFAULT has this effect.
    CONFIRMATION_BEARER = 1,
  };

  // Requested lifetime in seconds; a value that is not positive is refused when the request is
  // built.
  int64_t tokenLifetimeSec = 600;
  // Audience URIs the token is to be restricted to.
  std::set<std::string> audienceRestriction;
  // Advice to be carried into the token.
  std::vector<Advice> advice;
  // The token may be delegated further.
  bool delegable = false;
  // The principal the token is to be delegated to, if any.
  boost::optional<std::string> delegateTo;
  // The token may be renewed.
  bool renewable = false;
  // Bearer, or the default that follows the service's key material.
  Confirmation confirmation = CONFIRMATION_DEFAULT;
};

}  // namespace SsoClient

#endif
