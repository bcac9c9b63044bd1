#ifndef SSOCLIENT_GSSNEGOTIATIONCONTEXT_H
#define SSOCLIENT_GSSNEGOTIATIONCONTEXT_H

#include <boost/shared_ptr.hpp>

#include "ssoClient/Export.h"
#include "ssoClient/NegotiationHandler.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/SecurityTokenService.h"
#include "ssoClient/TokenSpec.h"

namespace SsoClient {
namespace InternalApi {

// The outcome of one negotiation step.
struct SSOCLIENT_API NegotiationResult {
  // The STS's leg of this step, for the caller's GSS mechanism; never null, possibly empty.
  boost::shared_ptr<Leg> leg;
  // The validated token once the STS has issued it; null before.
  boost::shared_ptr<const SamlToken> token;
};

// A GSS/SPNEGO negotiation with the STS driven one leg at a time by the caller: call
// NegotiateToken with the mechanism's first leg, give each result.leg back to the mechanism, and
// stop when result.token is set. All steps share one HTTP session. One negotiation, one thread
// at a time.
class SSOCLIENT_API GssNegotiationContext {
 public:
  // Sends `leg` (the first leg, or a further leg of the context the STS named) and returns the
  // STS's answer. A rejected token raises its ParseException or InvalidSignatureException.
  virtual NegotiationResult NegotiateToken(const Leg& leg) = 0;

 protected:
  // Destroyed through the shared pointer made from the concrete type.
  ~GssNegotiationContext() = default;
};

// A negotiation context for `config` and the token `spec` asks for. An empty
// config.trustedCertificates raises Tamber::InvalidArgumentException.
SSOCLIENT_API boost::shared_ptr<GssNegotiationContext> CreateGssNegotiationContext(
    const SecurityTokenServiceConfig& config, const TokenSpec& spec);

}  // namespace InternalApi
}  // namespace SsoClient

#endif
