#include "Negotiations.h"

#include <openssl/rand.h>

#include <stdexcept>

#include "SoapRequest.h"
#include "tamber/StringUtil.h"

namespace DevSts {

const char SESSION_COOKIE_NAME[] = "DevStsSession";

namespace {

std::string NewCookieValue() {
  unsigned char bytes[24];
  if (RAND_bytes(bytes, sizeof bytes) != 1) throw std::runtime_error("no random bytes for a cookie");
  static const char HEX[] = "0123456789abcdef";
  std::string value;
  for (const unsigned char byte : bytes) {
    value += HEX[byte >> 4];
    value += HEX[byte & 0x0f];
  }
  return value;
}

// The value of the cookie `name` in a "Cookie" header ("a=1; b=2"); empty when absent.
std::string CookieValue(const std::string& header, const std::string& name) {
  size_t start = 0;
  while (start < header.size()) {
    size_t end = header.find(';', start);
    if (end == std::string::npos) end = header.size();
    std::string pair = header.substr(start, end - start);
    pair.erase(0, pair.find_first_not_of(' '));
    if (pair.compare(0, name.size() + 1, name + "=") == 0) return pair.substr(name.size() + 1);
    start = end + 1;
  }
  return "";
}

}  // namespace

std::string Negotiations::Start(Negotiation& negotiation, int64_t nowMicros) {
  negotiation.cookie = NewCookieValue();
  negotiation.startedMicros = nowMicros;
  const std::string contextId = "urn:uuid:" + Tamber::StringUtil::GenerateUuid();
  std::lock_guard<std::mutex> lock(_mutex);
  for (auto it = _negotiations.begin(); it != _negotiations.end();) {
    it = nowMicros - it->second.startedMicros > _timeoutMicros ? _negotiations.erase(it) : std::next(it);
  }
  _negotiations[contextId] = negotiation;
  return contextId;
}

Negotiation Negotiations::Take(const std::string& contextId, const std::string& cookieHeader) {
  std::lock_guard<std::mutex> lock(_mutex);
  const auto found = _negotiations.find(contextId);
  if (found == _negotiations.end()) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected the context of a negotiation under way, found the unknown \"" +
                                              contextId + "\"");
  }
  const std::string cookie = CookieValue(cookieHeader, SESSION_COOKIE_NAME);
  if (cookie != found->second.cookie) {
    throw StsFault(FAULT_INVALID_REQUEST, std::string("Expected the session cookie ") + SESSION_COOKIE_NAME +
                                              " of the negotiation's first leg, found " +
                                              (cookie.empty() ? "none" : "another session's"));
  }
  Negotiation negotiation = found->second;
  _negotiations.erase(found);
  return negotiation;
}

}  // namespace DevSts
