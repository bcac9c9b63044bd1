// Fuzzes the relying party's entry point: assertion text against a trusted certificate list.
// Every input must end in a token or in one of the documented exceptions; anything else (a crash,
// a leak, a sanitizer report, another exception escaping) is a finding.

#include <cstddef>
#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlToken.h"
#include "tamber/system/DateTime.h"
#include "tamber/xml/Dom.h"

namespace {

// The seed tokens are valid at this instant, so that inputs near them get past the clock checks.
const char SEED_CLOCK[] = "2027-06-01T10:30:00Z";

const SsoClient::CertificateList& Trusted() {
  static const SsoClient::CertificateList trusted = [] {
    std::ifstream in(std::string(SSOCLIENT_TEST_DATA_DIR) + "/keys/ca.pem");
    std::ostringstream pem;
    pem << in.rdbuf();
    Tamber::Ref<const Tamber::Crypto::Certificate> ca;
    Tamber::Crypto::CreateCertificateFromPem(pem.str(), ca);
    Tamber::System::Testing::SetTestClock(Tamber::System::DateTime(SEED_CLOCK).GetUtcTime());
    return SsoClient::CertificateList{ca};
  }();
  return trusted;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string xml(reinterpret_cast<const char*>(data), size);
  try {
    SsoClient::CreateSamlToken(xml, Trusted());
  } catch (const SsoClient::InvalidTokenException&) {
  } catch (const Tamber::Xml::XMLParseException&) {
  }
  return 0;
}
