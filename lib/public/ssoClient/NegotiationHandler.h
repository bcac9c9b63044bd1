#ifndef SSOCLIENT_NEGOTIATIONHANDLER_H
#define SSOCLIENT_NEGOTIATIONHANDLER_H

#include <vector>

#include <boost/shared_ptr.hpp>

#include "ssoClient/Export.h"

namespace SsoClient {

// One GSS token of an SPNEGO negotiation, as opaque bytes.
typedef std::vector<unsigned char> Leg;

// The caller's side of a GSS/SPNEGO negotiation with the STS, implemented by the caller over its
// GSS mechanism. The library calls it only from the thread that runs the negotiation, for one
// negotiation at a time.
class SSOCLIENT_API NegotiationHandler {
 public:
  // Turns the STS's leg into the caller's next leg. `stsLeg` is empty on the first call. Once the
  // STS has issued the token, a last non-empty STS leg is handed over once more so that the
  // mechanism can complete; the leg returned then is not sent and should be empty. Must not
  // return null; while the negotiation goes on the returned leg must not be empty either.
  virtual boost::shared_ptr<Leg> NegotiateLeg(const Leg& stsLeg) = 0;

  virtual ~NegotiationHandler() = default;
};

}  // namespace SsoClient

#endif
