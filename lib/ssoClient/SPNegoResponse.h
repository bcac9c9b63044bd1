#ifndef SSOCLIENT_SPNEGORESPONSE_H
#define SSOCLIENT_SPNEGORESPONSE_H

#include <string>
#include <vector>

namespace SsoClient {

// One answer of the STS in an SPNEGO negotiation.
struct SPNegoResponse {
  // The negotiation context chosen by the STS (possibly empty, never absent).
  std::string contextId;
  // The STS's next GSS leg, decoded; empty when the answer carried none.
  std::vector<unsigned char> leg;
  // The assertion text; not empty exactly when the negotiation is complete.
  std::string token;
};

}  // namespace SsoClient

#endif
