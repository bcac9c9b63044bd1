#ifndef TESTS_SUPPORT_TESTTOKENS_H
#define TESTS_SUPPORT_TESTTOKENS_H

// The test keys of tests/data/keys and tokens issued with them, for the suites.

#include <string>

#include <boost/optional.hpp>

#include "TokenIssuer.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"

namespace TestSupport {

// A key of tests/data/keys with its certificate, e.g. "sts", "sts-ec", "client", "untrusted",
// "expired-sts". Loaded once per name.
struct TestKeyPair {
  Tamber::Ref<const Tamber::Crypto::PrivateKey> key;
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
};
const TestKeyPair& LoadTestKeyPair(const std::string& name);
// A certificate of tests/data/keys by name ("ca", "sts", ...).
Tamber::Ref<const Tamber::Crypto::Certificate> LoadTestCertificate(const std::string& name);

// The holder-of-key identity of the "client" test key, as a service is configured with it.
boost::optional<SsoClient::HolderOfKeyConfig> ClientKeyMaterial();

// The whole of a file below tests/data, e.g. "tokens/valid-bearer.xml".
std::string ReadTestData(const std::string& relativePath);

// What the suites trust: the test CA, to which every test signer but "untrusted" chains.
SsoClient::CertificateList TrustedCertificates();

// A token of `record` signed by the test STS ("sts"), or by another test key.
std::string IssueTestToken(const TokenIssuer::TokenRecord& record, const std::string& signer = "sts");
// A holder-of-key record confirmed by the "client" certificate.
TokenIssuer::TokenRecord HolderOfKeyRecord();

// The instant inside the validity of every vector of tests/data/tokens.
extern const char TOKEN_VECTORS_CLOCK[];

}  // namespace TestSupport

#endif
