#ifndef TOOLS_STS_NEGOTIATIONS_H
#define TOOLS_STS_NEGOTIATIONS_H

// The SPNEGO negotiations under way: each is known by its context id and tied to the session
// cookie set on its first leg, so that a leg cannot continue someone else's negotiation.

#include <cstdint>
#include <map>
#include <mutex>
#include <string>

#include "TrustRequest.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"

namespace DevSts {

extern const char SESSION_COOKIE_NAME[];  // "DevStsSession"

struct Negotiation {
  std::string user;
  SsoClient::Leg challenge;
  TrustRequest request;  // what the first leg asked for
  Tamber::Ref<const Tamber::Crypto::Certificate> signer;  // of the first leg, when it was signed
  std::string cookie;
  int64_t startedMicros = 0;
};

class Negotiations {
 public:
  explicit Negotiations(int64_t timeoutSec) : _timeoutMicros(timeoutSec * 1000000) {}

  // Keeps `negotiation` under a new context id, with a new cookie; returns the id. Forgets
  // negotiations older than the timeout.
  std::string Start(Negotiation& negotiation, int64_t nowMicros);
  // Removes and returns the negotiation of `contextId`; refused with wst:InvalidRequest when
  // there is none, or when the "Cookie" header `cookieHeader` lacks its session cookie.
  Negotiation Take(const std::string& contextId, const std::string& cookieHeader);

 private:
  int64_t _timeoutMicros;
  std::mutex _mutex;
  std::map<std::string, Negotiation> _negotiations;
};

}  // namespace DevSts

#endif
