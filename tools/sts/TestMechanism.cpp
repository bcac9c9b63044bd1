#include "TestMechanism.h"

#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <openssl/rand.h>

#include <stdexcept>

#include "DevSts.h"
#include "SoapRequest.h"

namespace DevSts {

namespace {

const std::string FIRST_LEG_PREFIX = "dev-sts-test-mechanism user=";
const size_t CHALLENGE_SIZE = 32;

class TestMechanismHandler : public SsoClient::NegotiationHandler {
 public:
  TestMechanismHandler(const std::string& user, const std::string& password) : _user(user), _password(password) {}

  boost::shared_ptr<SsoClient::Leg> NegotiateLeg(const SsoClient::Leg& stsLeg) override {
    switch (_legsSent++) {
      case 0: return boost::shared_ptr<SsoClient::Leg>(new SsoClient::Leg(MechanismFirstLeg(_user)));
      case 1: return boost::shared_ptr<SsoClient::Leg>(new SsoClient::Leg(MechanismProof(_password, stsLeg)));
      // The mechanism is complete: nothing more to say.
      default: return boost::shared_ptr<SsoClient::Leg>(new SsoClient::Leg());
    }
  }

 private:
  std::string _user;
  std::string _password;
  int _legsSent = 0;
};

}  // namespace

SsoClient::Leg MechanismFirstLeg(const std::string& user) {
  const std::string text = FIRST_LEG_PREFIX + user;
  return SsoClient::Leg(text.begin(), text.end());
}

std::string MechanismUserOf(const SsoClient::Leg& firstLeg) {
  const std::string text(firstLeg.begin(), firstLeg.end());
  if (text.compare(0, FIRST_LEG_PREFIX.size(), FIRST_LEG_PREFIX) != 0 || text.size() == FIRST_LEG_PREFIX.size()) {
    throw StsFault(FAULT_INVALID_REQUEST, "Expected a first leg of the test mechanism naming a user");
  }
  return text.substr(FIRST_LEG_PREFIX.size());
}

SsoClient::Leg MechanismChallenge() {
  SsoClient::Leg challenge(CHALLENGE_SIZE);
  if (RAND_bytes(challenge.data(), static_cast<int>(challenge.size())) != 1) {
    throw std::runtime_error("no random bytes for a challenge");
  }
  return challenge;
}

SsoClient::Leg MechanismProof(const std::string& password, const SsoClient::Leg& challenge) {
  SsoClient::Leg proof(EVP_MAX_MD_SIZE);
  unsigned int length = 0;
  if (HMAC(EVP_sha256(), password.data(), static_cast<int>(password.size()), challenge.data(), challenge.size(),
           proof.data(), &length) == nullptr) {
    throw std::runtime_error("HMAC-SHA256 failed");
  }
  proof.resize(length);
  return proof;
}

bool MechanismProofMatches(const SsoClient::Leg& expected, const SsoClient::Leg& found) {
  return expected.size() == found.size() && CRYPTO_memcmp(expected.data(), found.data(), expected.size()) == 0;
}

boost::shared_ptr<SsoClient::NegotiationHandler> CreateTestMechanismHandler(const std::string& user,
                                                                            const std::string& password) {
  return boost::shared_ptr<SsoClient::NegotiationHandler>(new TestMechanismHandler(user, password));
}

}  // namespace DevSts
